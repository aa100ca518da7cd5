// A recording: what one run of Morvane wrote and asked of its devices, call by call, so that the floor
// program can do the same and nothing else.
//
// File layout, all numbers little-endian: a Header; the events, one behind the other; the texts, each with
// its NUL. An event is its EventType, one byte, and:
//  - kPrint: the number of arguments, one byte; the format's text offset, 4 bytes; 8 bytes an argument, a
//  number
//    or a text offset as the bits of a mask (one byte, before the arguments, 1 for a text) tell;
//  - kPrintDoubles: the number of arguments; the format's text offset; 8 bytes a double;
//  - kOpen: the path's text offset; kClose: nothing;
//  - kSgIo: the CDB's length, one byte, and the CDB; the transfer length, 4 bytes.
#pragma once

#include <cstdint>

struct Header {
    std::uint64_t eventBytes;
    std::uint64_t textBytes;
};

enum EventType : std::uint8_t { kPrint = 1, kPrintDoubles = 2, kOpen = 3, kClose = 4, kSgIo = 5 };

constexpr unsigned kMostArguments = 6;
