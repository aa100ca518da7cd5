#pragma once

#include <stdexcept>
#include <string>

namespace view {

// What stops the program or one of its logs, in a sentence for its user. Names of files in it are printable.
class Trouble : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

// "PATH: REASON".
Trouble troubleWith(const std::string& path, const std::string& reason);

// The same with the system's text for errno.
Trouble systemTrouble(const std::string& path);

} // namespace view
