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

// The value of a node that must have this type; throws DescriptionError when it has another.
std::string stringOf(const toml::node& node, const std::string& where);
bool booleanOf(const toml::node& node, const std::string& where);
const toml::table& tableOf(const toml::node& node, const std::string& where);

// An integer no smaller than 0 and no larger than `most`; throws DescriptionError for anything else.
std::uint64_t numberOf(const toml::node& node, const std::string& where, std::uint64_t most = UINT32_MAX);

// Whether a path has no empty, "." or ".." part, so that it stays where its beginning says.
bool isPlain(const std::string& path);

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

    // Whether the key is there; its only value is true.
    bool flag(std::string_view key);

    std::optional<Bytes> bytes(std::string_view key);
    std::optional<Bytes> hex(std::string_view key);

    std::optional<std::uint64_t> number(std::string_view key, std::uint64_t most = UINT32_MAX);
    std::uint32_t number32(std::string_view key, std::uint32_t absent);

    // An array; an empty one when absent.
    const toml::array& array(std::string_view key);

    // A table, or null when absent.
    const toml::table* table(std::string_view key);

    // The tables of an array of tables, repetitions unrolled.
    std::vector<toml::table> tables(std::string_view key);

    // Refuses keys that nothing asked for.
    void refuseUnknown() const;

private:
    // Where the key's value stands, for messages.
    [[nodiscard]] std::string whereIs(std::string_view key) const;

    const toml::table& mTable;
    std::string mWhere;
    std::set<std::string, std::less<>> mKnown;
};

} // namespace simhost
