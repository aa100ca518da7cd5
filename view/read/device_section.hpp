#pragma once

#include <string_view>

#include "view/read/draft.hpp"
#include "view/read/inquiry_section.hpp"
#include "view/read/text_matcher.hpp"

namespace view {

// Reads the sections of direct and of logical devices.
class DeviceSection {
public:
    // `inquiry` holds what is known of the disk that is being identified.
    DeviceSection(Draft& draft, InquirySection& inquiry) : mDraft(draft), mInquiry(inquiry) {}

    // Takes a text of Section::Direct or Section::Logical.
    void take(const TextMatch& match);

private:
    void addDirect(const TextMatch& match);
    void addLogical(const TextMatch& match);
    void addUnsupported(std::string_view device);

    Draft& mDraft;
    InquirySection& mInquiry;
};

} // namespace view
