#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "view/model/model.hpp"
#include "view/model/path_view.hpp"

namespace view {

// A path that only one of two logs lists.
struct PathDifference {
    PathView path;
    std::string identifier;
    bool isKnownUnlisted = false; // the other log identified a device of this identity without listing it
};

// A path that both logs list, with different identities behind it.
struct IdentityChange {
    PathView path;                     // as the new log has it
    std::optional<std::string> before; // nothing when it could not be read
    std::optional<std::string> after;

    // Whether two different LUNs stood behind the path; otherwise one of the logs has no identifier.
    [[nodiscard]] bool isDangerous() const { return before && after; }
};

struct PathCountChange {
    std::string identifier;
    DeviceFacts facts;
    std::size_t before = 0;
    std::size_t after = 0;
};

// A direct or logical device that only one of two logs lists.
struct DeviceDifference {
    std::string device;
    std::string identifier; // empty when it has none of its own
};

// Why two logs may not compare well.
struct DiffWarning {
    enum class Kind : unsigned char { TwoHosts, NoCommonInitiator, NotWhole, TreeEnded, UnknownPieces };
    Kind kind = Kind::TwoHosts;
    bool isOfNewLog = false;  // of a single log: of the new one, not the old one
    Tree tree = Tree::Run;    // of TreeEnded
    std::uint64_t pieces = 0; // of UnknownPieces
};

// How two runs on one host differ. A device that only got another name is no difference.
struct Difference {
    std::string hostBefore; // empty when its log does not name it
    std::string hostAfter;
    std::vector<DiffWarning> warnings;
    std::vector<IdentityChange> identityChanges;
    std::vector<PathDifference> lostPaths;
    std::vector<PathDifference> newPaths;
    std::vector<PathCountChange> pathCounts; // of LUNs that have more or fewer paths, none included
    std::vector<DeviceDifference> lostDirect;
    std::vector<DeviceDifference> newDirect;
    std::vector<DeviceDifference> lostLogical; // without identifiers
    std::vector<DeviceDifference> newLogical;
    std::optional<PowerPathState> powerPathBefore; // both set when they differ
    std::optional<PowerPathState> powerPathAfter;

    [[nodiscard]] bool isEmpty() const;

    // The number of paths to another LUN than before.
    [[nodiscard]] std::size_t dangerousChanges() const;
};

Difference compare(const Model& before, const Model& after);

} // namespace view
