#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "view/model/verify.hpp"

namespace view {

// The names that JSON documents use.
std::string_view name(FindingKind kind);
std::string_view name(NotCompared reason);

// What is wrong, and what to do about it, in sentences that hold for every finding of a kind.
std::string_view meaning(FindingKind kind);
std::string_view advice(const Finding& finding);

// Why devices could not be compared.
std::string_view meaning(NotCompared reason);

// A particular of a finding, with the bytes of names and states as they are.
std::string words(const Detail& detail);

// What a finding says beyond its paths and its kind, fit to be shown; empty for nothing.
std::string particulars(const Finding& finding);

// A time, in seconds since the epoch, as "2026-11-21 18:05:00 UTC".
std::string timeWords(std::int64_t time);

} // namespace view
