// What a shell command prints.
#pragma once

#include <sys/types.h>

#include <cstdio>

// A shell command that is running, and the pipe that its standard output goes to. The command has nothing of
// the run but its standard error: /dev/null is its standard input, no descriptor of Morvane's is open in it,
// a pipe that nobody reads ends it, and its environment is a fixed path to the system's programs and the C
// locale, whatever the caller's holds.
class CommandOutput {
public:
    // Starts the command, once everything logged so far is with the kernel. Throws WriteFailedEx when the log
    // refuses that; that the command cannot be started is told by isOpen.
    explicit CommandOutput(const char* command);
    CommandOutput(const CommandOutput&) = delete;
    CommandOutput& operator=(const CommandOutput&) = delete;
    // Waits for the command as close does, unless the log takes no more: then the run is to end.
    ~CommandOutput();

    bool isOpen() const { return mStream != nullptr; }

    // Owned by this object, and gone with close.
    std::FILE* stream() const { return mStream; }

    // Closes the pipe and waits for the command's end, whose status is nobody's concern. What is logged is
    // with the kernel before. Throws WriteFailedEx.
    void close();

    // Gives up the pipe as it is, open, and does not wait for the command.
    void leaveRunning() { mStream = nullptr; }

private:
    void finish() noexcept;

    std::FILE* mStream = nullptr;
    pid_t mProcess = -1;
};
