#include "foundation/command_output.hpp"

// NOLINTNEXTLINE(cert-env33-c): the commands are fixed
CommandOutput::CommandOutput(const char* command) : mStream(popen(command, "r")) {}

void CommandOutput::close() {
    if (mStream != nullptr) {
        static_cast<void>(pclose(mStream));
        mStream = nullptr;
    }
}
