// The device event log of the host: every line the library reports (frequency-limit periods)
// is kept in memory, appended to a file when one is set, and marked on the timeline.
// A report line's wall-clock stamp ("#ARG1:<YYYYMMDDhhmmss,...") is replaced by
// the trace time counted from 2000-01-01 00:00:00 UTC, so that a replay is the same every run.
// Thread safe.
#pragma once

#include <mutex>
#include <string>
#include <vector>

#include "host/time/HostClock.h"
#include "host/record/Timeline.h"

namespace velmora {

class EventLog {
public:
    EventLog(HostClock& clock, Timeline& timeline);

    // Appends later lines to `path` ("" for none); truncates the file. False when it cannot
    // be opened.
    bool setPath(const std::string& path);
    std::string path() const;
    void clear();

    // Records one line with its priority and event tag (restamped with the trace time).
    void write(int prio, int tag, const std::string& text);
    std::vector<std::string> lines() const;

private:
    HostClock& mClock;
    Timeline& mTimeline;
    mutable std::mutex mLock;  // guards both members and the file
    std::string mPath;
    std::vector<std::string> mLines;
};

}  // namespace velmora
