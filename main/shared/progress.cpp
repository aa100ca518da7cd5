#include "main/shared/progress.hpp"

#include <poll.h>
#include <sys/ioctl.h>
#include <unistd.h>

#include <algorithm>
#include <cctype>
#include <cstddef>
#include <cstdio>

namespace {

constexpr std::size_t kUsualColumns = 80;
constexpr char kClearLine[] = "\r\033[K";

bool gIsShown = false;

bool isTerminal() {
    static const bool kIsTerminal = isatty(STDERR_FILENO) == 1;
    return kIsTerminal;
}

std::size_t columns() {
    winsize size{};
    const bool isKnown = ioctl(STDERR_FILENO, TIOCGWINSZ, &size) == 0 && size.ws_col > 1;
    return isKnown ? size.ws_col : kUsualColumns;
}

// Writes to a terminal that takes it now: one that was stopped, or that another job has, would hold up the
// run.
void write(const char* text, std::size_t length) {
    const pid_t foreground = tcgetpgrp(STDERR_FILENO); // -1 on a terminal that is not the run's own
    pollfd terminal = {.fd = STDERR_FILENO, .events = POLLOUT, .revents = 0};
    if ((foreground < 0 || foreground == getpgrp()) && poll(&terminal, 1, 0) == 1 &&
        (terminal.revents & POLLOUT) != 0) {
        static_cast<void>(::write(STDERR_FILENO, text, length) < 0); // nobody is told that nobody can be told
    }
}

} // namespace

void showProgress(const char* tree, const char* what, uint32 number, uint32 count) noexcept {
    if (!isTerminal()) {
        return;
    }
    char line[256] = "\r\033[K";
    constexpr std::size_t kStart = sizeof kClearLine - 1;
    const std::size_t room = std::min(sizeof line - kStart, columns()); // one column less than there are
    int length = count != 0 ? std::snprintf(line + kStart, room, "morvane: %s: %.100s (%u of %u)", tree, what,
                                            number, count)
                            : std::snprintf(line + kStart, room, "morvane: %s: %.100s", tree, what);
    length = std::clamp<int>(length, 0, static_cast<int>(room) - 1);
    std::replace_if(
        line + kStart, line + kStart + length, [](unsigned char c) { return c < 0x20 || c >= 0x7F; }, '?');
    write(line, kStart + static_cast<std::size_t>(length));
    gIsShown = true;
}

void clearProgress() noexcept {
    if (gIsShown) {
        write(kClearLine, sizeof kClearLine - 1);
        gIsShown = false;
    }
}
