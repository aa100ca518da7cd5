#include "simhost/toml_reader.hpp"

#include <cctype>
#include <charconv>
#include <iomanip>
#include <sstream>

namespace simhost {
namespace {

int hexDigit(char c) {
    if (c >= '0' && c <= '9') {
        return c - '0';
    }
    const int lower = std::tolower(static_cast<unsigned char>(c));
    return lower >= 'a' && lower <= 'f' ? lower - 'a' + 10 : -1;
}

constexpr std::uint64_t kMostCopies = 1000000; // each is a table of its own in memory

constexpr unsigned kLongestNumber = 20; // digits of a 64-bit number

// The number as a placeholder "{n}", "{n:04}" or "{n:08x}" writes it; `format` is what follows "n".
std::string numberAs(std::uint64_t number, std::string_view format, const std::string& where) {
    if (format.empty()) {
        return std::to_string(number);
    }
    unsigned width = 0;
    const char* end = format.data() + format.size();
    const auto [rest, error] = std::from_chars(format.data() + 1, end, width);
    const std::string_view kind(rest, static_cast<std::size_t>(end - rest));
    if (format.size() < 3 || format[0] != ':' || format[1] != '0' || error != std::errc() ||
        (!kind.empty() && kind != "x")) {
        throw DescriptionError(where + ": a placeholder is {n}, {n:04} or {n:08x}, not {n" +
                               std::string(format) + "}");
    }
    if (width > kLongestNumber) {
        throw DescriptionError(where + ": a placeholder has at most " + std::to_string(kLongestNumber) +
                               " digits");
    }
    std::ostringstream text;
    text << std::setfill('0') << std::setw(static_cast<int>(width)) << (kind.empty() ? std::dec : std::hex)
         << number;
    return text.str();
}

std::string withNumber(const std::string& text, std::uint64_t number, const std::string& where) {
    std::string result;
    std::size_t at = 0;
    for (;;) {
        const std::size_t open = text.find("{n", at);
        const std::size_t close = open == std::string::npos ? open : text.find('}', open);
        if (close == std::string::npos) {
            return result + text.substr(at);
        }
        result += text.substr(at, open - at);
        result += numberAs(number, std::string_view(text).substr(open + 2, close - open - 2), where);
        at = close + 1;
    }
}

void putNumber(toml::node& node, std::uint64_t number, const std::string& where) {
    if (auto* text = node.as_string()) {
        *text = withNumber(text->get(), number, where);
    } else if (auto* table = node.as_table()) {
        for (auto&& [key, value] : *table) {
            putNumber(value, number, where);
        }
    } else if (auto* array = node.as_array()) {
        for (auto& value : *array) {
            putNumber(value, number, where);
        }
    }
}

} // namespace

Bytes bytesOfHex(std::string_view text, const std::string& where) {
    Bytes result;
    int high = -1;
    for (const char c : text) {
        if (std::isspace(static_cast<unsigned char>(c)) != 0) {
            continue;
        }
        const int digit = hexDigit(c);
        if (digit < 0) {
            throw DescriptionError(where + ": not a hex digit: '" + c + "'");
        }
        if (high < 0) {
            high = digit;
        } else {
            result += static_cast<char>(high * 16 + digit);
            high = -1;
        }
    }
    if (high >= 0) {
        throw DescriptionError(where + ": an odd number of hex digits");
    }
    return result;
}

void refuse(const toml::node& node, const std::string& where, const std::string& what) {
    const auto line = node.source().begin.line; // 0 for a copy that a repetition made
    throw DescriptionError((line == 0 ? "" : "line " + std::to_string(line) + ": ") + where + ": " + what);
}

std::string stringOf(const toml::node& node, const std::string& where) {
    if (!node.is_string()) {
        refuse(node, where, "must be a string");
    }
    return node.as_string()->get();
}

bool booleanOf(const toml::node& node, const std::string& where) {
    if (!node.is_boolean()) {
        refuse(node, where, "must be true or false");
    }
    return node.as_boolean()->get();
}

const toml::table& tableOf(const toml::node& node, const std::string& where) {
    if (!node.is_table()) {
        refuse(node, where, "must be a table");
    }
    return *node.as_table();
}

std::uint64_t numberOf(const toml::node& node, const std::string& where, std::uint64_t most) {
    const auto* value = node.as_integer();
    if (value == nullptr || value->get() < 0 || static_cast<std::uint64_t>(value->get()) > most) {
        refuse(node, where, "must be a number from 0 to " + std::to_string(most));
    }
    return static_cast<std::uint64_t>(value->get());
}

Bytes bytesOf(const toml::node& node, const std::string& where) {
    if (const auto* text = node.as_string()) {
        return text->get();
    }
    const auto* table = node.as_table();
    if (table == nullptr) {
        refuse(node, where, "must be a string or { hex = \"…\" }");
    }
    Keys keys(*table, where);
    auto bytes = keys.hex("hex");
    keys.refuseUnknown();
    if (!bytes) {
        refuse(node, where, "must be a string or { hex = \"…\" }");
    }
    return *bytes;
}

bool isPlain(const std::string& path) {
    return (path + "/").find("//") == std::string::npos && (path + "/").find("/./") == std::string::npos &&
           (path + "/").find("/../") == std::string::npos;
}

std::vector<toml::table> unrolled(const toml::table& entry, const std::string& where) {
    Keys keys(entry, where);
    const auto count = keys.number("count", kMostCopies);
    const std::uint64_t first = keys.number("first").value_or(0);
    if (!count) {
        return {entry};
    }
    toml::table pattern = entry;
    pattern.erase("count");
    pattern.erase("first");
    std::vector<toml::table> copies;
    for (std::uint64_t n = first; n < first + *count; ++n) {
        putNumber(copies.emplace_back(pattern), n, where);
    }
    return copies;
}

Keys::Keys(const toml::table& table, std::string where) : mTable(table), mWhere(std::move(where)) {}

const toml::node* Keys::find(std::string_view key) {
    mKnown.emplace(key);
    return mTable.get(key);
}

const toml::node& Keys::require(std::string_view key) {
    const toml::node* node = find(key);
    if (node == nullptr) {
        refuse(mTable, mWhere, "has no \"" + std::string(key) + "\"");
    }
    return *node;
}

std::string Keys::whereIs(std::string_view key) const {
    return mWhere + "." + std::string(key);
}

std::optional<std::string> Keys::string(std::string_view key) {
    const toml::node* node = find(key);
    return node == nullptr ? std::nullopt : std::optional(stringOf(*node, whereIs(key)));
}

std::optional<bool> Keys::boolean(std::string_view key) {
    const toml::node* node = find(key);
    return node == nullptr ? std::nullopt : std::optional(booleanOf(*node, whereIs(key)));
}

bool Keys::flag(std::string_view key) {
    const auto value = boolean(key);
    if (value && !*value) {
        refuse(*find(key), whereIs(key), "can only be true");
    }
    return value.has_value();
}

std::optional<Bytes> Keys::bytes(std::string_view key) {
    const toml::node* node = find(key);
    return node == nullptr ? std::nullopt : std::optional(bytesOf(*node, whereIs(key)));
}

std::optional<Bytes> Keys::hex(std::string_view key) {
    const auto text = string(key);
    return text ? std::optional(bytesOfHex(*text, whereIs(key))) : std::nullopt;
}

std::optional<std::uint64_t> Keys::number(std::string_view key, std::uint64_t most) {
    const toml::node* node = find(key);
    return node == nullptr ? std::nullopt : std::optional(numberOf(*node, whereIs(key), most));
}

std::uint32_t Keys::number32(std::string_view key, std::uint32_t absent) {
    return static_cast<std::uint32_t>(number(key).value_or(absent));
}

const toml::array& Keys::array(std::string_view key) {
    static const toml::array kNone;
    const toml::node* node = find(key);
    if (node == nullptr) {
        return kNone;
    }
    if (!node->is_array()) {
        refuse(*node, whereIs(key), "must be a list");
    }
    return *node->as_array();
}

const toml::table* Keys::table(std::string_view key) {
    const toml::node* node = find(key);
    return node == nullptr ? nullptr : &tableOf(*node, whereIs(key));
}

std::vector<toml::table> Keys::tables(std::string_view key) {
    std::vector<toml::table> result;
    const toml::array& entries = array(key);
    for (std::size_t i = 0; i < entries.size(); ++i) {
        const std::string where = std::string(key) + " " + std::to_string(i);
        for (auto& copy : unrolled(tableOf(entries[i], where), where)) {
            result.push_back(std::move(copy));
        }
    }
    return result;
}

void Keys::refuseUnknown() const {
    for (auto&& [key, value] : mTable) {
        if (mKnown.find(key.str()) == mKnown.end()) {
            refuse(value, mWhere, "unknown key \"" + std::string(key.str()) + "\"");
        }
    }
}

} // namespace simhost
