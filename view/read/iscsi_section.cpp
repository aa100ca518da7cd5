#include "view/read/iscsi_section.hpp"

#include "view/read/fields.hpp"

namespace view {

namespace {

constexpr std::string_view kInquiryFailed = ":-( SCSI_Inquiry_Failed"; // stands for an identifier

} // namespace

void IscsiSection::take(const TextMatch& match) {
    const std::string_view first = match.fields[0];
    switch (match.text) {
    case Text::IscsiPipeFailed:
        mCause = "iscsiadm could not be started";
        break;
    case Text::IscsiNoNameFile:
        mCause.clear();
        break;
    case Text::IscsiNoName:
        mDraft.problem(Severity::Note, ProblemKind::IscsiNotConfigured, "ISCSI",
                       "the initiator name file names no initiator; the host's name stands for it");
        break;
    case Text::IscsiStopped:
        stop();
        break;
    case Text::IscsiTarget:
        mSessions.push_back({text(first), {}, mDraft.line, 0});
        break;
    case Text::IscsiPortal:
        addSession(text(first));
        break;
    case Text::IscsiRegister:
        mInquiry.sayLineEnds(mInquiry.device());
        mRegistered = {text(first),
                       text(match.fields[1]),
                       text(match.fields[2]),
                       text(match.fields[3]),
                       mInquiry.device(),
                       toNumber<std::int64_t>(match.fields[4]),
                       {},
                       {}};
        mIdentified[mInquiry.device()] = {mInquiry.chosen(), mInquiry.cause(mInquiry.device()),
                                          mInquiry.takePage83()};
        break;
    case Text::IscsiIgnored:
        mDraft.problem(Severity::Problem, ProblemKind::DeviceIgnored, text(first), ignoredCause());
        break;
    case Text::IscsiInitiatorLine:
        mAbove.initiatorIqn = text(first);
        break;
    case Text::IscsiTargetLine:
        mAbove.targetIqn = text(first);
        break;
    case Text::IscsiAddressLine:
        mAbove.initiatorPort = text(first);
        mAbove.targetAddress = text(match.fields[1]);
        break;
    default:
        addPath(match);
        break;
    }
}

void IscsiSection::claim() {
    if (!mSessions.empty()) {
        ++mSessions.back().disks;
    }
}

void IscsiSection::leave() {
    for (const Session& session : mSessions) {
        if (session.disks == 0) {
            mDraft.line = session.line;
            mDraft.problem(Severity::Note, ProblemKind::SessionWithoutDisks, session.target,
                           "the session" + (session.address.empty() ? "" : " to " + session.address) +
                               " has no disks");
        }
    }
    mSessions.clear();
}

// Notes the address of the session under way, or of a further one to the same target.
void IscsiSection::addSession(const std::string& address) {
    if (!mSessions.empty() && mSessions.back().address.empty()) {
        mSessions.back().address = address;
    } else {
        const std::string target = mSessions.empty() ? std::string() : mSessions.back().target;
        mSessions.push_back({target, address, mDraft.line, 0});
    }
}

void IscsiSection::addPath(const TextMatch& match) {
    IscsiPath path = mAbove;
    path.device = text(match.fields[0]);
    path.lun = toNumber<std::int64_t>(match.fields[1]);
    const auto found = mIdentified.find(path.device);
    const Identified identified = found == mIdentified.end() ? Identified() : found->second;
    path.page83 = identified.page83;
    if (match.fields[2] == kInquiryFailed) {
        path.identifier.kind = IdentifierKind::None;
        mDraft.problem(Severity::Problem, ProblemKind::InquiryFailed,
                       path.device + " (LUN " + std::to_string(path.lun) + " of " + path.targetIqn + ")",
                       "its identifier could not be read: " + identified.cause);
    } else {
        path.identifier = {text(match.fields[2]), identified.kind};
    }
    mDraft.model.iscsi.paths.push_back(std::move(path));
}

void IscsiSection::stop() {
    if (!mCause.empty()) {
        mDraft.endTree(Tree::Iscsi, mCause);
        return;
    }
    mDraft.model.iscsi.state = TreeState::NotConfigured;
    mDraft.problem(
        Severity::Note, ProblemKind::IscsiNotConfigured, "ISCSI",
        "/etc/iscsi/initiatorname.iscsi cannot be read: no open-iscsi on this host, or no permission; "
        "iSCSI disks, if there are any, stand below the direct devices");
}

std::string IscsiSection::ignoredCause() const {
    std::vector<std::string> missing;
    const auto check = [&](const std::string& value, const char* name) {
        if (value.empty() || value == "<empty>") {
            missing.emplace_back(name);
        }
    };
    check(mRegistered.initiatorIqn, "initiator name");
    check(mRegistered.initiatorPort, "initiator address");
    check(mRegistered.targetIqn, "target name");
    check(mRegistered.targetAddress, "target address");
    if (mRegistered.lun < 0) {
        missing.emplace_back("LUN number");
    }
    return "not reported: the session listing does not give its " +
           (missing.empty() ? "path" : join(missing, ", "));
}

} // namespace view
