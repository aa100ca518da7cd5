#include "view/show/path_table.hpp"

#include <fnmatch.h>

#include <algorithm>
#include <functional>
#include <unordered_map>
#include <utility>

#include <nlohmann/json.hpp>

#include "view/model/luns.hpp"
#include "view/show/escape.hpp"
#include "view/show/json_values.hpp"
#include "view/show/text_layout.hpp"
#include "view/show/words.hpp"

namespace view {

// The kinds of problems and notes by what they are about, a device or an identifier:
// "lun-left-out,foreign-text".
using ProblemsBySubject = std::unordered_map<std::string, std::string>;

struct PathRow {
    const Model& model;
    const ProblemsBySubject& problems;
    Tree tree;
    const std::string& device;
    const Identifier& identifier;
    const Page83& page83;
    const DeviceFacts& facts;
    const Adapter* adapter; // of FC
    const FcPath* fc;       // null for a LUN that the FC tree does not list
    const IscsiPath* iscsi;
};

namespace {

constexpr std::string_view kSubjectEnd = " (LUN "; // behind a device in the subject of some problems

ProblemsBySubject problemsBySubject(const Model& model) {
    ProblemsBySubject problems;
    for (const Problem& problem : model.problems) {
        std::string& kinds = problems[problem.subject.substr(0, problem.subject.find(kSubjectEnd))];
        kinds += (kinds.empty() ? "" : ",") + std::string(name(problem.kind));
    }
    return problems;
}

// The identifier of the LUN; empty where it has none of its own.
std::string luid(const PathRow& row) {
    const bool isNone =
        row.identifier.kind == IdentifierKind::None || row.identifier.kind == IdentifierKind::HostName;
    return isNone ? std::string() : row.identifier.text;
}

std::string initiator(const PathRow& row) {
    return row.fc != nullptr ? row.fc->initiator : row.iscsi != nullptr ? row.iscsi->initiatorIqn : "";
}

std::string target(const PathRow& row) {
    return row.fc != nullptr ? row.fc->targetPort : row.iscsi != nullptr ? row.iscsi->targetIqn : "";
}

std::string lun(const PathRow& row) {
    return row.fc != nullptr      ? std::to_string(row.fc->lun)
           : row.iscsi != nullptr ? std::to_string(row.iscsi->lun)
                                  : "";
}

Names namesOf(const PathRow& row) {
    return namesOf(row.page83, row.facts);
}

std::string problem(const PathRow& row) {
    std::string kinds;
    const auto add = [&](const std::string& subject) {
        if (const auto found = row.problems.find(subject); found != row.problems.end()) {
            kinds += (kinds.empty() ? "" : ",") + found->second;
        }
    };
    add(row.device);
    if (const std::string identifier = luid(row); !identifier.empty()) {
        add(identifier);
    }
    return kinds;
}

bool isShown(const PathRow& row, const PathQuery& query) {
    return std::all_of(query.filters.begin(), query.filters.end(), [&](const PathFilter& filter) {
        const std::string shown = printable(filter.column->value(row));
        return (fnmatch(filter.pattern.c_str(), shown.c_str(), FNM_NOESCAPE) == 0) == filter.isMatching;
    });
}

// Calls for each row that the query shows.
void forEachRow(const Model& model, const PathQuery& query, const std::function<void(const PathRow&)>& call) {
    static const DeviceFacts kNoFacts; // the log has them of FC alone
    const ProblemsBySubject problems = problemsBySubject(model);
    const auto show = [&](const PathRow& row) {
        if (isShown(row, query)) {
            call(row);
        }
    };
    for (const FcPath& path : model.fc.paths) {
        show({model, problems, Tree::Fc, path.device, path.identifier, path.page83, path.facts,
              &model.fc.adapters[path.adapter], &path, nullptr});
    }
    for (const Adapter& adapter : model.fc.adapters) {
        for (const UnlistedLun& lun : adapter.unlisted) {
            show({model, problems, Tree::Fc, lun.device, lun.identifier, lun.page83, lun.facts, &adapter,
                  nullptr, nullptr});
        }
    }
    for (const IscsiPath& path : model.iscsi.paths) {
        show({model, problems, Tree::Iscsi, path.device, path.identifier, path.page83, kNoFacts, nullptr,
              nullptr, &path});
    }
    for (const DirectDevice& direct : model.direct.devices) {
        show({model, problems, Tree::Direct, direct.device, direct.identifier, direct.page83, kNoFacts,
              nullptr, nullptr, nullptr});
    }
}

nlohmann::ordered_json json(const PathColumn& column, const std::string& value) {
    switch (column.kind) {
    case PathColumn::Kind::Name:
        return nameOrNull(value);
    case PathColumn::Kind::Number:
        return nlohmann::ordered_json::parse(value.empty() ? "null" : value);
    default:
        return textOrNull(value);
    }
}

std::string quoted(const std::string& cell) {
    if (cell.find_first_of(",\"") == std::string::npos) {
        return cell;
    }
    std::string field = "\"";
    for (const char c : cell) {
        field += c;
        field += c == '"' ? "\"" : "";
    }
    return field + '"';
}

} // namespace

const std::vector<PathColumn>& pathColumns() {
    using Kind = PathColumn::Kind;
    using Row = const PathRow&;
    static const std::vector<PathColumn> kColumns = {
        {"device", "the device node", Kind::Text, [](Row row) { return row.device; }},
        {"luid", "the LUN's identifier", Kind::Text, luid},
        {"transport", "fc, iscsi or direct", Kind::Text, [](Row row) { return std::string(name(row.tree)); }},
        {"initiator", "the initiator port's WWN, or its IQN", Kind::Text, initiator},
        {"target", "the target port's WWN, or its IQN", Kind::Text, target},
        {"lun", "the LUN number", Kind::Number, lun},
        {"adapter", "the adapter's name, of FC", Kind::Text,
         [](Row row) { return row.adapter == nullptr ? std::string() : row.adapter->name; }},
        {"address", "the initiator's address, of iSCSI", Kind::Text,
         [](Row row) { return row.iscsi == nullptr ? std::string() : row.iscsi->initiatorPort; }},
        {"portal", "the target's address, of iSCSI", Kind::Text,
         [](Row row) { return row.iscsi == nullptr ? std::string() : row.iscsi->targetAddress; }},
        {"map", "multipath's name for the LUN", Kind::Name, [](Row row) { return namesOf(row).multipath; }},
        {"kernel", "the kernel's name for the LUN", Kind::Name, [](Row row) { return namesOf(row).kernel; }},
        {"pseudo", "PowerPath's device for the LUN", Kind::Text,
         [](Row row) { return row.facts.pseudoDevice; }},
        {"vendor", "the vendor, of FC", Kind::Text, [](Row row) { return row.facts.vendor; }},
        {"product", "the product, of FC", Kind::Text, [](Row row) { return row.facts.product; }},
        {"revision", "the product's revision, of FC", Kind::Text, [](Row row) { return row.facts.revision; }},
        {"problem", "the kinds of problems and notes about the device or its LUN", Kind::Text, problem},
        {"host", "the host's name", Kind::Text, [](Row row) { return row.model.host; }},
    };
    return kColumns;
}

void writePathTable(std::ostream& output, const Model& model, const PathQuery& query) {
    Columns table;
    if (query.hasHeader) {
        std::vector<std::string> cells;
        for (const PathColumn* column : query.columns) {
            cells.emplace_back(column->name);
        }
        table.add(std::move(cells));
    }
    forEachRow(model, query, [&](const PathRow& row) {
        std::vector<std::string> cells;
        for (const PathColumn* column : query.columns) {
            const std::string value = column->value(row);
            cells.push_back(value.empty() ? "-" : printable(value));
        }
        table.add(std::move(cells));
    });
    table.write(output, "");
}

void writePathCsv(std::ostream& output, const Model& model, const PathQuery& query) {
    const auto write = [&](const std::function<std::string(const PathColumn&)>& cell) {
        std::string_view between;
        for (const PathColumn* column : query.columns) {
            output << std::exchange(between, ",") << quoted(cell(*column));
        }
        output << "\r\n";
    };
    if (query.hasHeader) {
        write([](const PathColumn& column) { return std::string(column.name); });
    }
    forEachRow(model, query, [&](const PathRow& row) {
        write([&](const PathColumn& column) { return printable(column.value(row)); });
    });
}

void writePathJsonLines(std::ostream& output, const Model& model, const PathQuery& query) {
    forEachRow(model, query, [&](const PathRow& row) {
        nlohmann::ordered_json object = nlohmann::ordered_json::object();
        for (const PathColumn* column : query.columns) {
            object[std::string(column->name)] = json(*column, column->value(row));
        }
        output << object.dump() << '\n';
    });
}

} // namespace view
