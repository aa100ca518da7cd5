// floor RECORDING LOG stdio|bytes: the floors under a run. Issues the recorded run's commands in their order
// and writes its log, and does nothing else: as one fprintf call a text, without a flush (stdio), or as the
// bytes that they come to, with one write between two commands (bytes). Prints the CPU seconds that the
// preparation took (the reading of the recording, and for bytes the formatting), which are no part of the
// floor.
#include <fcntl.h>
#include <scsi/sg.h>
#include <sys/ioctl.h>
#include <sys/resource.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include "tests/bench/recording.hpp"

namespace {

double cpuSeconds() {
    rusage usage{};
    getrusage(RUSAGE_SELF, &usage);
    return static_cast<double>(usage.ru_utime.tv_sec + usage.ru_stime.tv_sec) +
           static_cast<double>(usage.ru_utime.tv_usec + usage.ru_stime.tv_usec) / 1e6;
}

[[noreturn]] void fail(const char* what) {
    std::perror(what);
    std::exit(1);
}

template <typename Number>
Number take(const char*& position) {
    Number number{};
    std::memcpy(&number, position, sizeof number);
    position += sizeof number;
    return number;
}

#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wformat-nonliteral" // the formats are the recording's

// All arguments that are there and some that are not, which a format does not look at.
void print(std::FILE* log, const char*& position, const char* texts) {
    const auto count = take<std::uint8_t>(position);
    const char* const format = texts + take<std::uint32_t>(position);
    const auto mask = take<std::uint8_t>(position);
    if (count == 0) {
        std::fprintf(log, format, 0);
        return;
    }
    std::uint64_t values[kMostArguments] = {};
    for (unsigned i = 0; i < count; ++i) {
        values[i] = take<std::uint64_t>(position);
        if ((mask >> i & 1) != 0) {
            values[i] += reinterpret_cast<std::uint64_t>(texts);
        }
    }
    std::fprintf(log, format, values[0], values[1], values[2], values[3], values[4], values[5]);
}

void printDoubles(std::FILE* log, const char*& position, const char* texts) {
    const auto count = take<std::uint8_t>(position);
    const char* const format = texts + take<std::uint32_t>(position);
    double values[kMostArguments] = {};
    for (unsigned i = 0; i < count; ++i) {
        values[i] = take<double>(position);
    }
    std::fprintf(log, format, values[0], values[1], values[2], values[3], values[4], values[5]);
}

#pragma GCC diagnostic pop

void sgIo(int fd, const char*& position) {
    static unsigned char sCdb[255];
    static unsigned char sData[65536];
    static unsigned char sSense[32];
    sg_io_hdr header{};
    header.interface_id = 'S';
    header.flags = SG_FLAG_LUN_INHIBIT;
    header.cmd_len = take<std::uint8_t>(position);
    std::memcpy(sCdb, position, header.cmd_len);
    position += header.cmd_len;
    header.cmdp = sCdb;
    header.dxfer_direction = SG_DXFER_FROM_DEV;
    header.dxfer_len = take<std::uint32_t>(position);
    header.dxferp = sData;
    header.mx_sb_len = sizeof sSense;
    header.sbp = sSense;
    header.timeout = 10000;
    if (ioctl(fd, SG_IO, &header) != 0) {
        fail("SG_IO");
    }
}

void replay(const char* position, const char* end, const char* texts, std::FILE* log) {
    int fd = -1;
    while (position < end) {
        switch (take<std::uint8_t>(position)) {
        case kPrint:
            print(log, position, texts);
            break;
        case kPrintDoubles:
            printDoubles(log, position, texts);
            break;
        case kOpen:
            fd = open(texts + take<std::uint32_t>(position), O_RDONLY | O_NONBLOCK);
            break;
        case kClose:
            close(fd);
            break;
        case kSgIo:
            sgIo(fd, position);
            break;
        default:
            std::abort();
        }
    }
}

// The texts of a recording, formatted, between its commands.
std::vector<std::string> formattedTexts(const char* position, const char* end, const char* texts) {
    std::vector<std::string> result;
    char* text = nullptr;
    std::size_t size = 0;
    std::FILE* stream = open_memstream(&text, &size);
    const auto cut = [&] {
        std::fclose(stream);
        result.emplace_back(text, size);
        std::free(text);
        stream = open_memstream(&text, &size);
    };
    while (position < end) {
        switch (take<std::uint8_t>(position)) {
        case kPrint:
            print(stream, position, texts);
            break;
        case kPrintDoubles:
            printDoubles(stream, position, texts);
            break;
        case kOpen:
            position += sizeof(std::uint32_t);
            break;
        case kClose:
            break;
        case kSgIo:
            position += 1 + static_cast<unsigned char>(*position) + sizeof(std::uint32_t);
            cut();
            break;
        default:
            std::abort();
        }
    }
    cut();
    std::fclose(stream);
    std::free(text);
    return result;
}

void writeAll(int fd, const std::string& text) {
    for (std::size_t written = 0; written < text.size();) {
        const ssize_t count = write(fd, text.data() + written, text.size() - written);
        if (count < 0) {
            fail("write");
        }
        written += static_cast<std::size_t>(count);
    }
}

void replayBytes(const char* position, const char* end, const char* texts,
                 const std::vector<std::string>& text, int log) {
    int fd = -1;
    std::size_t next = 0;
    while (position < end) {
        switch (take<std::uint8_t>(position)) {
        case kPrint: {
            const auto count = take<std::uint8_t>(position);
            position += sizeof(std::uint32_t) + 1 + count * sizeof(std::uint64_t);
            break;
        }
        case kPrintDoubles: {
            const auto count = take<std::uint8_t>(position);
            position += sizeof(std::uint32_t) + count * sizeof(double);
            break;
        }
        case kOpen:
            fd = open(texts + take<std::uint32_t>(position), O_RDONLY | O_NONBLOCK);
            break;
        case kClose:
            close(fd);
            break;
        case kSgIo:
            writeAll(log, text[next++]);
            sgIo(fd, position);
            break;
        default:
            std::abort();
        }
    }
    writeAll(log, text[next]);
}

} // namespace

int main(int argc, char** argv) {
    if (argc != 4) {
        return 2;
    }
    const bool isBytes = std::strcmp(argv[3], "bytes") == 0;
    const double start = cpuSeconds();
    const int recording = open(argv[1], O_RDONLY);
    Header header{};
    if (recording < 0 || read(recording, &header, sizeof header) != sizeof header) {
        fail(argv[1]);
    }
    const std::size_t size = header.eventBytes + header.textBytes;
    auto* const content = static_cast<char*>(std::malloc(size));
    for (std::size_t filled = 0; filled < size;) {
        const ssize_t count = read(recording, content + filled, size - filled);
        if (count <= 0) {
            fail(argv[1]);
        }
        filled += static_cast<std::size_t>(count);
    }
    close(recording);
    const char* const end = content + header.eventBytes;
    std::vector<std::string> texts;
    if (isBytes) {
        texts = formattedTexts(content, end, end);
    }
    std::printf("%.6f\n", cpuSeconds() - start);

    std::FILE* const log = std::fopen(argv[2], "w+");
    if (log == nullptr) {
        fail(argv[2]);
    }
    if (isBytes) {
        replayBytes(content, end, end, texts, fileno(log));
    } else {
        replay(content, end, end, log);
    }
    return 0;
}
