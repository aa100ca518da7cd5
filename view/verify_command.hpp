#pragma once

#include <optional>
#include <string>

#include "view/kernel/kernel.hpp"
#include "view/model/model.hpp"
#include "view/model/verify.hpp"

namespace view {

// What morvane-view verify is asked.
struct VerifyRequest {
    std::string log;       // empty: where Morvane writes it, or where a recording has it
    std::string root;      // of a host's files; empty: this host's
    std::string maps;      // a file with multipathd's list; empty: none, or a recording's
    std::string record;    // a new folder that the files are copied into; empty: none
    bool isForced = false; // whether a log of another host is taken
};

// What was read, and what came of it.
struct VerifyAnswer {
    std::string log; // the file
    Model model;
    Verification verification;
};

// Reads the log and what the host, or a recording of one, remembers, and compares them. Throws Trouble when
// one of them cannot be read, makes no sense or is of another host.
VerifyAnswer answer(const VerifyRequest& request);

} // namespace view
