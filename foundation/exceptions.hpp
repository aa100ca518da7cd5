// The failures of the system: one root, no deeper level, and a message text as the only payload. A message is
// exactly the constructor's text, its line end (or the lack of one) included. Thrown by value, caught by
// reference.
#pragma once

#include <exception>
#include <string>

class TException : public std::exception {
public:
    // Copies the NUL-terminated text; throws std::bad_alloc.
    explicit TException(const char* message) : mMessage(message) {}

    // The constructor's text; owned by the exception.
    const char* what() const noexcept override { return mMessage.c_str(); }

private:
    std::string mMessage;
};

// clang-format off

// Memory, elements and arguments.
struct NoMemoryEx : TException { using TException::TException; };     // an allocation failed
struct ExistsEx : TException { using TException::TException; };       // directory or map key already there
struct NotFoundEx : TException { using TException::TException; };     // key, element or field not found
struct ZebNotFoundEx : TException { using TException::TException; };  // two-level map: miss, or out of memory
struct InvalidEx : TException { using TException::TException; };      // malformed data or argument
struct NotSupportedEx : TException { using TException::TException; }; // device or request kind not handled
struct ExpiredEx : TException { using TException::TException; };      // device entry is stale

// Files and streams.
struct TryAgainEx : TException { using TException::TException; };     // non-blocking read: nothing there yet
struct OpenFailedEx : TException { using TException::TException; };   // open, fopen, fdopen, freopen
struct CloseFailedEx : TException { using TException::TException; };  // close, fclose
struct CreateFailedEx : TException { using TException::TException; }; // creat
struct ReadFailedEx : TException { using TException::TException; };   // read, fread, fgets, formatted input
struct WriteFailedEx : TException { using TException::TException; };  // write, fwrite, formatted output

// Single C-library calls.
struct ClibChdirFailedEx : TException { using TException::TException; };
struct ClibChmodFailedEx : TException { using TException::TException; };
struct ClibGetTimeFailedEx : TException { using TException::TException; };
struct ClibDupFailedEx : TException { using TException::TException; };
struct ClibDup2FailedEx : TException { using TException::TException; };
struct ClibPwdFailedEx : TException { using TException::TException; };
struct ClibSleepFailedEx : TException { using TException::TException; };
struct ClibPutenvFailedEx : TException { using TException::TException; };
struct ClibRmdirFailedEx : TException { using TException::TException; };
struct ClibStatFailedEx : TException { using TException::TException; };
struct ClibUtimeFailedEx : TException { using TException::TException; };
struct ClibGetProcStatusFailedEx : TException { using TException::TException; };
struct ClibUnlinkFailedEx : TException { using TException::TException; };
struct ClibMkdirFailedEx : TException { using TException::TException; };

// Fibre Channel discovery.
struct THaltEx : TException { using TException::TException; };   // stops the FC tree
struct THbaapiEx : TException { using TException::TException; }; // an HBA API call returned an error status

// clang-format on
