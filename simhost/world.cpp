#include "simhost/world.hpp"

#include <fcntl.h>
#include <sys/mount.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <sys/un.h>

#include <algorithm>
#include <array>
#include <fstream>
#include <map>

#include "simhost/adapter_file.hpp"
#include "simhost/adapter_writer.hpp"
#include "simhost/file_descriptor.hpp"

namespace simhost {
namespace {

namespace fs = std::filesystem;

// The new root is built here: the real /sys is the one directory that no simulated host shows, and it is
// there on every Linux machine, so that no directory need be made for the purpose.
const fs::path kBuildRoot = "/sys";

// What Debian's loaders of the word size put for $LIB; the 32-bit ones of multilib and i386 packages.
constexpr std::array kLibraryFolders64 = {"lib/x86_64-linux-gnu", "lib/aarch64-linux-gnu",
                                          "lib/powerpc64le-linux-gnu", "lib/s390x-linux-gnu"};
constexpr std::array kLibraryFolders32 = {"lib32", "lib/i386-linux-gnu"};

fs::path inRoot(const fs::path& path) {
    return kBuildRoot / path.relative_path();
}

void mountAt(const char* source, const fs::path& target, const char* type, unsigned long flags,
             const std::string& options = "") {
    check(::mount(source, target.c_str(), type, flags, options.c_str()), "mounting " + target.string());
}

void bind(const fs::path& source, const fs::path& target) {
    mountAt(source.c_str(), target, nullptr, MS_BIND | MS_REC);
}

void writeFile(const fs::path& path, const Bytes& content) {
    std::ofstream file(path, std::ios::binary | std::ios::trunc);
    file.write(content.data(), static_cast<std::streamsize>(content.size()));
    file.close();
    if (!file) {
        throw std::system_error(errno, std::generic_category(), "writing " + path.string());
    }
}

void makeSpecial(const fs::path& path, mode_t kind) {
    check(::mknod(path.c_str(), kind | 0600, 0), "making " + path.string());
}

// ---- The real machine's part ----

// Binds the real root's directories, but those that the simulated host replaces.
void bindRealDirectories() {
    for (const fs::directory_entry& entry : fs::directory_iterator("/")) {
        const fs::path name = entry.path().filename();
        if (name == "dev" || name == "proc" || name == "sys" || name == ".simhost") {
            continue;
        }
        if (entry.is_symlink()) {
            fs::copy_symlink(entry.path(), kBuildRoot / name);
        } else if (entry.is_directory()) {
            fs::create_directory(kBuildRoot / name);
            bind(entry.path(), kBuildRoot / name);
        } else if (entry.is_regular_file()) {
            writeFile(kBuildRoot / name, {});
            bind(entry.path(), kBuildRoot / name);
        }
    }
}

// Lets files of a real directory be added, changed and removed in the simulated host alone. Returns where the
// changed ones are kept.
fs::path coverDirectory(const fs::path& directory, const fs::path& layers) {
    std::string name = directory.relative_path().string();
    std::replace(name.begin(), name.end(), '/', '-');
    fs::path upper = layers / name / "changed";
    const fs::path work = layers / name / "work";
    fs::create_directories(upper);
    fs::create_directories(work);
    fs::permissions(upper, fs::status(directory).permissions());
    mountAt("overlay", inRoot(directory), "overlay", 0,
            "lowerdir=" + directory.string() + ",upperdir=" + upper.string() + ",workdir=" + work.string());
    return upper;
}

// ---- The described part ----

void makeDevices(const std::vector<Disk>& disks) {
    const fs::path dev = kBuildRoot / "dev";
    fs::create_directories(dev / "shm");
    for (const char* name : {"null", "zero", "full", "random", "urandom", "tty"}) {
        writeFile(dev / name, {});
        bind(fs::path("/dev") / name, dev / name);
    }
    fs::create_symlink("/proc/self/fd", dev / "fd");
    fs::create_symlink("/proc/self/fd/0", dev / "stdin");
    fs::create_symlink("/proc/self/fd/1", dev / "stdout");
    fs::create_symlink("/proc/self/fd/2", dev / "stderr");
    for (const Disk& disk : disks) {
        for (const std::string& node : disk.nodes) {
            if (disk.open == Disk::Open::NoEntry) {
                continue;
            }
            const fs::path path = inRoot(node);
            if (fs::exists(fs::symlink_status(path))) {
                throw std::system_error(EEXIST, std::generic_category(), node);
            }
            fs::create_directories(path.parent_path());
            if (disk.open == Disk::Open::Succeeds) {
                makeSpecial(path, S_IFREG); // commands to it are answered before the kernel looks at its kind
            } else if (disk.open == Disk::Open::NoDevice) {
                makeSpecial(path, S_IFSOCK); // open() fails as for a node without a driver
            } else {
                fs::create_symlink(path.filename(), path);
            }
        }
    }
}

void makeBlockEntry(const fs::path& directory, const BlockEntry& entry) {
    const fs::path path = directory / entry.name;
    switch (entry.kind) {
    case BlockEntry::Kind::Link:
        check(::symlink(entry.target.c_str(), path.c_str()), "making " + path.string());
        return;
    case BlockEntry::Kind::DirectoryWithDevice:
        fs::create_directory(path);
        check(::symlink(entry.target.c_str(), (path / "device").c_str()),
              "making " + path.string() + "/device");
        return;
    case BlockEntry::Kind::Directory:
        fs::create_directory(path);
        return;
    case BlockEntry::Kind::File:
        makeSpecial(path, S_IFREG);
        return;
    case BlockEntry::Kind::Fifo:
        makeSpecial(path, S_IFIFO);
        return;
    case BlockEntry::Kind::Socket:
        makeSpecial(path, S_IFSOCK);
        return;
    }
}

// Fills /sys/block so that it is read in the described order: tmpfs lists the newest entry first on some
// kernels and the oldest on others.
void makeSysBlock(const std::vector<BlockEntry>& entries) {
    const fs::path directory = kBuildRoot / "sys/block";
    fs::create_directories(directory);
    if (entries.empty()) {
        return;
    }
    for (const BlockEntry& entry : entries) {
        makeBlockEntry(directory, entry);
    }
    if (fs::directory_iterator(directory)->path().filename() == entries.front().name) {
        return;
    }
    fs::remove_all(directory);
    fs::create_directory(directory);
    const std::vector<BlockEntry> reversed(entries.rbegin(), entries.rend());
    for (const BlockEntry& entry : reversed) {
        makeBlockEntry(directory, entry);
    }
}

void makeFile(const fs::path& path, const File& file, const fs::path& placeHolder) {
    const fs::path target = inRoot(path);
    const bool inProc = path.string().rfind("/proc/", 0) == 0; // covered, as it cannot be removed
    if (!inProc) {
        fs::remove(target);
        if (file.kind == File::Kind::Missing) {
            return;
        }
        fs::create_directories(target.parent_path());
    }
    switch (file.kind) {
    case File::Kind::Content:
        writeFile(inProc ? placeHolder : target, file.content);
        if (inProc) {
            bind(placeHolder, target);
        }
        return;
    case File::Kind::OpenError:
        makeSpecial(inProc ? placeHolder : target, S_IFSOCK); // open() fails with ENXIO
        if (inProc) {
            bind(placeHolder, target);
        }
        return;
    case File::Kind::ReadError:
        if (!inProc) {
            writeFile(target, {});
        }
        bind(kBuildRoot / "proc/1/mem", target); // address 0 of the first process: EIO
        return;
    case File::Kind::Link:
        fs::create_symlink(file.content, target);
        return;
    case File::Kind::Missing:
        return;
    }
}

// Lays down what a command answers: a directory a call, and the number of calls so far.
void makeCommand(const fs::path& path, const std::vector<CommandAnswer>& answers, const fs::path& directory) {
    fs::create_directories(directory);
    for (std::size_t i = 0; i < answers.size(); ++i) {
        const fs::path call = directory / std::to_string(i);
        fs::create_directory(call);
        writeFile(call / "output", answers[i].output);
        writeFile(call / "error", answers[i].error);
        writeFile(call / "status", std::to_string(answers[i].status));
    }
    writeFile(directory / "answers", std::to_string(answers.size()));
    writeFile(directory / "calls", "0");
    fs::create_symlink("/.simhost/command", inRoot(path));
}

void bindFile(const fs::path& source, const fs::path& target) {
    fs::create_directories(target.parent_path());
    writeFile(target, {});
    bind(source, target);
}

// Copies regular files, directories and links; other files of the host cannot be kept.
void copyTree(const fs::path& from, const fs::path& to) {
    fs::create_directories(to);
    for (const fs::directory_entry& entry : fs::directory_iterator(from)) {
        const fs::path target = to / entry.path().filename();
        const fs::file_type type =
            fs::symlink_status(entry.path()).type(); // the entry itself tells what is below a mount
        if (type == fs::file_type::directory) {
            copyTree(entry.path(), target);
            continue;
        }
        fs::remove(target);
        if (type == fs::file_type::symlink) {
            fs::copy_symlink(entry.path(), target);
        } else if (type == fs::file_type::regular) {
            fs::copy_file(entry.path(), target);
        }
    }
}

} // namespace

void enterWorld(const Host& host, const Helpers& helpers, const fs::path& record, const fs::path& keep) {
    const fs::path workingDirectory = fs::current_path();
    mountAt(nullptr, "/", nullptr, MS_REC | MS_PRIVATE);
    mountAt("simhost", kBuildRoot, "tmpfs", 0, "mode=755");
    bindRealDirectories();

    const fs::path own = kBuildRoot / ".simhost"; // what only the helpers look at
    const fs::path layers = own / "layers";
    std::map<fs::path, fs::path> covered; // directory → its changed files
    covered["/etc"];
    for (const char* command : kCommandPaths) {
        covered[fs::canonical(fs::path(command).parent_path())];
    }
    for (auto& [directory, changed] : covered) {
        changed = coverDirectory(directory, layers);
    }

    makeDevices(host.disks);
    fs::create_directory(kBuildRoot / "sys");
    if (host.sysBlock) {
        makeSysBlock(*host.sysBlock);
    }
    fs::create_directory(kBuildRoot / "proc");
    mountAt("proc", kBuildRoot / "proc", "proc", 0);

    fs::remove(inRoot("/etc/hba.conf"));
    fs::remove(inRoot("/etc/iscsi/initiatorname.iscsi"));
    for (const auto& [path, file] : host.files) {
        makeFile(path, file, own / "partitions");
    }

    for (const char* command : kCommandPaths) {
        fs::remove(inRoot(command));
    }
    for (const auto& [path, answers] : host.commands) {
        makeCommand(path, answers, own / "commands" / fs::path(path).filename());
    }
    bindFile(helpers.command, own / "command");

    if (host.vendorLibrary) {
        writeFile(inRoot(kAdapterFilePath), adapterFile(*host.vendorLibrary, host.adapters));
        for (const char* folder : kLibraryFolders64) {
            bindFile(helpers.vendorLibrary64, own / folder / "libsimhba.so");
        }
        if (fs::exists(helpers.vendorLibrary32)) {
            for (const char* folder : kLibraryFolders32) {
                bindFile(helpers.vendorLibrary32, own / folder / "libsimhba.so");
            }
        }
    }
    if (!record.empty()) {
        bindFile(record, own / "record");
    }
    if (!keep.empty()) {
        for (const char* part : {"dev", "sys", ".simhost/commands"}) {
            if (fs::exists(kBuildRoot / part)) {
                copyTree(kBuildRoot / part, keep / fs::path(part).filename());
            }
        }
        for (const auto& [directory, changed] : covered) {
            copyTree(changed, keep / directory.relative_path());
        }
        if (host.vendorLibrary) {
            fs::copy_file(inRoot(kAdapterFilePath), keep / "adapters", fs::copy_options::overwrite_existing);
        }
    }

    check(::sethostname(host.hostName.data(), host.hostName.size()), "setting the host name");
    fs::current_path(kBuildRoot);
    check(::syscall(SYS_pivot_root, ".", "."), "changing the root"); // the old root now covers the new one
    check(::umount2(".", MNT_DETACH), "leaving the old root");
    fs::current_path(workingDirectory);
}

} // namespace simhost
