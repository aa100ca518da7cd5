#pragma once

#include <string>

namespace view {

struct CommandLine;

// What the program ends with. Differences and findings are those of diff and verify.
constexpr int kExitSame = 0;
constexpr int kExitDifferent = 1;
constexpr int kExitTrouble = 2;

// Parses the arguments and runs what they ask for. Gives the program's exit status; throws Trouble.
int runCommandLine(int argc, char** argv);

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
