#include "foundation/command_output.hpp"

#include <fcntl.h>
#include <unistd.h>

#include <cstdlib>
#include <string>

#include <gtest/gtest.h>

#include "foundation/exceptions.hpp"
#include "foundation/log.hpp"
#include "tests/support/log_capture.hpp"
#include "tests/support/refusing_log.hpp"
#include "tests/support/temporary_directory.hpp"
#include "tests/support/thrown.hpp"

namespace {

// Everything that a command prints.
std::string outputOf(const char* command) {
    const LogCapture log;
    CommandOutput output(command);
    EXPECT_TRUE(output.isOpen());
    std::string text;
    for (int c = std::fgetc(output.stream()); c != EOF; c = std::fgetc(output.stream())) {
        text += static_cast<char>(c);
    }
    output.close();
    return text;
}

// A variable of the environment while it lives.
class Variable {
public:
    Variable(const char* name, const char* value) : mName(name) { setenv(name, value, 1); }
    Variable(const Variable&) = delete;
    Variable& operator=(const Variable&) = delete;
    ~Variable() { unsetenv(mName); }

private:
    const char* mName;
};

TEST(CommandOutput, IsWhatTheShellsCommandPrints) {
    EXPECT_EQ(outputOf("for name in one two; do echo \"$name\"; done; exit 3"), "one\ntwo\n");
}

TEST(CommandOutput, IsEmptyForACommandThatDoesNotExist) {
    EXPECT_EQ(outputOf("/nowhere/powermt 2>/dev/null"), "");
}

TEST(CommandOutput, ComesFromACommandWithAnEnvironmentOfItsOwn) {
    const Variable locale("LC_ALL", "C.UTF-8");
    const Variable startFile("ENV", "/nowhere");
    const Variable bashStartFile("BASH_ENV", "/nowhere");
    EXPECT_EQ(outputOf("env | grep -v -E '^(PWD|_|SHLVL|OLDPWD)=' | sort"),
              "LC_ALL=C\nPATH=/usr/sbin:/usr/bin:/sbin:/bin\n");
}

TEST(CommandOutput, ComesFromACommandThatReadsNothing) {
    EXPECT_EQ(outputOf("readlink /proc/self/fd/0; cat"), "/dev/null\n");
}

TEST(CommandOutput, ComesFromACommandWithoutTheRunsDescriptors) {
    const LogCapture log;
    const CommandOutput other("exit");
    const std::string pipe = "/proc/self/fd/" + std::to_string(fileno(other.stream()));
    EXPECT_EQ(outputOf(("test -e " + pipe + " || echo closed").c_str()), "closed\n");
}

TEST(CommandOutput, StartsNothingBeforeTheLogIsWithTheKernel) {
    const TemporaryDirectory folder;
    const std::string file = folder.path("log");
    gLogStream = std::fopen(file.c_str(), "w");
    logPrintf("Calling popen\n");
    CommandOutput output(("cat " + file).c_str());
    char line[64] = {};
    EXPECT_STREQ(std::fgets(line, sizeof line, output.stream()), "Calling popen\n");
    output.close();
    static_cast<void>(std::fclose(gLogStream));
    gLogStream = nullptr;
}

TEST(CommandOutput, IsNotStartedForALogThatRefusesItsLines) {
    const RefusingLog log;
    EXPECT_THROW(logPrintf("line\n"), WriteFailedEx);
    EXPECT_EQ(messageOf<WriteFailedEx>([] { const CommandOutput output("exit"); }), "File write failed\n");
}

} // namespace
