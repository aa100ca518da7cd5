#include "view/show/words.hpp"

#include <array>

#include "view/show/escape.hpp"

namespace view {

namespace {

template <std::size_t Count, typename Enumeration>
std::string_view pick(const std::array<std::string_view, Count>& names, Enumeration value) {
    return names.at(static_cast<std::size_t>(value));
}

} // namespace

std::string_view name(Tree tree) {
    static constexpr std::array<std::string_view, 6> kNames = {"run",   "multipath", "fc",
                                                               "iscsi", "direct",    "logical"};
    return pick(kNames, tree);
}

std::string_view name(TreeState state) {
    static constexpr std::array<std::string_view, 5> kNames = {"absent", "cut", "built", "ended",
                                                               "not-configured"};
    return pick(kNames, state);
}

std::string_view name(AdapterState state) {
    static constexpr std::array<std::string_view, 4> kNames = {"cut", "reported", "unsupported", "failed"};
    return pick(kNames, state);
}

std::string_view name(PowerPathState state) {
    static constexpr std::array<std::string_view, 3> kNames = {"unknown", "not running", "running"};
    return pick(kNames, state);
}

std::string_view name(Severity severity) {
    static constexpr std::array<std::string_view, 2> kNames = {"problem", "note"};
    return pick(kNames, severity);
}

std::string_view name(ProblemKind kind) {
    static constexpr std::array<std::string_view, 21> kNames = {
        "log-cut",
        "assertion-failed",
        "tree-ended",
        "no-adapters",
        "adapter-failed",
        "adapter-unsupported",
        "mapping-failed",
        "lun-unnamed",
        "lun-dropped",
        "lun-left-out",
        "inquiry-failed",
        "not-under-powerpath",
        "powerpath-uncertain",
        "iscsi-not-configured",
        "device-ignored",
        "session-without-disks",
        "device-unsupported",
        "entry-ignored",
        "identifier-not-unique",
        "names-differ",
        "foreign-text",
    };
    return pick(kNames, kind);
}

std::string_view name(IdentifierKind kind) {
    static constexpr std::array<std::string_view, 9> kNames = {
        "unknown", "naa", "t10", "eui-64", "scsi-name", "md5", "standard-inquiry", "host-name", "none"};
    return pick(kNames, kind);
}

std::string counted(std::uint64_t count, std::string_view one) {
    return std::to_string(count) + " " + std::string(one) + (count == 1 ? "" : "s");
}

std::string identifierWords(const Identifier& identifier) {
    return identifier.text.empty() ? "(empty)" : printable(identifier.text);
}

} // namespace view
