#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "view/model/model.hpp"

namespace view {

// The names that JSON documents use.
std::string_view name(Tree tree);
std::string_view name(TreeState state);
std::string_view name(AdapterState state);
std::string_view name(PowerPathState state);
std::string_view name(Severity severity);
std::string_view name(ProblemKind kind);
std::string_view name(IdentifierKind kind);

// "1 path", "2 paths".
std::string counted(std::uint64_t count, std::string_view one);

// The identifier, fit to be shown, or words for an empty one.
std::string identifierWords(const Identifier& identifier);

} // namespace view
