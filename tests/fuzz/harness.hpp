// What every fuzz target shares: the input, the end of an input, and a host that says what the input says.
//
// The targets call the product's own functions. Where these reach for the host (files, commands, device
// nodes, the clock), the link step puts the functions of harness.cpp in the C library's place.
#pragma once

#include <scsi/sg.h>

#include <cstdint>
#include <functional>
#include <initializer_list>
#include <map>
#include <string>
#include <string_view>

#include "foundation/integers.hpp"

// The bytes of one input, taken from the front. Behind the end stand zeros.
class Input {
public:
    Input(const uint8* data, std::size_t size) : mRest(reinterpret_cast<const char*>(data), size) {}

    uint8 byte() { return mRest.empty() ? uint8{0} : static_cast<uint8>(take(1)[0]); }
    uint16 word() { // little-endian
        const uint16 low = byte();
        return static_cast<uint16>(low | byte() << 8);
    }
    // At most `count` bytes.
    std::string_view take(std::size_t count) {
        const std::string_view front = mRest.substr(0, count);
        mRest.remove_prefix(front.size());
        return front;
    }
    std::string_view rest() { return take(mRest.size()); }

private:
    std::string_view mRest;
};

// Runs `body` on one input, with a log that goes nowhere. An exception of the product's own family ends the
// input, and so does a failed assertion whose condition is one of `fatalConditions`; any other assertion and
// any other exception is a finding.
void runInput(std::initializer_list<std::string_view> fatalConditions, const std::function<void()>& body);

// Ends the fuzzer with the message unless `condition` holds: for what must be true of every input.
void require(bool condition, const char* message);

// The host of the current input.
struct ScriptedHost {
    // Content of files by path; one that is not here cannot be opened by the product.
    std::map<std::string, std::string> files;
    // Output of the command that popen() is given; null for a popen that fails.
    std::function<const std::string*(const std::string& command)> command;
    // Answers an SG_IO: returns 0, or the error number that the ioctl fails with.
    std::function<int(sg_io_hdr& header)> device;
};
extern ScriptedHost gHost;

// Writes `data` where the command wants its response, as much as there is room for.
void respond(sg_io_hdr& header, std::string_view data);
