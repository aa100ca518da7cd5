#include "view/show/prometheus.hpp"

#include <algorithm>
#include <cctype>
#include <cstddef>
#include <initializer_list>
#include <map>
#include <set>
#include <string>
#include <string_view>
#include <utility>

#include "view/model/luns.hpp"
#include "view/model/path_view.hpp"
#include "view/show/escape.hpp"
#include "view/show/words.hpp"

namespace view {

namespace {

using Label = std::pair<std::string_view, std::string>;
using Devices = std::set<std::string>;

void writeFamily(std::ostream& output, std::string_view name, std::string_view help) {
    output << "# HELP " << name << ' ' << help << "\n# TYPE " << name << " gauge\n";
}

// Two texts that differ stay different, or a series would be there twice, and the whole file be refused.
std::string labelValue(std::string_view text) {
    std::string value;
    for (const char c : printable(text)) {
        if (c == '\\' || c == '"') {
            value += '\\';
        }
        value += c;
    }
    return value;
}

template <typename Value>
void writeSample(std::ostream& output, std::string_view name, std::initializer_list<Label> labels,
                 Value value) {
    output << name;
    char before = '{';
    for (const auto& [label, text] : labels) {
        output << std::exchange(before, ',') << label << "=\"" << labelValue(text) << '"';
    }
    output << (labels.size() == 0 ? " " : "} ") << value << '\n';
}

template <typename Value>
void writeOnly(std::ostream& output, std::string_view name, std::string_view help, Value value) {
    writeFamily(output, name, help);
    writeSample(output, name, {}, value);
}

// A device as the kernel's list of disks has it.
std::string diskName(std::string_view device) {
    return std::string(device.substr(device.starts_with("/dev/") ? 5 : 0));
}

// A port's WWN as the kernel writes it, without its 0x.
std::string portName(std::string_view wwn) {
    std::string name;
    for (const char c : wwn) {
        if (c != ':') {
            name += static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
        }
    }
    return name;
}

// The devices that lead to a LUN over each transport.
std::map<Tree, Devices> devicesOf(const Model& model, const Lun& lun) {
    std::map<Tree, Devices> devices;
    for (const Sighting& sighting : lun.sightings) {
        const PathView path = describe(model, sighting);
        devices[path.tree].insert(diskName(path.device));
    }
    return devices;
}

// The devices that each FC port of the host leads to.
std::map<std::string, Devices> devicesOfPorts(const Model& model) {
    std::map<std::string, Devices> ports;
    for (const Adapter& adapter : model.fc.adapters) {
        for (const std::string& initiator : adapter.initiators) {
            ports[portName(initiator)];
        }
    }
    for (const FcPath& path : model.fc.paths) {
        ports[portName(path.initiator)].insert(path.device);
    }
    return ports;
}

void writeRun(std::ostream& output, const Model& model, std::optional<std::int64_t> end) {
    writeOnly(
        output, "morvane_run_complete",
        "Whether the log reaches from the beginning of its run to the end; what it does not reach is missing here.",
        model.log.complete && !model.log.beginsInside ? 1 : 0);
    if (model.time) {
        writeOnly(output, "morvane_run_start_timestamp_seconds",
                  "When the run began to load the HBA library, as the log has it.", *model.time);
    }
    if (end) {
        writeOnly(output, "morvane_run_end_timestamp_seconds",
                  "When the run ended: when the log was last written, as its file has it.", *end);
    }
    if (model.time && end && *model.time >= 0 && *model.time <= *end) {
        writeOnly(output, "morvane_run_duration_seconds",
                  "Seconds from the time that the log has to the one that its file has.", *end - *model.time);
    }
}

void writeProblems(std::ostream& output, const Model& model) {
    std::map<ProblemKind, std::size_t> counts;
    for (const Problem& problem : model.problems) {
        counts[problem.kind] += problem.severity == Severity::Problem ? 1 : 0;
    }
    constexpr std::string_view kName = "morvane_problems";
    writeFamily(output, kName, "Problems that the log tells of, notes left out.");
    for (unsigned kind = 0; kind <= static_cast<unsigned>(kLastProblemKind); ++kind) {
        const auto problem = static_cast<ProblemKind>(kind);
        writeSample(output, kName, {{"kind", std::string(name(problem))}}, counts[problem]);
    }
}

void writeLuns(std::ostream& output, const Model& model) {
    writeOnly(output, "morvane_luns", "LUNs that the host sees.", model.luns.size());

    constexpr std::string_view kInfo = "morvane_lun_info";
    writeFamily(output, kInfo, "What a LUN is called; uuid is that of its multipath map.");
    for (const Lun& lun : model.luns) {
        const std::string map = namesOf(lun.page83, lun.facts).multipath;
        writeSample(output, kInfo,
                    {{"identifier", lun.identifier.text},
                     {"vendor", lun.facts.vendor},
                     {"product", lun.facts.product},
                     {"pseudo_device", lun.facts.pseudoDevice},
                     {"uuid", map.empty() ? "" : "mpath-" + map}},
                    1);
    }

    constexpr std::string_view kPaths = "morvane_lun_paths";
    writeFamily(output, kPaths, "Paths of a LUN, one for each disk of the host that leads to it.");
    for (const Lun& lun : model.luns) {
        for (const auto& [tree, devices] : devicesOf(model, lun)) {
            writeSample(output, kPaths,
                        {{"identifier", lun.identifier.text}, {"transport", std::string(name(tree))}},
                        devices.size());
        }
    }

    constexpr std::string_view kPath = "morvane_path_info";
    writeFamily(output, kPath, "The LUN that a disk of the host leads to.");
    for (const Lun& lun : model.luns) {
        for (const auto& [tree, devices] : devicesOf(model, lun)) {
            for (const std::string& device : devices) {
                writeSample(output, kPath,
                            {{"device", device},
                             {"identifier", lun.identifier.text},
                             {"transport", std::string(name(tree))}},
                            1);
            }
        }
    }
}

} // namespace

void writePrometheus(std::ostream& output, const Model& model, std::optional<std::int64_t> end) {
    writeRun(output, model, end);
    writeProblems(output, model);
    writeLuns(output, model);
    constexpr std::string_view kPortPaths = "morvane_fc_port_paths";
    writeFamily(
        output, kPortPaths,
        "Disks below an FC port of the host; the log has those of an adapter below each of its ports.");
    for (const auto& [port, devices] : devicesOfPorts(model)) {
        writeSample(output, kPortPaths, {{"port_name", port}}, devices.size());
    }
    output << "# EOF\n";
}

} // namespace view
