#include "view/model/path_states.hpp"

#include <algorithm>
#include <initializer_list>
#include <string>
#include <string_view>

namespace view {

std::vector<Detail> troublesOf(const KernelDisk& disk, const ListedPath* listed) {
    using Kind = Detail::Kind;
    std::vector<Detail> troubles;
    const auto note = [&](Kind kind, const std::string& state, std::initializer_list<std::string_view> good,
                          const std::string& controller = {}) {
        if (!state.empty() && std::find(good.begin(), good.end(), state) == good.end()) {
            troubles.push_back({kind, controller, state});
        }
    };
    note(Kind::DiskState, disk.state, {"running"});
    note(Kind::PortState, disk.portState, {"Online"});
    note(Kind::SessionState, disk.sessionState, {"LOGGED_IN"});
    for (const NvmePath& path : disk.nvmePaths) {
        note(Kind::ControllerState, path.state, {"live"}, path.controller);
    }
    if (listed != nullptr) {
        note(Kind::ListedDeviceState, listed->deviceState, {"running", "undef"});
        note(Kind::ListedMapState, listed->mapState, {"active", "undef"});
        note(Kind::CheckerState, listed->checkState, {"ready", "ghost", "i/o pending", "undef"});
    }
    return troubles;
}

} // namespace view
