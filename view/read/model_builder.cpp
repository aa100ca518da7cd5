#include "view/read/model_builder.hpp"

#include <charconv>
#include <limits>
#include <system_error>

namespace view {

namespace {

// At most three texts tell why an identification failed: of page 0x83, of the standard data, of a stale
// entry. Bytes that only look like a log may hold any number of them, and every device would repeat them all.
constexpr std::size_t maximumCauses = 4;

constexpr std::string_view inquiryFailedIdentifier = ":-( SCSI_Inquiry_Failed";

template <typename Number>
Number toNumber(std::string_view digits) {
    Number number = 0;
    const auto [end, error] = std::from_chars(digits.data(), digits.data() + digits.size(), number);
    return error == std::errc::result_out_of_range ? std::numeric_limits<Number>::max() : number;
}

std::string text(std::string_view field) {
    return std::string(field);
}

std::string withoutLineEnd(std::string_view message) {
    while (message.ends_with('\n')) {
        message.remove_suffix(1);
    }
    return std::string(message);
}

std::string join(const std::vector<std::string>& parts, std::string_view between) {
    std::string joined;
    for (const std::string& part : parts) {
        joined += joined.empty() ? part : std::string(between) + part;
    }
    return joined;
}

// The name SAM gives a SCSI status code.
std::string scsiStatusName(unsigned code) {
    switch (code) {
    case 0x08:
        return "BUSY";
    case 0x18:
        return "RESERVATION CONFLICT";
    case 0x28:
        return "TASK SET FULL";
    case 0x30:
        return "ACA ACTIVE";
    case 0x40:
        return "TASK ABORTED";
    default:
        return std::to_string(code);
    }
}

std::string errorName(int number) {
    return "errno " + std::to_string(number) + ", " + std::system_category().message(number);
}

constexpr std::string_view timedOut = "time-out"; // said by the causes themselves
constexpr std::string_view noCause = "the log gives no cause";

} // namespace

void ModelBuilder::take(const TextMatch& match, std::uint64_t line) {
    line_ = line;
    if (match.text == Text::RunStart) {
        beginRun();
        return;
    }
    if (runs_ == 0 && match.text != Text::Progress) {
        ++textsBeforeRun_;
    }
    if (match.text == Text::TraceEntry) {
        const std::string_view function = match.fields[0];
        if (function == "HA_GetScsiUniqueLunId" || function == "HA_PrintVendorProductId") {
            inquiry_ = {};
        }
        return;
    }
    if (match.text == Text::TraceExit || match.text == Text::Progress || match.text == Text::OpenEnded) {
        return;
    }
    if (ended_) {
        ++leftoverTexts_;
        return;
    }
    takeRun(match) || takeMultipath(match) || takeFcProgress(match) || takeFcMapping(match) ||
        takeFcTree(match) || takeIscsi(match) || takeDevices(match) || takeInquiry(match) || takeScsi(match);
}

Model ModelBuilder::finish(LogFacts facts) {
    if (!ended_) {
        closeAdapter();
        if (!asserted_) {
            const std::string where = tree_ == Tree::Run
                                          ? "before its first section"
                                          : "in the " + std::string(section(tree_)) + " section";
            problem(Severity::Problem, ProblemKind::LogCut, "log",
                    "it ends " + where +
                        ", without the closing banner: the run is still going on or was ended, or the file "
                        "was cut off");
        }
    }
    facts.runs = runs_;
    facts.beginsInside = runs_ == 0;
    facts.complete = ended_;
    facts.leftoverTexts = leftoverTexts_;
    model_.log = std::move(facts);
    return std::move(model_);
}

void ModelBuilder::beginRun() {
    ModelBuilder fresh;
    fresh.line_ = line_;
    fresh.tree_ = Tree::Multipath;
    fresh.runs_ = runs_ + 1;
    fresh.leftoverTexts_ = leftoverTexts_ + (runs_ == 0 ? textsBeforeRun_ : 0);
    *this = std::move(fresh);
}

bool ModelBuilder::takeRun(const TextMatch& match) {
    switch (match.text) {
    case Text::FcBanner:
        enterTree(Tree::Fc);
        return true;
    case Text::IscsiBanner:
        enterTree(Tree::Iscsi);
        return true;
    case Text::DasBanner:
        enterTree(Tree::Direct);
        return true;
    case Text::LogicalBanner:
        enterTree(Tree::Logical);
        return true;
    case Text::RunEnd:
        leaveTree();
        ended_ = true;
        return true;
    case Text::AssertionFailed:
        asserted_ = true;
        problem(Severity::Problem, ProblemKind::AssertionFailed, "run",
                "the program found something that must not be and ended itself: " + text(match.fields[0]));
        return true;
    case Text::TreeEnded: {
        const std::string_view name = match.fields[0];
        const std::string cause = withoutLineEnd(match.fields[1]);
        if (name == "FC" && cause == "There are no adapters on the system") {
            model_.fc.state = TreeState::Built;
            problem(Severity::Note, ProblemKind::NoAdapters, "FC",
                    "the HBA library lists no Fibre Channel adapter");
            return true;
        }
        treeEnded(name == "FC"      ? Tree::Fc
                  : name == "ISCSI" ? Tree::Iscsi
                  : name == "DAS"   ? Tree::Direct
                                    : Tree::Logical,
                  cause);
        return true;
    }
    default:
        return false;
    }
}

bool ModelBuilder::takeMultipath(const TextMatch& match) {
    Multipath& multipath = model_.multipath;
    switch (match.text) {
    case Text::PowerPathCheck:
        checkingDaemon_ = true;
        return true;
    case Text::PowerPathLineCount:
        if (checkingDaemon_ && tree_ == Tree::Multipath && match.fields[0] == "1") {
            problem(Severity::Note, ProblemKind::PowerPathUncertain, "PowerPath",
                    "one emcpd process was found; PowerPath counts as running from two on");
        }
        checkingDaemon_ = false;
        return true;
    case Text::PowerPathNotRunning:
        multipath.state = PowerPathState::NotRunning;
        return true;
    case Text::PowerPathTable:
        multipath.state = PowerPathState::Running;
        return true;
    case Text::PowerPathEntry:
        multipath.devices.push_back({text(match.fields[0]), text(match.fields[1])});
        return true;
    default:
        return false;
    }
}

bool ModelBuilder::takeFcProgress(const TextMatch& match) {
    const std::string_view first = match.fields[0];
    switch (match.text) {
    case Text::HbaLoadTime:
        model_.fc.loadMilliseconds = toNumber<double>(first);
        return true;
    case Text::FcBuildTime:
        closeAdapter();
        model_.fc.buildMilliseconds = toNumber<double>(first);
        return true;
    case Text::HbaLoadFailed:
        fcCause_ = "the HBA library could not be loaded: " + text(first);
        return true;
    case Text::AdapterNameFailed:
        fcCause_ = "the name of adapter #" + text(first) + " could not be read: " + text(match.fields[1]);
        return true;
    case Text::FcHbaError:
        treeEnded(Tree::Fc, fcCause_.empty() ? text(noCause) : fcCause_);
        return true;
    case Text::FcError:
        treeEnded(Tree::Fc, withoutLineEnd(first));
        return true;
    case Text::NoAdapters: // said again, with more, when the tree ends
        return true;
    case Text::OpeningAdapter: {
        closeAdapter();
        Adapter& opened = adapter();
        opened.number = toNumber<std::uint64_t>(first);
        opened.name = text(match.fields[1]);
        adapterSeen_ = true;
        return true;
    }
    case Text::OpenAdapterFailed:
        fcCause_ = "the HBA library could not open it";
        return true;
    case Text::UnsupportedAdapter:
        adapter().state = AdapterState::Unsupported;
        problem(Severity::Note, ProblemKind::AdapterUnsupported, adapter().name,
                "its HBA library does not support it: " + text(first));
        return true;
    case Text::AdapterAttributesFailed:
        fcCause_ = "its attributes could not be read: " + text(first);
        return true;
    case Text::NoPorts:
        fcCause_ = "it reports no ports";
        return true;
    case Text::PortAttributesFailed:
        fcCause_ = "the attributes of a port could not be read: " + text(first);
        return true;
    case Text::AdapterInfo:
        adapter().manufacturer = text(first);
        adapter().model = text(match.fields[1]);
        return true;
    case Text::AdapterAbandoned:
        adapterAbandoned();
        return true;
    default:
        return false;
    }
}

bool ModelBuilder::takeFcMapping(const TextMatch& match) {
    const std::string_view first = match.fields[0];
    switch (match.text) {
    case Text::MappingCount:
        adapter().mappingEntries = toNumber<std::uint64_t>(first);
        return true;
    case Text::MappingFailed:
    case Text::MappingsFailed:
        problem(Severity::Problem, ProblemKind::MappingFailed, adapter().name,
                "the HBA library did not list its targets, none is reported: " +
                    text(match.fields[match.fieldCount - 1]));
        return true;
    case Text::VendorProduct:
        device_.clear();
        vendorPass_.push_back({text(first), text(match.fields[1]), text(match.fields[2]), {}});
        return true;
    case Text::VendorFailed:
        device_.clear();
        vendorPass_.emplace_back();
        lunAndTarget_[text(first)] = {toNumber<std::uint64_t>(match.fields[1]), text(match.fields[2])};
        return true;
    case Text::LunUnnamed: // written once in each of the two passes over a mapping
        if (unnamed_.emplace(first, match.fields[1]).second) {
            problem(Severity::Problem, ProblemKind::LunUnnamed, "LUN " + text(first),
                    "dropped: target " + text(match.fields[1]) +
                        " offers it, but the host has no device for it");
        }
        return true;
    case Text::LunDropped: {
        std::string subject = text(first);
        if (const auto found = lunAndTarget_.find(subject); found != lunAndTarget_.end()) {
            subject +=
                " (LUN " + std::to_string(found->second.first) + " of target " + found->second.second + ")";
        }
        problem(Severity::Problem, ProblemKind::LunDropped, subject, "dropped: " + inquiryCause(first));
        return true;
    }
    case Text::LunIdentified: {
        UnlistedLun lun{device_, {text(first), inquiry_.chosen}, {}};
        if (identityPass_ > 0 && identityPass_ <= vendorPass_.size()) {
            lun.facts = vendorPass_[identityPass_ - 1];
        }
        identifiedByDevice_[device_] = identified_.size();
        identified_.push_back(std::move(lun));
        return true;
    }
    case Text::PseudoDevice:
        if (!identified_.empty()) {
            identified_.back().facts.pseudoDevice = text(match.fields[1]);
        }
        return true;
    case Text::NotUnderPowerPath:
        if (notUnderPowerPath_.insert(text(first)).second) {
            problem(Severity::Note, ProblemKind::NotUnderPowerPath, text(first),
                    "PowerPath runs, but does not manage this LUN");
        }
        return true;
    default:
        return false;
    }
}

bool ModelBuilder::takeFcTree(const TextMatch& match) {
    switch (match.text) {
    case Text::AdapterLine:
        if (treeLineSeen_) { // the opening of the next adapter is missing
            closeAdapter();
        }
        adapter().node = text(match.fields[0]);
        adapter().state = AdapterState::Reported;
        treeLineSeen_ = true;
        return true;
    case Text::InitiatorLine:
        adapter().initiators.push_back(text(match.fields[0]));
        return true;
    case Text::TargetLine:
        targetLine_.targetNode = text(match.fields[0]);
        targetLine_.targetPort = text(match.fields[1]);
        targetLine_.bus = toNumber<std::uint64_t>(match.fields[2]);
        targetLine_.target = toNumber<std::uint64_t>(match.fields[3]);
        return true;
    case Text::LunLine:
        addLun(match);
        return true;
    default:
        return false;
    }
}

// A mapping in which an entry was dropped before the last one is printed with an empty slot in the place of
// the dropped entry and without its last entry; such a slot is no LUN.
void ModelBuilder::addLun(const TextMatch& match) {
    Adapter& reported = adapter();
    FcPath path = targetLine_;
    path.adapter = model_.fc.adapters.size() - 1;
    path.initiator = reported.initiators.empty() ? std::string() : reported.initiators.back();
    path.device = text(match.fields[0]);
    path.identifier.text = text(match.fields[1]);
    path.lun = toNumber<std::uint64_t>(match.fields[2]);
    path.fcId = toNumber<std::uint64_t>(match.fields[3]);
    path.fcpLun = text(match.fields[4]);
    const auto known = identifiedByDevice_.find(path.device);
    const bool isSlot = path.device.empty() || (adapterSeen_ && known == identifiedByDevice_.end());
    if (isSlot) {
        return;
    }
    listed_.insert(path.device);
    if (known != identifiedByDevice_.end()) {
        path.identifier.kind = identified_[known->second].identifier.kind;
        path.facts = identified_[known->second].facts;
    }
    model_.fc.paths.push_back(std::move(path));
}

bool ModelBuilder::takeIscsi(const TextMatch& match) {
    const std::string_view first = match.fields[0];
    switch (match.text) {
    case Text::IscsiPipeFailed:
        iscsiCause_ = "iscsiadm could not be started";
        return true;
    case Text::IscsiNoNameFile:
        iscsiCause_.clear();
        return true;
    case Text::IscsiNoName:
        problem(Severity::Note, ProblemKind::IscsiNotConfigured, "ISCSI",
                "the initiator name file names no initiator; the host's name stands for it");
        return true;
    case Text::IscsiStopped:
        if (!iscsiCause_.empty()) {
            treeEnded(Tree::Iscsi, iscsiCause_);
            return true;
        }
        model_.iscsi.state = TreeState::Ended;
        problem(
            Severity::Note, ProblemKind::IscsiNotConfigured, "ISCSI",
            "/etc/iscsi/initiatorname.iscsi cannot be read: no open-iscsi on this host, or no permission; "
            "iSCSI disks, if there are any, stand below the direct devices");
        return true;
    case Text::IscsiTarget:
        sessions_.push_back({text(first), {}, line_, 0});
        return true;
    case Text::IscsiPortal:
        if (!sessions_.empty() && sessions_.back().address.empty()) {
            sessions_.back().address = text(first);
        } else {
            const std::string target = sessions_.empty() ? std::string() : sessions_.back().target;
            sessions_.push_back({target, text(first), line_, 0});
        }
        return true;
    case Text::IscsiRegister:
        registered_ = {text(first),
                       text(match.fields[1]),
                       text(match.fields[2]),
                       text(match.fields[3]),
                       device_,
                       toNumber<std::int64_t>(match.fields[4]),
                       {}};
        iscsiInquiries_[device_] = {inquiry_.chosen, inquiryCause(device_)};
        return true;
    case Text::IscsiIgnored:
        problem(Severity::Problem, ProblemKind::DeviceIgnored, text(first), ignoredCause());
        return true;
    case Text::IscsiPortEmpty:
        return true;
    case Text::IscsiInitiatorLine:
        iscsiLine_.initiatorIqn = text(first);
        return true;
    case Text::IscsiTargetLine:
        iscsiLine_.targetIqn = text(first);
        return true;
    case Text::IscsiAddressLine:
        iscsiLine_.initiatorPort = text(first);
        iscsiLine_.targetAddress = text(match.fields[1]);
        return true;
    case Text::IscsiDeviceLine: {
        IscsiPath path = iscsiLine_;
        path.device = text(first);
        path.lun = toNumber<std::int64_t>(match.fields[1]);
        const auto inquiry = iscsiInquiries_.find(path.device);
        if (match.fields[2] == inquiryFailedIdentifier) {
            path.identifier.kind = IdentifierKind::None;
            problem(Severity::Problem, ProblemKind::InquiryFailed,
                    path.device + " (LUN " + std::to_string(path.lun) + " of " + path.targetIqn + ")",
                    "its identifier could not be read: " +
                        (inquiry == iscsiInquiries_.end() ? text(noCause) : inquiry->second.second));
        } else {
            path.identifier = {text(match.fields[2]), inquiry == iscsiInquiries_.end()
                                                          ? IdentifierKind::Unknown
                                                          : inquiry->second.first};
        }
        model_.iscsi.paths.push_back(std::move(path));
        return true;
    }
    default:
        return false;
    }
}

bool ModelBuilder::takeDevices(const TextMatch& match) {
    const std::string_view first = match.fields[0];
    switch (match.text) {
    case Text::DeviceRegistered:
        device_ = text(match.fields[1]);
        if (match.fields[2] == "1") {
            ++identityPass_;
        } else if (match.fields[2] == "4" && !sessions_.empty()) {
            ++sessions_.back().disks;
        }
        return true;
    case Text::DeviceIdFailed: // the line after it says whether the device is reported all the same
        device_ = text(first);
        return true;
    case Text::DeviceUnsupported: {
        const bool wrongType = inquiry_.causes.empty() && !inquiry_.pageAsked;
        problem(wrongType ? Severity::Note : Severity::Problem, ProblemKind::DeviceUnsupported, text(first),
                "not reported: " + inquiryCause(first));
        return true;
    }
    case Text::DeviceLine:
        addDirect(match);
        return true;
    case Text::LogicalLine: {
        const std::string_view identifier = match.fields[1];
        const std::string device = text(first);
        const std::string ending = " :: " + device;
        if (identifier.ends_with(ending)) {
            model_.host = text(identifier.substr(0, identifier.size() - ending.size()));
        }
        model_.logical.devices.push_back(device);
        return true;
    }
    case Text::NotADevice:
        problem(Severity::Note, ProblemKind::EntryIgnored, "/sys/block/" + text(first),
                "ignored: neither a link nor a folder");
        return true;
    case Text::PartitionLineInvalid:
        problem(Severity::Note, ProblemKind::EntryIgnored, "/proc/partitions", "a line without a name");
        return true;
    case Text::SysBlockFailed:
    case Text::PartitionsFailed: // the tree says so itself right after
        return true;
    case Text::DasFailed:
        treeEnded(Tree::Direct, "/sys/block could not be opened");
        return true;
    case Text::LogicalFailed:
        treeEnded(Tree::Logical, "/proc/partitions could not be opened or not be read to its end");
        return true;
    default:
        return false;
    }
}

void ModelBuilder::addDirect(const TextMatch& match) {
    DirectDevice direct{text(match.fields[0]), {text(match.fields[1]), inquiry_.chosen}};
    const std::string ending = "::" + direct.device;
    if (direct.identifier.text.ends_with(ending)) {
        direct.identifier.kind = IdentifierKind::HostName;
        model_.host = direct.identifier.text.substr(0, direct.identifier.text.size() - ending.size());
        if (inquiry_.failed) {
            problem(Severity::Note, ProblemKind::InquiryFailed, direct.device,
                    "known by the host's name only: " + inquiryCause(direct.device));
        }
    }
    inquiry_ = {};
    model_.direct.devices.push_back(std::move(direct));
}

bool ModelBuilder::takeInquiry(const TextMatch& match) {
    switch (match.text) {
    case Text::InquiryOpenFailed:
        device_ = text(match.fields[0]);
        inquiryFailure("the device node could not be opened: " + text(match.fields[1]));
        return true;
    case Text::InquiryTypeFailed:
        if (inquiry_.detail.empty()) {
            inquiry_.detail = withoutLineEnd(match.fields[0]);
        }
        inquiryFailure(inquiry_.detail == timedOut ? "the first INQUIRY timed out"
                                                   : "the first INQUIRY failed");
        return true;
    case Text::InquiryPage:
        inquiry_.pageAsked = true;
        return true;
    case Text::FoundNaa:
        inquiry_.found.insert(IdentifierKind::Naa);
        return true;
    case Text::FoundT10:
        inquiry_.found.insert(IdentifierKind::T10);
        return true;
    case Text::FoundEui64:
        inquiry_.found.insert(IdentifierKind::Eui64);
        return true;
    case Text::FoundMd5:
        inquiry_.found.insert(IdentifierKind::Md5);
        return true;
    case Text::FoundScsiName:
        inquiry_.found.insert(IdentifierKind::ScsiName);
        return true;
    case Text::ChosenId: // the enumerators stand in the order of preference
        inquiry_.chosen = inquiry_.found.empty() ? IdentifierKind::Unknown : *inquiry_.found.begin();
        return true;
    case Text::StandardInquiryId:
        inquiry_.chosen = IdentifierKind::StandardInquiry;
        return true;
    case Text::PageNoDescriptor: // the normal end of a walk over the page
        return true;
    case Text::PageMalformed:
        inquiryFailure("page 0x83 is malformed");
        return true;
    case Text::PageStatus:
        inquiryFailure("reading page 0x83 ended with a SCSI error");
        return true;
    case Text::PageIoctl:
        inquiryFailure("reading page 0x83 failed in the kernel");
        return true;
    case Text::PageUnsupported:
        inquiryFailure("the device has no page 0x83", false);
        return true;
    case Text::PageTimeOut:
        inquiryFailure("reading page 0x83 timed out");
        return true;
    case Text::StandardTimeOut:
        inquiryFailure("the standard INQUIRY timed out");
        return true;
    case Text::StandardUnsupported:
        inquiryFailure("the device refused the standard INQUIRY");
        return true;
    case Text::StandardIoctl:
        inquiryFailure("the standard INQUIRY failed in the kernel");
        return true;
    case Text::StandardStatus:
        inquiryFailure("the standard INQUIRY ended with a SCSI error");
        return true;
    case Text::StandardMalformed:
        inquiryFailure("its standard INQUIRY data are malformed");
        return true;
    case Text::StandardUnparsable:
        inquiryFailure("its standard INQUIRY data could not be read");
        return true;
    case Text::StandardExpired:
        inquiryFailure("its entry in the file system is stale");
        return true;
    default:
        return false;
    }
}

bool ModelBuilder::takeScsi(const TextMatch& match) {
    switch (match.text) {
    case Text::ScsiStatus:
        inquiry_.detail = "SCSI status " + scsiStatusName(toNumber<unsigned>(match.fields[1]));
        return true;
    case Text::ScsiSense:
        inquiry_.detail = "CHECK CONDITION";
        return true;
    case Text::ScsiTransport:
        inquiry_.detail = "the transport failed";
        return true;
    case Text::ScsiTimeOut:
        inquiry_.detail = timedOut;
        return true;
    case Text::ScsiIoctl:
        inquiry_.detail = errorName(toNumber<int>(match.fields[0]));
        return true;
    case Text::ScsiInvalidOpcode:
        inquiry_.detail = "ILLEGAL REQUEST, invalid opcode";
        return true;
    case Text::ScsiIllegalRequest:
        inquiry_.detail = "ILLEGAL REQUEST";
        return true;
    default:
        return false;
    }
}

void ModelBuilder::enterTree(Tree tree) {
    leaveTree();
    tree_ = tree;
    stateOf(tree) = TreeState::Begun;
}

void ModelBuilder::leaveTree() {
    if (tree_ == Tree::Fc) {
        closeAdapter();
    }
    if (tree_ == Tree::Iscsi) {
        for (const Session& session : sessions_) {
            if (session.disks == 0) {
                line_ = session.line;
                problem(Severity::Note, ProblemKind::SessionWithoutDisks, session.target,
                        "the session" + (session.address.empty() ? "" : " to " + session.address) +
                            " has no disks");
            }
        }
        sessions_.clear();
    }
    if (tree_ >= Tree::Fc && stateOf(tree_) == TreeState::Begun) {
        stateOf(tree_) = TreeState::Built;
    }
}

TreeState& ModelBuilder::stateOf(Tree tree) {
    switch (tree) {
    case Tree::Fc:
        return model_.fc.state;
    case Tree::Iscsi:
        return model_.iscsi.state;
    case Tree::Direct:
        return model_.direct.state;
    default:
        return model_.logical.state;
    }
}

void ModelBuilder::treeEnded(Tree tree, const std::string& cause) {
    if (tree == Tree::Fc) {
        closeAdapter();
    }
    stateOf(tree) = TreeState::Ended;
    tree_ = tree;
    problem(Severity::Problem, ProblemKind::TreeEnded, std::string(section(tree)),
            "the tree was ended early: " + cause);
}

// The adapter that the texts are about; a new one when none is open.
Adapter& ModelBuilder::adapter() {
    if (!adapterOpen_) {
        adapterOpen_ = true;
        model_.fc.adapters.emplace_back();
    }
    return model_.fc.adapters.back();
}

void ModelBuilder::closeAdapter() {
    if (!adapterOpen_) {
        return;
    }
    Adapter& closed = adapter();
    if (closed.state == AdapterState::Reported) {
        for (UnlistedLun& lun : identified_) {
            if (!listed_.contains(lun.device)) {
                problem(
                    Severity::Problem, ProblemKind::LunLeftOut, lun.device,
                    "identified as " + lun.identifier.text +
                        ", but not listed in the tree: an earlier LUN of the adapter was dropped, and the "
                        "tree lists as many entries as were kept, counted from the first");
                closed.unlisted.push_back(std::move(lun));
            }
        }
    } else {
        closed.unlisted = std::move(identified_);
    }
    adapterOpen_ = false;
    adapterSeen_ = false;
    treeLineSeen_ = false;
    fcCause_.clear();
    device_.clear();
    vendorPass_.clear();
    identityPass_ = 0;
    lunAndTarget_.clear();
    unnamed_.clear();
    identified_.clear();
    identifiedByDevice_.clear();
    listed_.clear();
    inquiry_ = {};
}

void ModelBuilder::adapterAbandoned() {
    Adapter& failed = adapter();
    failed.state = AdapterState::Failed;
    failed.cause = fcCause_;
    if (failed.cause.empty() && (!inquiry_.causes.empty() || identityPass_ > 0)) {
        const std::string lun =
            device_.empty() ? "entry " + std::to_string(vendorPass_.size() + 1) + " of its LUNs" : device_;
        failed.cause = lun + ": " + inquiryCause(device_);
        if (identityPass_ > 0 && identityPass_ <= vendorPass_.size() &&
            vendorPass_[identityPass_ - 1].vendor == "NETAPP") {
            failed.cause += "; on a NETAPP device that ends the adapter";
        }
    }
    if (failed.cause.empty()) {
        failed.cause = noCause;
    }
    problem(Severity::Problem, ProblemKind::AdapterFailed, failed.name,
            "abandoned, none of its LUNs is reported: " + failed.cause);
}

// Notes a cause in the words given, with what the SCSI layer said of the command.
void ModelBuilder::inquiryFailure(std::string_view words, bool isFailure) {
    std::string cause(words);
    if (!inquiry_.detail.empty() && inquiry_.detail != timedOut) {
        cause += " (" + inquiry_.detail + ")";
    }
    inquiry_.detail.clear();
    if (inquiry_.causes.size() < maximumCauses) {
        inquiry_.causes.push_back(std::move(cause));
    }
    inquiry_.failed = inquiry_.failed || isFailure;
}

// Why the device could not be identified. Some refusals leave no text of their own; they are told by what is
// missing.
std::string ModelBuilder::inquiryCause(std::string_view device) const {
    if (!inquiry_.causes.empty()) {
        return join(inquiry_.causes, "; ");
    }
    if (device.find("/sg") != std::string_view::npos) {
        return "an sg node; only disk nodes are read";
    }
    if (!inquiry_.pageAsked) {
        return "its device type is neither disk nor storage array controller";
    }
    return text(noCause);
}

std::string ModelBuilder::ignoredCause() const {
    const auto isMissing = [](const std::string& value) { return value.empty() || value == "<empty>"; };
    std::vector<std::string> missing;
    if (isMissing(registered_.initiatorIqn)) {
        missing.emplace_back("initiator name");
    }
    if (isMissing(registered_.initiatorPort)) {
        missing.emplace_back("initiator address");
    }
    if (isMissing(registered_.targetIqn)) {
        missing.emplace_back("target name");
    }
    if (isMissing(registered_.targetAddress)) {
        missing.emplace_back("target address");
    }
    if (registered_.lun < 0) {
        missing.emplace_back("LUN number");
    }
    return "not reported: the session listing does not give its " +
           (missing.empty() ? "path" : join(missing, ", "));
}

void ModelBuilder::problem(Severity severity, ProblemKind kind, std::string subject, std::string cause) {
    model_.problems.push_back({severity, kind, tree_, std::move(subject), std::move(cause), line_});
}

} // namespace view
