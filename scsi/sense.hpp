// Sense data: what a device says about a command that it did not carry out (SPC, sense data formats).
#pragma once

#include "foundation/integers.hpp"

constexpr uint8 kSenseKeyIllegalRequest = 5;

// The header of sense data in fixed or descriptor format. Fields that the data are too short for are 0.
struct SenseHeader {
    uint8 senseKey = 0;
    uint8 asc = 0;  // additional sense code
    uint8 ascq = 0; // additional sense code qualifier
};

// Whether the data are long enough to be looked at: three bytes.
bool isSensePresent(const uint8* sense, uint32 length);

// Whether present data carry a response code of 70h to 7Fh.
bool isSenseWellFormed(const uint8* sense);

// Decodes `length` bytes of present, well-formed sense data. Fixed-format data end where their additional
// sense length (byte 7) says, or at `length`, whichever is first.
SenseHeader decodeSense(const uint8* sense, uint32 length);
