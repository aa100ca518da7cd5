// Preloaded into Morvane: records the run (recording.hpp) into the file that MORVANE_RECORDING names.
#include <dlfcn.h>
#include <fcntl.h>
#include <link.h>
#include <scsi/sg.h>
#include <sys/ioctl.h>
#include <unistd.h>

#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <unordered_map>

#include "tests/bench/recording.hpp"

namespace {

class Recorder {
public:
    void number(std::uint64_t value, unsigned bytes) {
        mEvents.append(reinterpret_cast<const char*>(&value), bytes);
    }

    void bytes(const void* data, std::size_t count) { mEvents.append(static_cast<const char*>(data), count); }

    std::uint64_t text(std::string text) {
        text += '\0';
        const auto [entry, isNew] = mOffsets.try_emplace(text, mTexts.size());
        if (isNew) {
            mTexts += text;
        }
        return entry->second;
    }

    void save(const char* path) const {
        const Header header = {mEvents.size(), mTexts.size()};
        std::FILE* const file = std::fopen(path, "w");
        if (file == nullptr || std::fwrite(&header, sizeof header, 1, file) != 1 ||
            std::fwrite(mEvents.data(), 1, mEvents.size(), file) != mEvents.size() ||
            std::fwrite(mTexts.data(), 1, mTexts.size(), file) != mTexts.size() || std::fclose(file) != 0) {
            std::abort();
        }
    }

private:
    std::string mEvents;
    std::string mTexts;
    std::unordered_map<std::string, std::uint64_t> mOffsets;
};

Recorder* gRecorder = nullptr; // null in any program but Morvane
const char* gPath = nullptr;
std::uintptr_t gProgramStart = 0;
std::uintptr_t gProgramEnd = 0;

int findProgram(dl_phdr_info* info, std::size_t /*size*/, void* /*data*/) {
    for (int i = 0; i < info->dlpi_phnum; ++i) {
        const ElfW(Phdr)& segment = info->dlpi_phdr[i];
        if (segment.p_type == PT_LOAD && (segment.p_flags & PF_X) != 0) {
            gProgramStart = info->dlpi_addr + segment.p_vaddr;
            gProgramEnd = gProgramStart + segment.p_memsz;
        }
    }
    return 1; // the program comes first
}

bool isOwnCall(const void* caller) {
    const auto address = reinterpret_cast<std::uintptr_t>(caller);
    return address >= gProgramStart && address < gProgramEnd;
}

__attribute__((constructor)) void begin() {
    gPath = getenv("MORVANE_RECORDING");
    if (gPath != nullptr) {
        unsetenv("LD_PRELOAD");
        gRecorder = new Recorder;
        dl_iterate_phdr(findProgram, nullptr);
    }
}

template <typename Function>
Function* real(Function* /*own*/, const char* name) {
    return reinterpret_cast<Function*>(dlsym(RTLD_NEXT, name));
}

std::string boundedText(const char* text, const char* conversion) {
    const char* const dot = std::strchr(conversion, '.');
    const std::size_t most = dot != nullptr ? std::strtoul(dot + 1, nullptr, 10) : std::string::npos;
    return dot != nullptr ? std::string(text, strnlen(text, most)) : std::string(text);
}

// Morvane's formats hold the conversions %d %u %x %X %c %s %p %lx and %.2f, the last only with its own kind.
void recordPrint(const char* format, va_list arguments) {
    std::uint64_t values[kMostArguments] = {};
    unsigned count = 0;
    unsigned texts = 0;
    bool areDoubles = false;
    for (const char* at = std::strchr(format, '%'); at != nullptr; at = std::strchr(at + 1, '%')) {
        const std::string conversion(at, std::strcspn(at, "duxXcspf%") + 1);
        const std::size_t end = std::strcspn(at + 1, "duxXcspf%") + 1;
        const char kind = at[end];
        const std::string whole(at, end + 1);
        at += end;
        if (kind == '%') {
            continue;
        }
        if (count == kMostArguments) {
            std::abort();
        }
        switch (kind) {
        case 's':
            values[count] = gRecorder->text(boundedText(va_arg(arguments, const char*), whole.c_str()));
            texts |= 1U << count;
            break;
        case 'p':
            values[count] = reinterpret_cast<std::uint64_t>(va_arg(arguments, void*));
            break;
        case 'f': {
            const double value = va_arg(arguments, double);
            std::memcpy(&values[count], &value, sizeof value);
            areDoubles = true;
            break;
        }
        default:
            values[count] = whole.find('l') != std::string::npos ? va_arg(arguments, unsigned long)
                                                                 : va_arg(arguments, unsigned);
        }
        ++count;
    }
    gRecorder->number(areDoubles ? kPrintDoubles : kPrint, 1);
    gRecorder->number(count, 1);
    gRecorder->number(gRecorder->text(format), 4);
    if (!areDoubles) {
        gRecorder->number(texts, 1);
    }
    gRecorder->bytes(values, count * sizeof values[0]);
}

void recordFormat(const char* format, ...) {
    va_list arguments;
    va_start(arguments, format);
    recordPrint(format, arguments);
    va_end(arguments);
}

std::string gGathered; // of texts that Morvane puts together itself

// The length of the text that `gathered` begins with: a byte of a dump, or what ends with a line feed.
std::size_t textLength(const std::string& gathered) {
    constexpr const char* kDigits = "0123456789abcdef";
    if (gathered.rfind("Byte ", 0) == 0) {
        const std::size_t value = gathered.find(": 0x");
        return value == std::string::npos ? value : gathered.find_first_not_of(kDigits, value + 4);
    }
    const std::size_t end = gathered.find('\n');
    return end == std::string::npos ? end : end + 1;
}

// Records a text as the fprintf call that would write it.
void recordText(const std::string& text) {
    unsigned number = 0;
    unsigned value = 0;
    const std::size_t line = text.rfind(" Line ");
    for (const char* const format : {"Entered Function %s Line %u\n", "Left Function %s Line %u\n"}) {
        const std::string before(format, std::strchr(format, '%'));
        if (text.rfind(before, 0) == 0 && line != std::string::npos) {
            const std::string function = text.substr(before.size(), line - before.size());
            recordFormat(format, function.c_str(), std::strtoul(text.c_str() + line + 6, nullptr, 10));
            return;
        }
    }
    // NOLINTBEGIN(cert-err34-c): what does not match is recorded as it stands
    if (std::sscanf(text.c_str(), "Byte %u: 0x%x", &number, &value) == 2) {
        recordFormat("Byte %u: 0x%x", number, value);
    } else if (std::sscanf(text.c_str(), "Going to dump %u bytes", &number) == 1) {
        recordFormat("Going to dump %u bytes\n", number);
        // NOLINTEND(cert-err34-c)
    } else if (text.find('%') == std::string::npos) {
        recordFormat(text.c_str());
    } else {
        recordFormat("%s", text.c_str());
    }
}

// Records what was gathered, before whatever comes behind it.
void recordGathered() {
    while (!gGathered.empty()) {
        const std::string text = gGathered.substr(0, textLength(gGathered));
        gGathered.erase(0, text.size());
        recordText(text);
    }
}

__attribute__((destructor)) void end() {
    if (gRecorder != nullptr) {
        gProgramEnd = 0; // nothing of this counts
        recordGathered();
        gRecorder->save(gPath);
    }
}

bool isDevice(const char* path) {
    return std::strncmp(path, "/dev/", 5) == 0 && std::strcmp(path, "/dev/null") != 0;
}

int gDevice = -1; // the node that is open

} // namespace

