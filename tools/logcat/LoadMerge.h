// The load lines of scripts/record-load merged into an imported trace by time.
//
// A load file holds `@T load <id>=<u> ...` lines (u in [0, 1], ids as in the device profile),
// comments and blank lines. Its times are milliseconds on the clock of the log the trace was
// imported from: `logcat -v epoch` (seconds since 1970) or `-v monotonic` (seconds since boot);
// its header `# record-load: clock=epoch|monotonic ...` names the clock, and must match the
// log's. A log with dates (threadtime, time, year) has no clock a load file can share, so it
// takes no load file.
//
// In the trace, a load line goes where its time falls among the calls (before a call at the
// same time), its time made relative to the trace's first call. Lines before the first call
// are folded into one at @0 (the last value of each domain); lines after the last call follow
// it, so the trace runs on until the last sample.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace velmora {

class LoadMerge {
public:
    enum class Clock { kEpoch, kMonotonic };

    // Reads a load file's text; false with a one-line "NAME:LINE: what" error.
    bool read(const std::string& text, const std::string& name, std::string* error);
    // False with a one-line error when the file's header names another clock than `log`.
    bool checkClock(Clock log, std::string* error) const;
    // `trace` (an imported trace, every call line stamped "@ms") with the load lines merged,
    // `firstCallUs` being the log time of the trace's @0.
    std::string merge(const std::string& trace, int64_t firstCallUs) const;

    size_t lines() const { return mSamples.size(); }

private:
    struct Sample {
        int64_t atMs = 0;                                        // on the log's clock
        std::vector<std::pair<std::string, std::string>> loads;  // id, value as written
    };

    bool readLine(const std::string& line, Sample* sample, std::string* what) const;
    static std::string text(int64_t atMs,
                            const std::vector<std::pair<std::string, std::string>>& loads);

    std::string mName;
    std::string mClock;  // from the header; empty when it has none
    int mClockLine = 0;
    std::vector<Sample> mSamples;  // in time order
};

}  // namespace velmora
