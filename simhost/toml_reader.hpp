// Typed, strict access to a TOML table: what is read must have its type, and what is never read is refused,
// so that a misspelt key cannot pass for an absent one.
#pragma once

#include <cstdint>
#include <optional>
#include <set>
#include <string>
#include <string_view>
#include <vector>

#include <toml++/toml.h>

#include "simhost/description.hpp"

namespace simhost {

// Bytes written as hex digits, with blanks anywhere; throws DescriptionError for anything else.
Bytes bytesOfHex(std::string_view text, const std::string& where);

// Bytes written as a string or as { hex = "…" }.
Bytes bytesOf(const toml::node& node, const std::string& where);

// Throws a DescriptionError that names the node's line.
[[noreturn]] void refuse(const toml::node& node, const std::string& where, const std::string& what);

// The copies of an entry that carries `count`: {n} in its strings replaced by the copy's number; the entry
// alone when it does not.
std::vector<toml::table> unrolled(const toml::table& entry, const std::string& where);

// A table whose keys are taken one by one. `where` names the table in messages.
class Keys {
public:
    Keys(const toml::table& table, std::string where);

    [[nodiscard]] const std::string& where() const { return mWhere; }

    // The value of a key, or null when it is absent; the key counts as known from then on.
    const toml::node* find(std::string_view key);

    // The value of a key, which must be there.
    const toml::node& require(std::string_view key);

    std::optional<std::string> string(std::string_view key);
    std::optional<bool> boolean(std::string_view key);
    std::optional<Bytes> bytes(std::string_view key);
    std::optional<Bytes> hex(std::string_view key);

    // An integer no smaller than 0 and no larger than `most`.
    std::optional<std::uint64_t> number(std::string_view key, std::uint64_t most = UINT32_MAX);
    std::uint32_t number32(std::string_view key, std::uint32_t absent);

    // An array, or null when absent.
    const toml::array* array(std::string_view key);

    // The tables of an array of tables, repetitions unrolled.
    std::vector<toml::table> tables(std::string_view key);

    // Refuses keys that nothing asked for.
    void refuseUnknown() const;

private:
    const toml::table& mTable;
    std::string mWhere;
    std::set<std::string, std::less<>> mKnown;
};

} // namespace simhost