extern "C" {

std::size_t fwrite_unlocked(const void* text, std::size_t size, std::size_t count, std::FILE* stream) {
    static auto* const kReal = real(&fwrite_unlocked, "fwrite_unlocked");
    if (isOwnCall(__builtin_return_address(0))) {
        gGathered.append(static_cast<const char*>(text), size * count);
    }
    return kReal(text, size, count, stream);
}

int __vfprintf_chk(std::FILE* stream, int flag, const char* format, va_list arguments) {
    static auto* const kReal = real(&__vfprintf_chk, "__vfprintf_chk");
    if (stream != stdout && isOwnCall(__builtin_return_address(0))) {
        recordGathered();
        va_list copy;
        va_copy(copy, arguments);
        recordPrint(format, copy);
        va_end(copy);
    }
    return kReal(stream, flag, format, arguments);
}

// Morvane creates no file with open, so the mode says nothing.
int open(const char* path, int flags, ...) {
    static auto* const kReal = real(&open, "open");
    const int fd = kReal(path, flags, 0);
    if (fd >= 0 && isDevice(path) && isOwnCall(__builtin_return_address(0))) {
        recordGathered();
        gRecorder->number(kOpen, 1);
        gRecorder->number(gRecorder->text(path), 4);
        gDevice = fd;
    }
    return fd;
}

int close(int fd) {
    static auto* const kReal = real(&close, "close");
    if (fd == gDevice && isOwnCall(__builtin_return_address(0))) {
        recordGathered();
        gRecorder->number(kClose, 1);
        gDevice = -1;
    }
    return kReal(fd);
}

int ioctl(int fd, unsigned long request, ...) noexcept {
    static auto* const kReal = real(&ioctl, "ioctl");
    va_list arguments;
    va_start(arguments, request);
    auto* const header = va_arg(arguments, sg_io_hdr*);
    va_end(arguments);
    if (fd == gDevice && isOwnCall(__builtin_return_address(0))) {
        recordGathered();
        gRecorder->number(kSgIo, 1);
        gRecorder->number(header->cmd_len, 1);
        gRecorder->bytes(header->cmdp, header->cmd_len);
        gRecorder->number(header->dxfer_len, 4);
    }
    return kReal(fd, request, header);
}

} // extern "C"
