// The banners that part the log into its sections.
#pragma once

// Writes an empty line, a rule, `title` and a rule, each with its line end. Throws WriteFailedEx.
void reportBanner(const char* title);
