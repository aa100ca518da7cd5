// The failures of SCSI commands.
#pragma once

#include "foundation/exceptions.hpp"

// clang-format off

struct ScsiStatusEx : TException { using TException::TException; }; // the command ended without good status
struct ScsiIoctlEx : TException { using TException::TException; };  // the driver refused the command
struct TimeOutEx : TException { using TException::TException; };    // the command took too long
struct NotAllowedEx : TException { using TException::TException; }; // an operation out of its order

// clang-format on
