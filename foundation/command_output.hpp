// What a shell command prints.
#pragma once

#include <cstdio>

// A shell command that is running, and the pipe that its standard output goes to.
class CommandOutput {
public:
    // Starts the command. Nothing is thrown: isOpen tells.
    explicit CommandOutput(const char* command);
    CommandOutput(const CommandOutput&) = delete;
    CommandOutput& operator=(const CommandOutput&) = delete;
    ~CommandOutput() { close(); }

    bool isOpen() const { return mStream != nullptr; }

    // Owned by this object, and gone with close.
    std::FILE* stream() const { return mStream; }

    // Closes the pipe and waits for the command's end, whose status is nobody's concern.
    void close();

    // Gives up the pipe as it is, open, and does not wait for the command.
    void leaveRunning() { mStream = nullptr; }

private:
    std::FILE* mStream;
};
