#include "view/read/device_section.hpp"

#include <string>
#include <utility>

#include "view/read/fields.hpp"

namespace view {

void DeviceSection::take(const TextMatch& match) {
    const std::string_view first = match.fields[0];
    switch (match.text) {
    case Text::DeviceUnsupported:
        addUnsupported(first);
        break;
    case Text::DeviceLine:
        addDirect(match);
        break;
    case Text::LogicalLine:
        addLogical(match);
        break;
    case Text::NotADevice:
        mDraft.problem(Severity::Note, ProblemKind::EntryIgnored, "/sys/block/" + text(first),
                       "ignored: neither a link nor a folder");
        break;
    case Text::PartitionLineInvalid:
        mDraft.problem(Severity::Note, ProblemKind::EntryIgnored, "/proc/partitions",
                       "a line without a name");
        break;
    case Text::DasFailed:
        mDraft.endTree(Tree::Direct, "/sys/block could not be opened");
        break;
    default:
        mDraft.endTree(Tree::Logical, "/proc/partitions could not be opened or not be read to its end");
        break;
    }
}

void DeviceSection::addDirect(const TextMatch& match) {
    DirectDevice direct{
        text(match.fields[0]), {text(match.fields[1]), mInquiry.chosen()}, mInquiry.takePage83()};
    mInquiry.sayLineEnds(direct.device);
    const std::string ending = "::" + direct.device;
    if (direct.identifier.text.ends_with(ending)) {
        direct.identifier.kind = IdentifierKind::HostName;
        mDraft.model.host = direct.identifier.text.substr(0, direct.identifier.text.size() - ending.size());
        if (mInquiry.hasFailed()) {
            mDraft.problem(mInquiry.isLost() ? Severity::Problem : Severity::Note, ProblemKind::InquiryFailed,
                           direct.device, "known by the host's name only: " + mInquiry.cause(direct.device));
        }
    }
    mInquiry.begin();
    mDraft.model.direct.devices.push_back(std::move(direct));
}

void DeviceSection::addLogical(const TextMatch& match) {
    const std::string_view identifier = match.fields[1];
    std::string device = text(match.fields[0]);
    const std::string ending = " :: " + device;
    if (identifier.ends_with(ending)) {
        mDraft.model.host = text(identifier.substr(0, identifier.size() - ending.size()));
    }
    mDraft.model.logical.devices.push_back(std::move(device));
}

void DeviceSection::addUnsupported(std::string_view device) {
    mInquiry.sayLineEnds(text(device));
    mDraft.problem(mInquiry.isOfWrongType() ? Severity::Note : Severity::Problem,
                   ProblemKind::DeviceUnsupported, text(device), "not reported: " + mInquiry.cause(device));
}

} // namespace view
