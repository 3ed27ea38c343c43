#include "tools/replay/PacedLineReader.h"

#include <errno.h>
#include <poll.h>
#include <unistd.h>

namespace velmora {

namespace {

// A "line" this long without a line end is handed over as it is rather than kept growing.
constexpr size_t kMaxLine = 64 * 1024;

}  // namespace

PacedLineReader::PacedLineReader(int fd, std::function<void()> tick, int tickMs)
    : mFd(fd), mTick(std::move(tick)), mTickMs(tickMs) {}

bool PacedLineReader::takeLine(std::string* line) {
    const size_t end = mPending.find('\n');
    if (end == std::string::npos) {
        if (mPending.size() > kMaxLine) {  // no line end in sight: hand it over as it is
            line->swap(mPending);
            mPending.clear();
            return true;
        }
        if (!mEof || mPending.empty()) {
            return false;
        }
        *line = mPending;
        mPending.clear();
        return true;
    }
    line->assign(mPending, 0, end);
    mPending.erase(0, end + 1);
    return true;
}

bool PacedLineReader::next(std::string* line, const std::function<bool()>& stop) {
    for (;;) {
        if (takeLine(line)) {
            return true;
        }
        if (mEof || stop()) {
            return false;
        }
        struct pollfd pfd = {mFd, POLLIN, 0};
        const int ready = poll(&pfd, 1, mTickMs);
        if (ready < 0 && errno != EINTR) {
            return false;
        }
        if (ready <= 0) {
            mTick();
            continue;
        }
        char buffer[4096];
        const ssize_t n = read(mFd, buffer, sizeof(buffer));
        if (n < 0 && errno == EINTR) {
            continue;
        }
        if (n <= 0) {
            mEof = true;
            continue;
        }
        mPending.append(buffer, static_cast<size_t>(n));
    }
}

}  // namespace velmora
