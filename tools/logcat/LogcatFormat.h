// The text formats of `adb logcat` that the importer reads, and taking one line apart.
//
//   threadtime  11-23 18:09:30.123  1234  1250 I velmora server: velmoraEvent cmdId=4099, ...
//   time        11-23 18:09:30.123 I/velmora server( 1234): velmoraEvent cmdId=4099, ...
//
// Modifiers: "year" (2026-11-23 18:09:30.123), "epoch" (seconds since 1970: 1795457370.123),
// "monotonic" (seconds since boot: 5123.456), "uid" (a uid or user name before the pid:
// " 1000:  1234  1250 I ..." or "I/tag( 1000: 1234)"). Fractions of a second may carry 3 to 9
// digits (the usec and nsec modifiers). The time layout has no thread id.
//
// A value type; parse() keeps no state, so one format may be used from anywhere.
#pragma once

#include <cstdint>
#include <string>

namespace velmora {

// One logcat line taken apart.
struct LogcatRecord {
    int64_t timeUs = 0;  // on the format's clock; a date without year counts from 2000-01-01
    int pid = 0;
    int tid = -1;  // -1 in the time layout, which has no thread id
    char priority = '?';
    std::string tag;
    std::string message;
};

class LogcatFormat {
public:
    enum class Layout { kThreadTime, kTime };
    enum class Clock { kDate, kEpoch, kMonotonic };

    // The format of `line` when it is a logcat line of one of the formats above; false for
    // anything else ("--------- beginning of main", text that is not logcat). A stamp of
    // seconds is an epoch when it is past 2001 (10^9 s), else the time since boot.
    static bool detect(const std::string& line, LogcatFormat* format);

    // Takes `line` apart; false when it is not a line of this format.
    bool parse(const std::string& line, LogcatRecord* record) const;

    // The modifiers as given to `logcat -v`: "threadtime", "time,year,uid", "threadtime,epoch".
    std::string name() const;

    // True when the stamps have no year, so that the importer must see a new year coming.
    bool lacksYear() const { return mClock == Clock::kDate && !mYear; }

    Layout layout() const { return mLayout; }
    Clock clock() const { return mClock; }

private:
    bool parseStamp(const char** cursor, int64_t* timeUs) const;
    bool parseThreadTime(const char* p, LogcatRecord* record) const;
    bool parseTime(const char* p, LogcatRecord* record) const;

    Layout mLayout = Layout::kThreadTime;
    Clock mClock = Clock::kDate;
    bool mYear = false;
    bool mUid = false;
};

}  // namespace velmora
