// Lines from a descriptor for a paced interactive replay: while it waits for the next line it
// calls a tick at a fixed wall-clock interval, so that the simulated device keeps up with the
// wall clock (timed actions expire, the probe worker boosts) while nobody types.
#pragma once

#include <functional>
#include <string>

namespace velmora {

class PacedLineReader {
public:
    PacedLineReader(int fd, std::function<void()> tick, int tickMs);

    // The next line, without its line end. False at the end of the input, on a read error, or
    // once `stop` says so (checked at every tick and when a signal interrupts the wait); a last
    // line without a line end is still returned.
    bool next(std::string* line, const std::function<bool()>& stop);

private:
    bool takeLine(std::string* line);

    int mFd;
    std::function<void()> mTick;
    int mTickMs;
    std::string mPending;  // read but not yet returned
    bool mEof = false;
};

}  // namespace velmora
