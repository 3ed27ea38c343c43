#include "tools/replay/ProgressLine.h"

#include <unistd.h>

namespace velmora {

namespace {
constexpr auto kQuietStart = std::chrono::seconds(1);
constexpr auto kRedraw = std::chrono::milliseconds(200);
}  // namespace

ProgressLine::ProgressLine(FILE* to)
    : mTo(to),
      mTerminal(to != nullptr && isatty(fileno(to)) == 1),
      mStart(Clock::now()),
      mNextDraw(mStart + kQuietStart) {}

void ProgressLine::update(int64_t traceMs, int calls) {
    if (!mTerminal) {
        return;
    }
    const Clock::time_point now = Clock::now();
    if (now < mNextDraw) {
        return;
    }
    mNextDraw = now + kRedraw;
    const double seconds = std::chrono::duration<double>(now - mStart).count();
    fprintf(mTo, "\r\033[Ktrace %lld.%03lld s, %d calls, %.0f calls/s",
            static_cast<long long>(traceMs / 1000), static_cast<long long>(traceMs % 1000), calls,
            seconds > 0 ? calls / seconds : 0.0);
    fflush(mTo);
    mDrawn = true;
}

void ProgressLine::clear() {
    if (mDrawn) {
        fputs("\r\033[K", mTo);
        fflush(mTo);
        mDrawn = false;
    }
}

}  // namespace velmora
