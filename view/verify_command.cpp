#include <cerrno>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <memory>
#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

#include "view/command_line.hpp"
#include "view/command_output.hpp"
#include "view/commands.hpp"
#include "view/input_log.hpp"
#include "view/kernel/block_devices.hpp"
#include "view/kernel/host_tree.hpp"
#include "view/kernel/kernel.hpp"
#include "view/kernel/multipathd.hpp"
#include "view/model/verify.hpp"
#include "view/output_file.hpp"
#include "view/show/escape.hpp"
#include "view/show/html_page.hpp"
#include "view/show/json.hpp"
#include "view/show/text.hpp"
#include "view/trouble.hpp"

namespace view {

namespace {

namespace fs = std::filesystem;

// What morvane-view verify is asked.
struct Request {
    std::string log;       // empty: where Morvane writes it, or where a recording has it
    std::string root;      // of a host's files; empty: this host's
    std::string maps;      // a file with multipathd's list; empty: none, or a recording's
    std::string record;    // a new folder that the files are copied into; empty: none
    bool isForced = false; // whether a log of another host is taken
};

// What was read, and what came of it.
struct Answer {
    std::string log; // the file
    Model model;
    Verification verification;
};

constexpr const char* kLogs = "MorvaneLogs"; // on a host, Morvane's own folder; so named in a recording, too
constexpr const char* kLog = "Morvane.log";
constexpr const char* kMaps = "maps.json";
constexpr std::size_t kMapsLimit = 256U << 20U;

// The file of that name in a recording; empty when it holds none. Nothing but a file of its own counts: what
// is named a file there may be a pipe, or a link to somewhere else.
std::string recorded(const std::string& root, const char* name) {
    const fs::path folder = fs::path(root) / kLogs;
    std::error_code ignored;
    return fs::is_directory(fs::symlink_status(folder, ignored)) &&
                   fs::is_regular_file(fs::symlink_status(folder / name, ignored))
               ? (folder / name).string()
               : std::string();
}

std::string logOf(const Request& request) {
    if (!request.log.empty()) {
        return request.log;
    }
    if (request.root.empty()) {
        return std::string("./") + kLogs + '/' + kLog;
    }
    std::string log = recorded(request.root, kLog);
    if (log.empty()) {
        throw troubleWith(request.root,
                          "holds no MorvaneLogs/Morvane.log; name the log that is to be compared with it");
    }
    return log;
}

// The whole of a file that is not unreasonably large.
std::string contentOf(const std::string& path) {
    errno = 0;
    std::ifstream file(path, std::ios::binary);
    std::istream& input = path == "-" ? std::cin : file;
    if (path != "-" && (!file || fs::is_directory(path))) {
        errno = file ? EISDIR : errno;
        throw systemTrouble(path);
    }
    std::string content;
    for (std::string buffer(1U << 16U, '\0'); input;) {
        input.read(buffer.data(), static_cast<std::streamsize>(buffer.size()));
        content.append(buffer, 0, static_cast<std::size_t>(input.gcount()));
        if (content.size() > kMapsLimit) {
            throw troubleWith(path, "is too large for a list of maps");
        }
    }
    if (input.bad()) {
        throw systemTrouble(path);
    }
    return content;
}

void refuseOtherHost(const Request& request, const Model& model, const std::string& host) {
    if (!request.isForced && !model.host.empty() && !host.empty() && model.host != host) {
        throw Trouble("the log is of host " + printable(model.host) + ", but " +
                      (request.root.empty() ? "this host is " : printable(request.root) + " is of host ") +
                      printable(host) + "; --force compares them all the same");
    }
}

// Copies a file with its time, by which an answer may go.
void copyInto(Recording& recording, const std::string& file, const char* name) {
    recording.addFolder(kLogs);
    const fs::path place = fs::path(recording.path()) / kLogs / name;
    fs::copy_file(file, place);
    fs::last_write_time(place, fs::last_write_time(file));
}

Answer compared(const Request& request) {
    Answer answer;
    answer.log = logOf(request);
    answer.model = openLog(answer.log);
    if (!answer.model.time) {
        answer.model.time = timeWritten(answer.log);
    }
    const std::string mapsFile =
        request.maps.empty() && !request.root.empty() ? recorded(request.root, kMaps) : request.maps;
    std::string mapsText;
    std::vector<ListedMap> maps;
    if (!mapsFile.empty()) {
        mapsText = contentOf(mapsFile);
        try {
            maps = readMaps(mapsText);
        } catch (const std::runtime_error& error) {
            throw troubleWith(mapsFile, error.what());
        }
    }
    const std::string root = request.root.empty() ? "/" : request.root;
    HostTree asIs(root);
    refuseOtherHost(request, answer.model, hostNameOf(asIs));
    std::optional<Recording> recording;
    if (!request.record.empty()) {
        if (answer.log == "-") {
            throw Trouble("a recording needs a log that is a file, not standard input");
        }
        recording.emplace(request.record);
        copyInto(*recording, answer.log, kLog);
        if (!mapsFile.empty()) {
            recording->addFile(std::string(kLogs) + '/' + kMaps, mapsText);
        }
    }
    HostTree tree(root, recording ? &*recording : nullptr);
    try {
        answer.verification = verify(answer.model, readKernel(tree), mapsFile.empty() ? nullptr : &maps);
    } catch (const std::system_error&) {
        throw;
    } catch (const std::runtime_error& error) {
        throw troubleWith(root, error.what());
    }
    return answer;
}

// Reads the log and what the host, or a recording of one, remembers, and compares them. Throws Trouble when
// one of them cannot be read, makes no sense or is of another host.
Answer answerTo(const Request& request) {
    try {
        return compared(request);
    } catch (const Trouble&) {
        throw;
    } catch (const std::runtime_error& error) { // the system's, with the name of a file in it
        throw Trouble(printable(error.what()));
    }
}

int run(const CommandLine& line, const Request& request) {
    const Answer answer = answerTo(request);
    if (!line.page.empty()) {
        nlohmann::ordered_json document = pageOf(answer.model);
        document["verify"] = toJson(answer.verification);
        writeOutput(line.page, {answer.log}, [&](std::ostream& output) { writePage(output, document); });
    }
    if (line.json) {
        std::cout << toJson(answer.verification).dump(2) << '\n';
    } else if (line.page.empty()) {
        writeText(std::cout, answer.verification, outputStyle());
    }
    warnOf(answer.model);
    return answer.verification.findings.empty() ? kExitSame : kExitDifferent;
}

} // namespace

void addVerify(CommandLine& line) {
    const auto request = std::make_shared<Request>();
    CLI::App* command =
        line.addCommand("verify", "compare a log with what the kernel and multipath remember of the devices",
                        [&line, request] { return run(line, *request); });
    command->excludes(line.pageOption);
    command->add_option("LOG", request->log, "the log of this host, - for standard input")->type_name("FILE");
    command->add_option("--root", request->root, "look below DIR, a recording, instead of this host's /")
        ->type_name("DIR");
    command
        ->add_option("--maps", request->maps,
                     "the states of paths, as multipathd show maps json printed them")
        ->type_name("FILE");
    command
        ->add_option("--record", request->record,
                     "copy the files that are read and the log into a new folder")
        ->type_name("DIR");
    command->add_flag("--force", request->isForced, "take a log of another host");
    line.addJson(command);
    line.addPage(command);
}

} // namespace view
