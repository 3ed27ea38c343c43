// One self-updating line on a terminal while a long replay runs: trace time reached, calls done,
// calls per second. Shows nothing before the replay has run about a second, and nothing at all
// when the stream is not a terminal (a pipe or a file gets no trace of it).
#pragma once

#include <chrono>
#include <cstdint>
#include <cstdio>

namespace velmora {

class ProgressLine {
public:
    explicit ProgressLine(FILE* to);

    // After every call; cheap between redraws (one clock read).
    void update(int64_t traceMs, int calls);
    // Removes the line, if one was drawn.
    void clear();

private:
    using Clock = std::chrono::steady_clock;

    FILE* mTo;
    bool mTerminal;
    bool mDrawn = false;
    Clock::time_point mStart;
    Clock::time_point mNextDraw;
};

}  // namespace velmora
