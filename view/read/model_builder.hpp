#pragma once

#include <cstdint>
#include <map>
#include <set>
#include <string>
#include <string_view>
#include <unordered_set>
#include <utility>
#include <vector>

#include "view/model/model.hpp"
#include "view/read/text_matcher.hpp"

namespace view {

// Turns the texts of a log, in their order, into the model of the last run that begins in it. Report lines
// give the paths and devices; the progress texts between them give the causes of what is missing.
class ModelBuilder {
public:
    // Takes one text, found in line `line` (from 1) of the log.
    void take(const TextMatch& match, std::uint64_t line);

    // Ends the log: closes what is open and returns the model, its log facts filled with `facts` (name,
    // counts) and with what the builder knows itself. The builder is used up.
    Model finish(LogFacts facts);

private:
    // What the SCSI commands since the last identification began have said.
    struct Inquiry {
        std::vector<std::string> causes;
        std::string detail; // of the command under way: why it failed
        bool pageAsked = false;
        bool failed = false; // a cause that is more than a page the device does not have
        std::set<IdentifierKind> found;
        IdentifierKind chosen = IdentifierKind::Unknown;
    };

    struct Session {
        std::string target;
        std::string address;
        std::uint64_t line = 0;
        unsigned disks = 0;
    };

    bool takeRun(const TextMatch& match);
    bool takeMultipath(const TextMatch& match);
    bool takeFcProgress(const TextMatch& match);
    bool takeFcMapping(const TextMatch& match);
    bool takeFcTree(const TextMatch& match);
    bool takeIscsi(const TextMatch& match);
    bool takeDevices(const TextMatch& match);
    bool takeInquiry(const TextMatch& match);
    bool takeScsi(const TextMatch& match);

    void beginRun();
    void enterTree(Tree tree);
    void leaveTree();
    TreeState& stateOf(Tree tree);
    void treeEnded(Tree tree, const std::string& cause);
    void closeAdapter();
    Adapter& adapter();
    void adapterAbandoned();
    void addLun(const TextMatch& match);
    void addDirect(const TextMatch& match);
    void inquiryFailure(std::string_view words, bool isFailure = true);
    [[nodiscard]] std::string inquiryCause(std::string_view device) const;
    [[nodiscard]] std::string ignoredCause() const;
    void problem(Severity severity, ProblemKind kind, std::string subject, std::string cause);

    Model model_;
    std::uint64_t line_ = 0;
    Tree tree_ = Tree::Run;
    bool ended_ = false;
    bool asserted_ = false;
    unsigned runs_ = 0;
    std::uint64_t textsBeforeRun_ = 0;
    std::uint64_t leftoverTexts_ = 0;

    Inquiry inquiry_;
    bool checkingDaemon_ = false;

    // The adapter under way.
    bool adapterOpen_ = false;
    bool adapterSeen_ = false; // its opening is in the log
    std::string fcCause_;
    std::string device_; // being identified
    std::vector<DeviceFacts> vendorPass_;
    std::size_t identityPass_ = 0;
    std::map<std::string, std::pair<std::uint64_t, std::string>>
        lunAndTarget_; // of devices without vendor data
    std::set<std::pair<std::string, std::string>> unnamed_;
    std::vector<UnlistedLun> identified_;
    std::map<std::string, std::size_t, std::less<>> identifiedByDevice_;
    std::unordered_set<std::string> listed_;
    bool treeLineSeen_ = false;
    FcPath targetLine_; // target fields of the last target line
    std::set<std::string> notUnderPowerPath_;

    // The iSCSI listing.
    std::vector<Session> sessions_;
    std::string iscsiCause_;
    IscsiPath iscsiLine_; // fields of the lines above a device line
    IscsiPath registered_;
    std::map<std::string, std::pair<IdentifierKind, std::string>> iscsiInquiries_; // by device
};

} // namespace view
