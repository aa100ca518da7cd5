#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <utility>
#include <vector>

#include "view/read/draft.hpp"
#include "view/read/inquiry_section.hpp"
#include "view/read/text_matcher.hpp"

namespace view {

// Reads the iSCSI section: the session listing, then the tree.
class IscsiSection {
public:
    // `inquiry` holds what is known of the disk that is being identified.
    IscsiSection(Draft& draft, InquirySection& inquiry) : mDraft(draft), mInquiry(inquiry) {}

    // Takes a text of Section::Iscsi.
    void take(const TextMatch& match);

    // Notes that a disk of the session was claimed for the tree.
    void claim();

    // Ends the section: notes the sessions without disks.
    void leave();

private:
    struct Session {
        std::string target;
        std::string address;
        std::uint64_t line = 0;
        unsigned disks = 0;
    };

    // What was learnt of a disk before its path is reported.
    struct Identified {
        IdentifierKind kind = IdentifierKind::Unknown;
        std::string cause{kNoCause}; // why it has no identifier
        Page83 page83;
    };

    void addSession(const std::string& address);
    void addPath(const TextMatch& match);
    void stop();
    [[nodiscard]] std::string ignoredCause() const;

    Draft& mDraft;
    InquirySection& mInquiry;
    std::vector<Session> mSessions;
    std::string mCause;                            // why the tree was not begun
    IscsiPath mAbove;                              // fields of the lines above a device line
    IscsiPath mRegistered;                         // fields of the last path that was registered
    std::map<std::string, Identified> mIdentified; // by device
};

} // namespace view
