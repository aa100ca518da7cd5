// The log as a file: where it stands, who may have a hand in it, and whether all of it is there at the end.
#pragma once

#include <cstdio>

constexpr const char* kLogFile = "./MorvaneLogs/Morvane.log";

// Opens the run's log, kLogFile, empty, and keeps every other run out until the process
// ends.
//
// The directory is made where it is missing (mode 0777, less the umask). It may be a link if the user or root
// made it; it is held open and locked before anything in it changes. In the log's place only a regular file
// of the user's with no other name, to which nobody else may write, is used again; anything else there (a
// link, a FIFO, another user's file) is removed and the log made anew, or the run ends. Nobody but its owner
// may write to the log.
//
// Returns the stream, open for reading and writing. On failure it prints the line of standard output that
// says so, and on standard error why, and ends the process with status 1.
std::FILE* openLogFile();

// Brings the log to the disk. Throws WriteFailedEx with a text that says what is missing: the log could not
// take everything, or somebody else has cut it, or put another file in its place.
void completeLogFile(std::FILE* log);
