#include "view/trouble.hpp"

#include <cerrno>
#include <system_error>

#include "view/show/escape.hpp"

namespace view {

Trouble troubleWith(const std::string& path, const std::string& reason) {
    return Trouble{printable(path) + ": " + reason};
}

Trouble systemTrouble(const std::string& path) {
    const int error = errno != 0 ? errno : EIO;
    return troubleWith(path, std::system_category().message(error));
}

} // namespace view
