// The iSCSI tree: the attached disks of every session that open-iscsi lists.
#pragma once

#include "foundation/integers.hpp"
#include "foundation/zeb_string.hpp"

// Writes the tree's banner, reads the initiator's name and the session listing, claims every attached disk
// and reports the paths. Throws WriteFailedEx and what the report throws.
void BuildIscsiTree_Linux();

// Sets the initiator IQN from open-iscsi's configuration, or to the host's name. Returns 0, or 5 when the
// file cannot be opened.
uint32 readInitiatorIQN();

// Takes in one line of the session listing, which it changes. Throws what addIscsiPath throws.
void processCmdOutput(char* line);

// Claims the disk at the device path `devName` and adds it as a path of the current session, unless the
// session lacks a name or address or the disk its LUN. Throws NoMemoryEx, ZebNotFoundEx, WriteFailedEx.
void addIscsiPath(const ZebString& devName);

// The first position at or behind `position` that holds neither a blank nor a tab.
char* skipBlanks(char* position);
// Ends the text at the first blank, tab, carriage return or line feed at or behind `position`, and returns
// `position`.
char* cutToken(char* position);
