#pragma once

#include <cstdint>
#include <map>
#include <optional>
#include <set>
#include <string>
#include <unordered_set>
#include <utility>
#include <vector>

#include "view/read/draft.hpp"
#include "view/read/inquiry_section.hpp"
#include "view/read/text_matcher.hpp"

namespace view {

// What is known of the adapter under way, the last one of the model.
struct OpenAdapter {
    bool openingSeen = false; // its opening is in the log
    bool treeLineSeen = false;
    std::vector<DeviceFacts> vendorPass; // of its LUNs, in the order of the mapping
    std::size_t identityPass = 0;        // LUNs whose identification has begun, in the same order
    std::map<std::string, std::pair<std::uint64_t, std::string>>
        lunAndTarget; // of devices without vendor data
    std::set<std::pair<std::string, std::string>> unnamed;
    std::vector<UnlistedLun> identified;
    std::map<std::string, std::size_t> identifiedByDevice;
    std::unordered_set<std::string> listed;
    FcPath targetLine; // target fields of the last target line
};

// Reads the Fibre Channel section: adapter by adapter what was found, then what its tree lists of it.
class FcSection {
public:
    // `inquiry` holds what is known of the LUN that is being identified.
    FcSection(Draft& draft, InquirySection& inquiry) : mDraft(draft), mInquiry(inquiry) {}

    // Takes a text of Section::Fc.
    void take(const TextMatch& match);

    // Notes that a device was claimed for the tree: its identification begins.
    void claim() { ++open().identityPass; }

    // Closes the adapter that is open: what was identified and has no line in its tree is left out of it.
    void close();

private:
    void takeMapping(const TextMatch& match);
    void takeTree(const TextMatch& match);
    void addIdentified(const TextMatch& match);
    void addListed(const TextMatch& match);
    void drop(const std::string& device);
    void abandon();
    OpenAdapter& open();
    Adapter& adapter();

    Draft& mDraft;
    InquirySection& mInquiry;
    std::optional<OpenAdapter> mOpen;
    std::string mCause; // why the library or the adapter under way failed
    std::set<std::string> mNotUnderPowerPath;
};

} // namespace view
