#include <string>
#include <vector>

#include "view/model/luns.hpp"
#include "view/show/escape.hpp"
#include "view/show/json.hpp"
#include "view/show/json_values.hpp"
#include "view/show/words.hpp"

namespace view {

namespace {

using Json = nlohmann::ordered_json;

template <typename Value>
Json orNull(const std::optional<Value>& value) {
    return value ? Json(*value) : Json();
}

Json identifierJson(const Identifier& identifier) {
    const bool isMissing = identifier.kind == IdentifierKind::None;
    return {{"identifier", isMissing ? Json() : Json(printable(identifier.text))},
            {"identifierKind", name(identifier.kind)}};
}

Json factsJson(const DeviceFacts& facts) {
    return {{"vendor", textOrNull(facts.vendor)},
            {"product", textOrNull(facts.product)},
            {"revision", textOrNull(facts.revision)},
            {"pseudoDevice", textOrNull(facts.pseudoDevice)}};
}

// What other programs call a device; null when the log does not have what it answered to page 83h.
Json namesJson(const Page83& page83, const DeviceFacts& facts) {
    if (page83 == nullptr) {
        return nullptr;
    }
    const Names names = namesOf(page83, facts);
    Json links = Json::array();
    for (const std::string& link : names.links) {
        links.push_back(nameOrNull(link));
    }
    return {{"multipath", nameOrNull(names.multipath)},
            {"kernel", nameOrNull(names.kernel)},
            {"scsiId", nameOrNull(names.scsiId)},
            {"sg3Rules", nameOrNull(names.sg3Rules)},
            {"links", std::move(links)}};
}

Json logJson(const LogFacts& log) {
    Json samples = Json::array();
    for (const UnknownPiece& piece : log.unknownSamples) {
        samples.push_back({{"line", piece.line}, {"text", printable(piece.bytes)}});
    }
    return {{"name", printable(log.name)},
            {"bytes", log.bytes},
            {"lines", log.lines},
            {"texts", log.knownTexts},
            {"gluedTexts", log.gluedTexts},
            {"runs", log.runs},
            {"complete", log.complete},
            {"beginsInside", log.beginsInside},
            {"cutInLine", log.cutInLine},
            {"leftoverTexts", log.leftoverTexts},
            {"unknown", {{"count", log.unknownPieces}, {"samples", samples}}}};
}

Json problemsJson(const Model& model) {
    Json json = Json::array();
    for (const Problem& problem : model.problems) {
        json.push_back({{"severity", name(problem.severity)},
                        {"kind", name(problem.kind)},
                        {"tree", name(problem.tree)},
                        {"subject", printable(problem.subject)},
                        {"cause", printable(problem.cause)},
                        {"line", problem.line == 0 ? Json() : Json(problem.line)}});
    }
    return json;
}

Json multipathJson(const Multipath& multipath) {
    Json devices = Json::array();
    for (const PseudoDevice& device : multipath.devices) {
        devices.push_back({{"ulid", printable(device.ulid)}, {"pseudoDevice", printable(device.name)}});
    }
    return {{"powerPath", name(multipath.state)}, {"devices", devices}};
}

Json adapterJson(const Adapter& adapter) {
    Json unlisted = Json::array();
    for (const UnlistedLun& lun : adapter.unlisted) {
        Json json = {{"device", printable(lun.device)}};
        json.update(identifierJson(lun.identifier));
        json.update(factsJson(lun.facts));
        unlisted.push_back(std::move(json));
    }
    return {{"number", orNull(adapter.number)},
            {"name", printable(adapter.name)},
            {"manufacturer", textOrNull(adapter.manufacturer)},
            {"model", textOrNull(adapter.model)},
            {"node", textOrNull(adapter.node)},
            {"state", name(adapter.state)},
            {"cause", textOrNull(adapter.cause)},
            {"mappingEntries", orNull(adapter.mappingEntries)},
            {"initiators", texts(adapter.initiators)},
            {"unlisted", std::move(unlisted)}};
}

Json fcJson(const FcTree& fc) {
    Json adapters = Json::array();
    for (const Adapter& adapter : fc.adapters) {
        adapters.push_back(adapterJson(adapter));
    }
    Json paths = Json::array();
    for (const FcPath& path : fc.paths) {
        Json json = {{"adapter", path.adapter},
                     {"initiator", printable(path.initiator)},
                     {"targetNode", printable(path.targetNode)},
                     {"targetPort", printable(path.targetPort)},
                     {"bus", path.bus},
                     {"target", path.target},
                     {"device", printable(path.device)},
                     {"lun", path.lun},
                     {"fcId", path.fcId},
                     {"fcpLun", path.fcpLun}};
        json.update(identifierJson(path.identifier));
        json.update(factsJson(path.facts));
        paths.push_back(std::move(json));
    }
    return {{"state", name(fc.state)},
            {"loadMilliseconds", orNull(fc.loadMilliseconds)},
            {"buildMilliseconds", orNull(fc.buildMilliseconds)},
            {"adapters", std::move(adapters)},
            {"paths", std::move(paths)}};
}

Json iscsiJson(const IscsiTree& iscsi) {
    Json paths = Json::array();
    for (const IscsiPath& path : iscsi.paths) {
        Json json = {{"initiatorIqn", printable(path.initiatorIqn)},
                     {"initiatorPort", printable(path.initiatorPort)},
                     {"targetIqn", printable(path.targetIqn)},
                     {"targetAddress", printable(path.targetAddress)},
                     {"device", printable(path.device)},
                     {"lun", path.lun}};
        json.update(identifierJson(path.identifier));
        paths.push_back(std::move(json));
    }
    return {{"state", name(iscsi.state)}, {"paths", std::move(paths)}};
}

Json directJson(const DirectTree& direct) {
    Json devices = Json::array();
    for (const DirectDevice& device : direct.devices) {
        Json json = {{"device", printable(device.device)}};
        json.update(identifierJson(device.identifier));
        json["names"] = namesJson(device.page83, {});
        devices.push_back(std::move(json));
    }
    return {{"state", name(direct.state)}, {"devices", std::move(devices)}};
}

Json lunsJson(const Model& model) {
    Json luns = Json::array();
    for (const Lun& lun : model.luns) {
        Json json = identifierJson(lun.identifier);
        json["unique"] = lun.notUnique.empty();
        json["notUnique"] = textOrNull(lun.notUnique);
        json.update(factsJson(lun.facts));
        json["names"] = namesJson(lun.page83, lun.facts);
        json["pathCount"] = lun.devices.size();
        json["devices"] = texts(lun.devices);
        luns.push_back(std::move(json));
    }
    return luns;
}

} // namespace

nlohmann::ordered_json toJson(const Model& model) {
    return {{"kind", "report"},
            {"host", textOrNull(model.host)},
            {"log", logJson(model.log)},
            {"problems", problemsJson(model)},
            {"luns", lunsJson(model)},
            {"multipath", multipathJson(model.multipath)},
            {"fc", fcJson(model.fc)},
            {"iscsi", iscsiJson(model.iscsi)},
            {"direct", directJson(model.direct)},
            {"logical", {{"state", name(model.logical.state)}, {"devices", texts(model.logical.devices)}}}};
}

} // namespace view
