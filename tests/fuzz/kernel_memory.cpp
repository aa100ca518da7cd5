// What a host remembers of its devices, read by morvane-view as files below a root and compared with a log.
// The input is multipathd's list, up to the first NUL, and then the files of the root: of each its path up to
// a line end, a letter (f file, l link, d folder, p pipe), the length of its content in two bytes, and the
// content.
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <optional>
#include <sstream>
#include <stdexcept>
#include <string>
#include <vector>

#include "tests/fuzz/input.hpp"
#include "view/kernel/block_devices.hpp"
#include "view/kernel/host_tree.hpp"
#include "view/kernel/multipathd.hpp"
#include "view/model/verify.hpp"
#include "view/show/escape.hpp"
#include "view/show/json.hpp"
#include "view/show/text.hpp"

namespace {

namespace fs = std::filesystem;

constexpr std::size_t kMostFiles = 200;
constexpr std::size_t kLongestPath = 400;

// A folder of its own, gone at the end.
class Folder {
public:
    Folder() {
        std::string name = (fs::temp_directory_path() / "kernel_memory.XXXXXX").string();
        require(mkdtemp(name.data()) != nullptr, "no folder can be made");
        mPath = name;
    }
    Folder(const Folder&) = delete;
    Folder& operator=(const Folder&) = delete;
    ~Folder() { fs::remove_all(mPath); }

    [[nodiscard]] const fs::path& path() const { return mPath; }

private:
    fs::path mPath;
};

// Makes one file of the root, where nothing stands in its way.
void makeFile(const fs::path& root, const std::string& name, char kind, const std::string& content) {
    fs::path place = root;
    for (const fs::path& part : fs::path(name).relative_path()) {
        if (part != ".." && part != "." && !part.empty()) {
            if (place != root) {
                mkdir(place.c_str(), 0700);
            }
            if (fs::is_symlink(place)) { // what is made stays below the root
                return;
            }
            place /= part;
        }
    }
    if (place == root) {
        return;
    }
    if (kind == 'l') {
        static_cast<void>(symlink(content.c_str(), place.c_str()) == 0);
    } else if (kind == 'd') {
        mkdir(place.c_str(), 0700);
    } else if (kind == 'p') {
        mkfifo(place.c_str(), 0600);
    } else if (!fs::exists(fs::symlink_status(place))) {
        std::ofstream(place, std::ios::binary) << content;
    }
}

void makeRoot(const fs::path& root, Input& input) {
    for (std::size_t count = 0; count < kMostFiles; ++count) {
        std::string name;
        char letter = 0;
        while ((letter = static_cast<char>(input.byte())) != '\n' && letter != '\0') {
            name += letter;
        }
        if (name.empty()) {
            return;
        }
        const char kind = static_cast<char>(input.byte());
        const std::string content(input.take(input.word()));
        makeFile(root, name.substr(0, kLongestPath), kind,
                 content.substr(0, content.find(kind == 'l' ? '\0' : -1)));
    }
}

// A log of a path of each kind.
view::Model model() {
    const auto page = std::make_shared<const std::vector<std::uint8_t>>(
        std::vector<std::uint8_t>{0, 0x83, 0, 12, 1, 3, 0, 8, 0x50, 0, 0xc5, 0, 0, 0, 0, 1});
    view::Model model;
    model.time = 100;
    view::FcPath fc;
    fc.initiator = "20:00:00:00:00:00:00:01";
    fc.targetPort = "20:00:00:00:00:00:00:02";
    fc.device = "/dev/sda";
    fc.page83 = page;
    model.fc.paths = {fc};
    fc.device = "/dev/sdb";
    fc.lun = 1;
    model.fc.paths.push_back(fc);
    view::IscsiPath iscsi;
    iscsi.targetIqn = "iqn.a";
    iscsi.targetAddress = "10.0.0.1";
    iscsi.device = "/dev/sdc";
    iscsi.page83 = page;
    model.iscsi.paths = {iscsi};
    model.direct.devices = {{"/dev/sdd", {}, page}};
    return model;
}

std::string answer(const fs::path& root, view::Recording* recording,
                   const std::vector<view::ListedMap>* maps) {
    view::HostTree tree(root.string(), recording);
    const view::Verification verification = view::verify(model(), view::readKernel(tree), maps);
    std::ostringstream output;
    view::writeText(output, verification, view::Style::of(false));
    std::string text = output.str();
    text.erase(std::remove(text.begin(), text.end(), '\n'), text.end());
    const auto backslashes = static_cast<std::size_t>(std::count(text.begin(), text.end(), '\\'));
    require(view::printable(text).size() == text.size() + backslashes, "text that is not fit to be shown");
    return view::toJson(verification).dump(); // which throws for what is not UTF-8
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8* data, std::size_t size) {
    const std::string_view all(reinterpret_cast<const char*>(data), size);
    const std::size_t end = std::min(all.find('\0'), size);
    std::optional<std::vector<view::ListedMap>> maps;
    try {
        maps = view::readMaps(all.substr(0, end));
    } catch (const std::runtime_error&) {
        // refused; the rest is compared without it
    }
    const Folder folder;
    const fs::path root = folder.path() / "root";
    const fs::path copy = folder.path() / "copy";
    fs::create_directory(root);
    Input input(data + std::min(end + 1, size), size - std::min(end + 1, size));
    makeRoot(root, input);
    const auto* const listed = maps ? &*maps : nullptr;
    try {
        view::Recording recording(copy.string());
        const std::string first = answer(root, &recording, listed);
        require(answer(copy, nullptr, listed) == first, "a recording that gives another answer");
    } catch (const std::runtime_error&) {
        // no sys/block: no host
    }
    return 0;
}
