// What a person at a terminal sees of a run: one line of standard error, rewritten in place.
#pragma once

#include "foundation/integers.hpp"

// Shows "morvane: TREE: WHAT", and "(NUMBER of COUNT)" behind it where `count` is not 0: what the run is
// waiting for from here on. Where standard error is no terminal, nothing is written. `what` may hold any
// bytes, and is cut to the terminal's width; a terminal that refuses the line is left alone.
void showProgress(const char* tree, const char* what, uint32 number = 0, uint32 count = 0) noexcept;

// Removes the line. To be called before anything else is written to the terminal.
void clearProgress() noexcept;
