// The iSCSI tree: the sessions that iscsiadm lists, with their attached disks.
#pragma once

// Writes the tree's banner, reads the listing and reports its paths. Throws WriteFailedEx, NoMemoryEx and
// what the register throws.
void BuildIscsiTree_Linux();
