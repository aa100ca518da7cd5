#pragma once

#include "view/command_line.hpp"

namespace view {

// What the program does: each function adds one command, with its options, and `runReport` is what it does
// without one. A command refers to the command line as long as it may run.

int runReport(const CommandLine& line);

void addCheck(CommandLine& line);
void addDiff(CommandLine& line);
void addPaths(CommandLine& line);
void addSan(CommandLine& line);
void addVerify(CommandLine& line);
void addCompletion(CommandLine& line);

// Writes, as a check does, that its state is unknown, and gives the exit status. `reason` is fit to be shown.
int endUnknown(const std::string& reason);

} // namespace view
