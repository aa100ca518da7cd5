// What the targets of the product share: the end of an input, and a host that says what the input says.
//
// The targets call the product's own functions. Where these reach for the host (files, commands, device
// nodes, the clock), the link step puts the functions of harness.cpp in the C library's place.
#pragma once

#include <scsi/sg.h>

#include <functional>
#include <initializer_list>
#include <map>
#include <string>
#include <string_view>

#include "tests/fuzz/input.hpp"

// Runs `body` on one input, with a log that goes nowhere. An exception of the product's own family ends the
// input, and so does a failed assertion whose condition is one of `fatalConditions`; any other assertion and
// any other exception is a finding.
void runInput(std::initializer_list<std::string_view> fatalConditions, const std::function<void()>& body);

// The host of the current input.
struct ScriptedHost {
    // Content of files by path; one that is not here cannot be opened by the product.
    std::map<std::string, std::string> files;
    // Output of a shell command; null for one that cannot be started.
    std::function<const std::string*(const std::string& command)> command;
    // Answers an SG_IO: returns 0, or the error number that the ioctl fails with.
    std::function<int(sg_io_hdr& header)> device;
};
extern ScriptedHost gHost;

// Writes `data` where the command wants its response, as much as there is room for.
void respond(sg_io_hdr& header, std::string_view data);
