#include "multipath/powerpath.hpp"

#include <cstdlib>
#include <cstring>
#include <memory>

#include "foundation/assertion.hpp"
#include "foundation/clib_memory.hpp"
#include "foundation/clib_stream.hpp"
#include "foundation/clib_time.hpp"
#include "foundation/command_output.hpp"
#include "foundation/exceptions.hpp"
#include "foundation/integers.hpp"
#include "foundation/log.hpp"
#include "foundation/trace.hpp"

namespace {

constexpr const char* kDaemonCheck = "/usr/bin/pgrep -l emcpd";
constexpr const char* kDeviceListing =
    "/sbin/powermt display latency dev=all | grep -E '^Pseudo|^Logical' | sed 's/ \\[.*$//g'";
constexpr std::size_t kLeastLines = 2; // of either command, for PowerPath to count as running
constexpr unsigned kMostAttempts = 5;
constexpr uint32 kPauseMs = 20;

using Text = std::unique_ptr<char, decltype(&std::free)>;

// Room for a command's output, for the function that `trace` is of. Throws NoMemoryEx "No Memory\n".
Text zeroedText(const FunctionTrace& trace) {
    Text text(static_cast<char*>(std::calloc(ZebSensorLinuxPowerPathHandler::kOutputSize, 1)), &std::free);
    if (!text) {
        trace.fail<NoMemoryEx>("No Memory\n");
    }
    return text;
}

} // namespace

void ZebSensorLinuxPowerPathHandler::sense() {
    const FunctionTrace trace("sense");
    LineList::List lines;
    logPrintf("Checking if emcpd is running\n");
    sExecuteCommand(kDaemonCheck, lines);
    if (lines.size() < kLeastLines) {
        mIsRunning = false;
        mPseudoDevices.clear();
        trace.exit();
        return;
    }
    logPrintf("Getting the output of powermt command\n");
    lines.clear();
    for (unsigned attempts = 0; lines.size() < kLeastLines && attempts < kMostAttempts; ++attempts) {
        sExecuteCommand(kDeviceListing, lines);
        if (lines.size() < kLeastLines) {
            flushLog();
            Clib_msleep(kPauseMs);
        }
    }
    if (lines.size() >= kLeastLines) {
        __parse(lines);
        mIsRunning = true;
    } else {
        mIsRunning = false;
        mPseudoDevices.clear();
    }
    trace.exit();
}

bool ZebSensorLinuxPowerPathHandler::isRunning() const {
    const FunctionTrace trace("isRunning");
    trace.exit();
    return mIsRunning;
}

void ZebSensorLinuxPowerPathHandler::printData() {
    const FunctionTrace trace("printData");
    sense();
    if (mIsRunning) {
        logPrintf("PowerPath Data : Ulid  Pseudo Name\n");
        for (const auto& [ulid, pseudoName] : mPseudoDevices) {
            logPrintf("               %s %s", ulid.c_str(), pseudoName.c_str());
        }
    }
    trace.exit();
}

const ZebString& ZebSensorLinuxPowerPathHandler::getPseudoDevice(const ZebString& ulid) const {
    const FunctionTrace trace("getPseudoDevice");
    const auto found = mPseudoDevices.find(ulid);
    if (found == mPseudoDevices.end()) {
        trace.fail<NotFoundEx>("Element not found\n");
    }
    trace.exit();
    return found->second;
}

void ZebSensorLinuxPowerPathHandler::sExecuteCommand(const char* command, LineList::List& lines) {
    const FunctionTrace trace("sExecuteCommand");
    logPrintf("Calling popen\n");
    CommandOutput output(command);
    if (!output.isOpen()) {
        logPrintf("Failed in popen\n");
        trace.exit();
        return;
    }
    const Text buffer = zeroedText(trace);
    char* position = buffer.get();
    char* const end = buffer.get() + kOutputSize;
    try {
        for (;;) {
            Clib_memset(position, 0, static_cast<std::size_t>(end - position));
            // A line that fills the buffer leaves room for no more bytes, and so ends the reading.
            const auto room = static_cast<std::size_t>(end - position) - 1;
            flushLog();
            const std::size_t count = Clib_fread(position, 1, room, output.stream());
            if (count == 0) {
                logPrintf("Fread returned ERROR\n");
                output.close();
                logPrintf("Number of lines in output: %u\n", static_cast<unsigned>(lines.size()));
                trace.exit();
                return;
            }
            position[count] = '\0';
            logPrintf("Buffer got = %s\n", buffer.get());
            position = sBreakOutput(buffer.get(), lines);
        }
    } catch (const ReadFailedEx& exception) {
        logPrintf("Failed to read - %s\n", exception.what());
        output.close();
        trace.exit();
        throw;
    }
}

char* ZebSensorLinuxPowerPathHandler::sBreakOutput(char* buffer, LineList::List& lines) {
    const FunctionTrace trace("sBreakOutput");
    const Text line = zeroedText(trace);
    char* cursor = buffer;
    while (char* const newline = std::strchr(cursor, '\n')) {
        *newline = '\0';
        Clib_strcpy(line.get(), cursor);
        logPrintf("Line: %s", line.get());
        LineList::push_back(lines, line.get());
        cursor = newline + 1;
        if (*cursor == '\0') {
            logPrintf("End of popened Buffer\n");
            trace.exit();
            return buffer;
        }
    }
    logPrintf("Incomplete line: %s\n", cursor);
    const std::size_t rest = Clib_strlen(cursor);
    Clib_memmove(buffer, cursor, rest);
    trace.exit();
    return buffer + rest;
}

void ZebSensorLinuxPowerPathHandler::__parse(LineList::List& arOutput) {
    const FunctionTrace trace("__parse");
    while (!arOutput.empty()) {
        ZebString pseudoName("");
        sParseOutputLine(arOutput, pseudoName);
        logPrintf("pseudo device - %s\n", pseudoName.c_str());
        ASSERT_OR_EXIT(0 !=
                       arOutput.size()); // NOLINT(readability-container-size-empty): the log shows this text
        ZebString ulid("");
        sParseOutputLine(arOutput, ulid);
        logPrintf("ulid - %s\n", ulid.c_str());
        if (!PseudoDeviceMap::contains(mPseudoDevices, ulid)) {
            PseudoDeviceMap::insert(mPseudoDevices, ulid, pseudoName);
        } else if (PseudoDeviceMap::lookup(mPseudoDevices, ulid) != pseudoName) {
            mPseudoDevices.erase(ulid);
            PseudoDeviceMap::insert(mPseudoDevices, ulid, pseudoName);
        }
        if (arOutput.size() == 1) {
            LineList::pop_front(arOutput); // a pseudo device without its logical unit
        }
    }
    trace.exit();
}

void ZebSensorLinuxPowerPathHandler::sParseOutputLine(LineList::List& arOutput, ZebString& valueOut) {
    const FunctionTrace trace("sParseOutputLine");
    ASSERT_OR_EXIT(0 != arOutput.size()); // NOLINT(readability-container-size-empty): the log shows this text
    const ZebString line = LineList::front(arOutput);
    LineList::pop_front(arOutput);
    const ZebString::size_type lPos = line.find_first_of('=');
    ASSERT_OR_EXIT(lPos != ZebString::npos);
    valueOut = line.substr(lPos + 1, ZebString::npos);
    trace.exit();
}
