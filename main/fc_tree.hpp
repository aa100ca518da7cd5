// The Fibre Channel tree as the entry runs it.
#pragma once

// Writes the tree's banner, builds and prints the tree, and cleans up after it. Throws THaltEx when there is
// nothing to build (no adapters); any other failure of the system's own ends the tree with a log line, and
// the clean-up is then left out.
void BuildFcTree();
