#include "view/input_log.hpp"

#include <cerrno>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <string>

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
            throw troubleWith(path, "the log is empty");
        }
        if (isMostlyKnown(model.log)) {
            return model;
        }
    } catch (const NotALog&) {
        // as one that was read to its end
    }
    throw troubleWith(path, "is not a Morvane log");
}

bool isLog(const std::string& path) {
    constexpr std::size_t kBeginning = 1U << 16U;
    std::ifstream file(path, std::ios::binary);
    std::string beginning(kBeginning, '\0');
    file.read(beginning.data(), static_cast<std::streamsize>(beginning.size()));
    beginning.resize(static_cast<std::size_t>(file.gcount()));
    LogReader reader(path);
    reader.feed(beginning);
    return isMostlyKnown(reader.finish().log);
}

} // namespace view
