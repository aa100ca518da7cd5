#include "view/read/fc_section.hpp"

#include "view/read/fields.hpp"

namespace view {

void FcSection::take(const TextMatch& match) {
    const std::string_view first = match.fields[0];
    switch (match.text) {
    case Text::TimeValues: // those of the library's loading stand first
        if (!mDraft.model.time) {
            mDraft.model.time = toNumber<std::int64_t>(first);
        }
        break;
    case Text::HbaLoadTime:
        mDraft.model.fc.loadMilliseconds = toMilliseconds(first);
        break;
    case Text::FcBuildTime:
        close();
        mDraft.model.fc.buildMilliseconds = toMilliseconds(first);
        break;
    case Text::HbaLoadFailed:
        mCause = "the HBA library could not be loaded: " + text(first);
        break;
    case Text::AdapterNameFailed:
        mCause = "the name of adapter #" + text(first) + " could not be read: " + text(match.fields[1]);
        break;
    case Text::FcHbaError: {
        const std::string cause = mCause.empty() ? text(kNoCause) : mCause;
        close();
        mDraft.endTree(Tree::Fc, cause);
        break;
    }
    case Text::FcError:
        close();
        mDraft.endTree(Tree::Fc, withoutLineEnd(first));
        break;
    case Text::OpeningAdapter:
        close();
        open().openingSeen = true;
        adapter().number = toNumber<std::uint64_t>(first);
        adapter().name = text(match.fields[1]);
        break;
    case Text::OpenAdapterFailed:
        mCause = "the HBA library could not open it";
        break;
    case Text::UnsupportedAdapter:
        adapter().state = AdapterState::Unsupported;
        mDraft.problem(Severity::Note, ProblemKind::AdapterUnsupported, adapter().name,
                       "its HBA library does not support it: " + text(first));
        break;
    case Text::AdapterAttributesFailed:
        mCause = "its attributes could not be read: " + text(first);
        break;
    case Text::NoPorts:
        mCause = "it reports no ports";
        break;
    case Text::PortAttributesFailed:
        mCause = "the attributes of a port could not be read: " + text(first);
        break;
    case Text::AdapterInfo:
        adapter().manufacturer = text(first);
        adapter().model = text(match.fields[1]);
        break;
    case Text::AdapterAbandoned:
        abandon();
        break;
    default:
        takeMapping(match);
        break;
    }
}

void FcSection::takeMapping(const TextMatch& match) {
    const std::string_view first = match.fields[0];
    switch (match.text) {
    case Text::MappingCount:
        adapter().mappingEntries = toNumber<std::uint64_t>(first);
        break;
    case Text::MappingFailed:
    case Text::MappingsFailed:
        mDraft.problem(Severity::Problem, ProblemKind::MappingFailed, adapter().name,
                       "the HBA library did not list its targets, none is reported: " +
                           text(match.fields[match.fieldCount - 1]));
        break;
    case Text::VendorProduct:
        mInquiry.setDevice({});
        open().vendorPass.push_back({text(first), text(match.fields[1]), text(match.fields[2]), {}});
        break;
    case Text::VendorFailed:
        mInquiry.setDevice({});
        open().vendorPass.emplace_back();
        open().lunAndTarget[text(first)] = {toNumber<std::uint64_t>(match.fields[1]), text(match.fields[2])};
        break;
    case Text::LunUnnamed: // written once in each of the two passes over a mapping
        if (open().unnamed.emplace(first, match.fields[1]).second) {
            mDraft.problem(Severity::Problem, ProblemKind::LunUnnamed, "LUN " + text(first),
                           "dropped: target " + text(match.fields[1]) +
                               " offers it, but the host has no device for it");
        }
        break;
    case Text::LunDropped:
        drop(text(first));
        break;
    case Text::LunIdentified:
        addIdentified(match);
        break;
    case Text::PseudoDevice:
        if (!open().identified.empty()) {
            open().identified.back().facts.pseudoDevice = text(match.fields[1]);
        }
        break;
    case Text::NotUnderPowerPath:
        if (mNotUnderPowerPath.insert(text(first)).second) {
            mDraft.problem(Severity::Note, ProblemKind::NotUnderPowerPath, text(first),
                           "PowerPath runs, but does not manage this LUN");
        }
        break;
    default:
        takeTree(match);
        break;
    }
}

void FcSection::takeTree(const TextMatch& match) {
    switch (match.text) {
    case Text::AdapterLine:
        if (mOpen && mOpen->treeLineSeen) { // the opening of the next adapter is missing
            close();
        }
        open().treeLineSeen = true;
        adapter().node = text(match.fields[0]);
        adapter().state = AdapterState::Reported;
        break;
    case Text::InitiatorLine:
        adapter().initiators.push_back(text(match.fields[0]));
        break;
    case Text::TargetLine: {
        FcPath& target = open().targetLine;
        target.targetNode = text(match.fields[0]);
        target.targetPort = text(match.fields[1]);
        target.bus = toNumber<std::uint64_t>(match.fields[2]);
        target.target = toNumber<std::uint64_t>(match.fields[3]);
        break;
    }
    default:
        addListed(match);
        break;
    }
}

void FcSection::addIdentified(const TextMatch& match) {
    OpenAdapter& opened = open();
    const std::string& device = mInquiry.device();
    mInquiry.sayLineEnds(device);
    UnlistedLun lun{device, {text(match.fields[0]), mInquiry.chosen()}, {}, mInquiry.takePage83()};
    if (opened.identityPass > 0 && opened.identityPass <= opened.vendorPass.size()) {
        lun.facts = opened.vendorPass[opened.identityPass - 1];
    }
    opened.identifiedByDevice[device] = opened.identified.size();
    opened.identified.push_back(std::move(lun));
}

// Adds the path of a LUN line. A mapping in which an entry was dropped before the last one is printed with an
// empty slot in the place of the dropped entry and without its last entry; such a slot is no LUN.
void FcSection::addListed(const TextMatch& match) {
    OpenAdapter& opened = open();
    const std::vector<std::string>& initiators = adapter().initiators;
    FcPath path = opened.targetLine;
    path.adapter = mDraft.model.fc.adapters.size() - 1;
    path.initiator = initiators.empty() ? std::string() : initiators.back();
    path.device = text(match.fields[0]);
    path.identifier.text = text(match.fields[1]);
    path.lun = toNumber<std::uint64_t>(match.fields[2]);
    path.fcId = toNumber<std::uint64_t>(match.fields[3]);
    path.fcpLun = text(match.fields[4]);
    const auto known = opened.identifiedByDevice.find(path.device);
    const bool isKnown = known != opened.identifiedByDevice.end();
    if (path.device.empty() || (opened.openingSeen && !isKnown)) {
        return;
    }
    opened.listed.insert(path.device);
    if (isKnown) {
        path.identifier.kind = opened.identified[known->second].identifier.kind;
        path.facts = opened.identified[known->second].facts;
        path.page83 = opened.identified[known->second].page83;
    }
    mDraft.model.fc.paths.push_back(std::move(path));
}

void FcSection::drop(const std::string& device) {
    mInquiry.sayLineEnds(device);
    std::string subject = device;
    if (const auto found = open().lunAndTarget.find(device); found != open().lunAndTarget.end()) {
        subject +=
            " (LUN " + std::to_string(found->second.first) + " of target " + found->second.second + ")";
    }
    mDraft.problem(Severity::Problem, ProblemKind::LunDropped, subject, "dropped: " + mInquiry.cause(device));
}

void FcSection::abandon() {
    mInquiry.sayLineEnds(mInquiry.device());
    const OpenAdapter& opened = open();
    const std::vector<DeviceFacts>& vendors = opened.vendorPass;
    Adapter& failed = adapter();
    failed.state = AdapterState::Failed;
    failed.cause = mCause;
    if (failed.cause.empty() && (mInquiry.hasCause() || opened.identityPass > 0)) {
        const std::string& device = mInquiry.device();
        const std::string lun =
            device.empty() ? "entry " + std::to_string(vendors.size() + 1) + " of its LUNs" : device;
        failed.cause = lun + ": " + mInquiry.cause(device);
        if (opened.identityPass > 0 && opened.identityPass <= vendors.size() &&
            vendors[opened.identityPass - 1].vendor == "NETAPP") {
            failed.cause += "; on a NETAPP device that ends the adapter";
        }
    }
    if (failed.cause.empty()) {
        failed.cause = kNoCause;
    }
    mDraft.problem(Severity::Problem, ProblemKind::AdapterFailed, failed.name,
                   "abandoned, none of its LUNs is reported: " + failed.cause);
}

void FcSection::close() {
    if (!mOpen) {
        return;
    }
    Adapter& closed = adapter();
    for (UnlistedLun& lun : mOpen->identified) {
        if (closed.state == AdapterState::Reported) {
            if (mOpen->listed.contains(lun.device)) {
                continue;
            }
            mDraft.problem(Severity::Problem, ProblemKind::LunLeftOut, lun.device,
                           "identified as " + lun.identifier.text +
                               ", but not listed in the tree: an earlier LUN of the adapter was dropped, and "
                               "the tree lists as many entries as were kept, counted from the first");
        }
        closed.unlisted.push_back(std::move(lun));
    }
    mOpen.reset();
    mCause.clear();
    mInquiry.begin();
    mInquiry.setDevice({});
}

// The record of the adapter that the texts are about; a fresh one, and an adapter, when none is open.
OpenAdapter& FcSection::open() {
    if (!mOpen) {
        mOpen.emplace();
        mDraft.model.fc.adapters.emplace_back();
    }
    return *mOpen;
}

Adapter& FcSection::adapter() {
    open();
    return mDraft.model.fc.adapters.back();
}

} // namespace view
