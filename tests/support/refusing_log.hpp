// A log that takes no text, as on a full disk.
#pragma once

#include <cerrno>
#include <cstdio>

#include "foundation/log.hpp"

// Stands in for the log while it lives: takes the first `accepted` writes and refuses every later one.
class RefusingLog {
public:
    explicit RefusingLog(int accepted = 0)
        : mPrevious(gLogStream), mAccepted(accepted),
          mStream(
              fopencookie(this, "w", {.read = nullptr, .write = &take, .seek = nullptr, .close = nullptr})) {
        static_cast<void>(std::setvbuf(mStream, nullptr, _IONBF, 0));
        gLogStream = mStream;
    }
    RefusingLog(const RefusingLog&) = delete;
    RefusingLog& operator=(const RefusingLog&) = delete;
    ~RefusingLog() {
        gLogStream = mPrevious;
        static_cast<void>(std::fclose(mStream));
    }

    int refusals() const { return mRefusals; }

private:
    static ssize_t take(void* self, const char* /*text*/, std::size_t size) {
        auto& log = *static_cast<RefusingLog*>(self);
        if (log.mAccepted == 0) {
            ++log.mRefusals;
            errno = ENOSPC;
            return 0;
        }
        --log.mAccepted;
        return static_cast<ssize_t>(size);
    }

    std::FILE* mPrevious;
    int mAccepted;
    int mRefusals = 0;
    std::FILE* mStream;
};
