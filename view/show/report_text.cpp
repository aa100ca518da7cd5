#include <algorithm>
#include <cstddef>
#include <iomanip>
#include <iterator>
#include <map>
#include <string_view>
#include <utility>

#include "view/model/luns.hpp"
#include "view/model/path_view.hpp"
#include "view/show/escape.hpp"
#include "view/show/text.hpp"
#include "view/show/warnings.hpp"
#include "view/show/words.hpp"

namespace view {

namespace {

std::string joinWords(const std::vector<std::string>& words) {
    std::string joined;
    for (const std::string& word : words) {
        if (!word.empty()) {
            joined += (joined.empty() ? "" : " ") + word;
        }
    }
    return joined;
}

void writeTitle(std::ostream& output, const Model& model, const Style& style) {
    const std::string host = model.host.empty() ? "an unnamed host" : printable(model.host);
    output << style.heading << "Storage paths of " << host << style.end << ", " << printable(model.log.name)
           << '\n';
}

void writeProblems(std::ostream& output, const Model& model, const Style& style) {
    const std::size_t problems = problemCount(model);
    if (problems == 0) {
        output << '\n' << style.good << "No problems." << style.end << '\n';
    }
    for (std::size_t i = 0; i < model.problems.size(); ++i) {
        const Problem& problem = model.problems[i];
        if (i == 0 && problems > 0) {
            output << '\n' << style.problem << "Problems (" << problems << ')' << style.end << '\n';
        }
        if (i == problems) {
            writeHeading(output, style, "Notes (" + std::to_string(model.problems.size() - problems) + ")");
        }
        output << "  " << std::left << std::setw(11) << section(problem.tree) << printable(problem.subject)
               << '\n'
               << std::string(13, ' ') << printable(problem.cause);
        if (problem.line > 0) {
            output << style.faint << " (line " << problem.line << ')' << style.end;
        }
        output << '\n';
    }
}

void writeWarnings(std::ostream& output, const LogFacts& log, const Style& style) {
    const std::vector<std::string> warnings = warningsOf(log);
    if (warnings.empty()) {
        return;
    }
    writeHeading(output, style, "The log itself");
    for (const std::string& warning : warnings) {
        output << "  " << warning << '\n';
    }
}

// The names that other programs have for a device, each with what it is called so by: a name that several use
// once, and of the links only those that no name tells.
std::vector<std::pair<std::string, std::string>> nameLines(const Names& names) {
    std::vector<std::pair<std::string, std::string>> lines;
    const auto add = [&](const std::string& program, const std::string& name) {
        const auto same =
            std::find_if(lines.begin(), lines.end(), [&](const auto& line) { return line.second == name; });
        if (name.empty()) {
            return;
        }
        if (same == lines.end()) {
            lines.emplace_back(program, name);
        } else {
            same->first += ", " + program;
        }
    };
    const bool isOneUdevName = names.sg3Rules.empty() || names.sg3Rules == names.scsiId;
    add("multipath", names.multipath);
    add(isOneUdevName ? "udev" : "udev with sg3-utils", isOneUdevName ? names.scsiId : names.sg3Rules);
    add("scsi_id", isOneUdevName ? "" : names.scsiId);
    add("kernel", names.kernel);
    const std::size_t nameCount = lines.size();
    for (const std::string& link : names.links) {
        const std::string_view id = std::string_view(link).substr(link.find('-') + 1);
        const auto tells = [&](const auto& line) {
            return line.second == id ||
                   (id.starts_with("0x") && line.second == "naa." + std::string(id.substr(2)));
        };
        if (std::none_of(lines.begin(), std::next(lines.begin(), static_cast<std::ptrdiff_t>(nameCount)),
                         tells)) {
            lines.emplace_back("by-id", link);
        }
    }
    return lines;
}

void writeNames(std::ostream& output, const Names& names) {
    Columns columns;
    for (const auto& [program, name] : nameLines(names)) {
        columns.add({program, printable(name)});
    }
    columns.write(output, "    ");
}

void writeLuns(std::ostream& output, const Model& model, const Style& style) {
    if (model.luns.empty()) {
        return;
    }
    writeHeading(output, style, "LUNs (" + std::to_string(model.luns.size()) + ")");
    for (const Lun& lun : model.luns) {
        const std::string product = joinWords({printable(lun.facts.vendor), printable(lun.facts.product)});
        output << "  " << style.heading << identifierWords(lun.identifier) << style.end << "  "
               << counted(lun.devices.size(), "path");
        if (!product.empty()) {
            output << "  " << product;
        }
        if (!lun.facts.pseudoDevice.empty()) {
            output << "  " << printable(lun.facts.pseudoDevice);
        }
        if (!lun.notUnique.empty()) {
            output << "  " << style.problem << "NOT UNIQUE" << style.end;
        }
        output << '\n';
        writeNames(output, namesOf(lun.page83, lun.facts));
        Columns columns;
        for (const Sighting& sighting : lun.sightings) {
            const PathView path = describe(model, sighting);
            std::string way = printable(path.initiator) + " -> " + printable(path.target);
            if (sighting.place == Sighting::Place::DirectDevice) {
                way = "direct";
            } else if (sighting.place == Sighting::Place::Unlisted) {
                way = "not listed in the FC tree";
            }
            columns.add({printable(path.device), path.lun.empty() ? "" : "LUN " + path.lun, way});
        }
        columns.write(output, "    ");
    }
}

std::string stateWords(TreeState state) {
    switch (state) {
    case TreeState::Absent:
        return "not in the log";
    case TreeState::Begun:
        return "cut off";
    case TreeState::Ended:
        return "ended early";
    case TreeState::NotConfigured:
        return "not configured";
    default:
        return {};
    }
}

// The heading of a tree: its name, its size, and its state unless it is whole.
void writeTreeHeading(std::ostream& output, const Style& style, std::string_view tree,
                      const std::string& size, TreeState state) {
    const std::string words = stateWords(state);
    writeHeading(output, style,
                 std::string(tree) + " (" + (words.empty() ? size : size + ", " + words) + ")");
}

std::string adapterWords(const Adapter& adapter) {
    switch (adapter.state) {
    case AdapterState::Failed:
        return "FAILED: " + printable(adapter.cause);
    case AdapterState::Unsupported:
        return "not supported";
    case AdapterState::Begun:
        return "cut off";
    default:
        return {};
    }
}

// Adapters with their ports and targets; the LUNs behind a target are counted.
void writeFc(std::ostream& output, const Model& model, const Style& style) {
    const FcTree& fc = model.fc;
    writeTreeHeading(output, style, "Fibre Channel",
                     counted(fc.adapters.size(), "adapter") + ", " + counted(fc.paths.size(), "listed path"),
                     fc.state);
    using Target = std::pair<std::string, std::string>; // node and port
    struct Targets {
        std::map<Target, std::size_t> places; // in the list
        std::vector<std::pair<Target, std::size_t>> list;
    };
    std::map<std::pair<std::size_t, std::string>, Targets> targetsOfPort;
    for (const FcPath& path : fc.paths) {
        Targets& targets = targetsOfPort[{path.adapter, path.initiator}];
        const Target target{path.targetNode, path.targetPort};
        const auto [place, isNew] = targets.places.try_emplace(target, targets.list.size());
        if (isNew) {
            targets.list.emplace_back(target, 0);
        }
        ++targets.list[place->second].second;
    }
    for (std::size_t i = 0; i < fc.adapters.size(); ++i) {
        const Adapter& adapter = fc.adapters[i];
        output << "  adapter "
               << joinWords({adapter.number ? "#" + std::to_string(*adapter.number) : "",
                             printable(adapter.name), printable(adapter.manufacturer),
                             printable(adapter.model), printable(adapter.node)});
        const std::string state = adapterWords(adapter);
        if (!state.empty()) {
            output << "  " << style.problem << state << style.end;
        }
        output << '\n';
        for (const std::string& initiator : adapter.initiators) {
            output << "    initiator " << printable(initiator) << '\n';
            // A port that is listed twice shows its targets once.
            for (const auto& [target, luns] : std::exchange(targetsOfPort[{i, initiator}].list, {})) {
                output << "      target " << printable(target.second) << " of " << printable(target.first)
                       << "  " << counted(luns, "LUN") << '\n';
            }
        }
    }
}

void writeIscsi(std::ostream& output, const Model& model, const Style& style) {
    writeTreeHeading(output, style, "iSCSI", counted(model.iscsi.paths.size(), "path"), model.iscsi.state);
    const IscsiPath* last = nullptr;
    Columns columns;
    const auto flush = [&] {
        columns.write(output, "      ");
        columns = {};
    };
    for (const IscsiPath& path : model.iscsi.paths) {
        const bool newPort = last == nullptr || last->initiatorIqn != path.initiatorIqn ||
                             last->initiatorPort != path.initiatorPort;
        const bool newTarget =
            newPort || last->targetIqn != path.targetIqn || last->targetAddress != path.targetAddress;
        if (newTarget) {
            flush();
        }
        if (newPort) {
            output << "  initiator " << printable(path.initiatorIqn) << "  " << printable(path.initiatorPort)
                   << '\n';
        }
        if (newTarget) {
            output << "    target " << printable(path.targetIqn) << "  " << printable(path.targetAddress)
                   << '\n';
        }
        columns.add({printable(path.device), "LUN " + std::to_string(path.lun),
                     path.identifier.kind == IdentifierKind::None ? "no identifier"
                                                                  : printable(path.identifier.text)});
        last = &path;
    }
    flush();
}

void writeDevices(std::ostream& output, const Model& model, const Style& style) {
    writeTreeHeading(output, style, "Direct disks", std::to_string(model.direct.devices.size()),
                     model.direct.state);
    Columns columns;
    for (const DirectDevice& direct : model.direct.devices) {
        const bool isHostName = direct.identifier.kind == IdentifierKind::HostName;
        columns.add({printable(direct.device),
                     isHostName ? "no identifier of its own" : printable(direct.identifier.text)});
        if (isHostName) {
            for (const auto& [program, name] : nameLines(namesOf(direct.page83, {}))) {
                columns.add({"", program + "  " + printable(name)});
            }
        }
    }
    columns.write(output, "  ");

    writeTreeHeading(output, style, "Logical devices", std::to_string(model.logical.devices.size()),
                     model.logical.state);
    for (const std::string& device : model.logical.devices) {
        output << "  " << printable(device) << '\n';
    }
}

void writeMultipath(std::ostream& output, const Model& model, const Style& style) {
    writeHeading(output, style, "PowerPath (" + std::string(name(model.multipath.state)) + ")");
    Columns columns;
    for (const PseudoDevice& device : model.multipath.devices) {
        columns.add({printable(device.name), printable(device.ulid)});
    }
    columns.write(output, "  ");
}

} // namespace

void writeText(std::ostream& output, const Model& model, const Style& style) {
    writeTitle(output, model, style);
    writeProblems(output, model, style);
    writeWarnings(output, model.log, style);
    writeLuns(output, model, style);
    writeFc(output, model, style);
    writeIscsi(output, model, style);
    writeDevices(output, model, style);
    writeMultipath(output, model, style);
}

} // namespace view
