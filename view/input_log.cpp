#include "view/input_log.hpp"

#include <sys/stat.h>

#include <cerrno>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <string>

#include "view/read/log_bytes.hpp"
#include "view/read/log_reader.hpp"
#include "view/trouble.hpp"

namespace view {

namespace {

bool isMostlyKnown(const LogFacts& facts) {
    return facts.knownTexts != 0 && facts.unknownPieces <= facts.knownTexts;
}

Model read(const std::string& path) {
    Model model;
    if (path == "-") {
        model = readLog(std::cin, "standard input");
    } else {
        std::error_code ignored;
        if (std::filesystem::is_directory(path, ignored)) {
            throw troubleWith(path, "is a folder; the log is the file Morvane.log in it");
        }
        errno = 0;
        std::ifstream file(path, std::ios::binary);
        if (!file) {
            throw systemTrouble(path);
        }
        model = readLog(file, path);
        if (file.bad()) {
            throw systemTrouble(path);
        }
    }
    return model;
}

} // namespace

Model openLog(const std::string& path) {
    try {
        Model model = read(path);
        if (model.log.bytes == 0) {
            throw troubleWith(path, model.log.damage.empty()
                                        ? "the log is empty"
                                        : "the compressed file is cut off or damaged (" + model.log.damage +
                                              "): nothing of it could be unpacked");
        }
        if (isMostlyKnown(model.log)) {
            return model;
        }
    } catch (const NotALog&) {
        // as one that was read to its end
    } catch (const UnpacksTooFar&) {
        throw troubleWith(
            path, "unpacks to thousands of times its size, which no log does; it is not read further");
    }
    throw troubleWith(path, "is not a Morvane log");
}

std::optional<std::int64_t> timeWritten(const std::string& path) {
    struct stat facts {};
    if (path == "-" || stat(path.c_str(), &facts) != 0) {
        return std::nullopt;
    }
    return facts.st_mtime;
}

bool isLog(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    LogReader reader(path);
    reader.feed(LogBytes(file).next());
    return isMostlyKnown(reader.finish().log);
}

} // namespace view
