// The device event log of the host: every line the library reports (frequency-limit periods)
// is kept in memory, appended to a file when one is set, and marked on the timeline.
// A report line's wall-clock stamp ("#ARG1:<YYYYMMDDhhmmss,...") is replaced by
// the trace time counted from 2000-01-01 00:00:00 UTC, so that a replay is the same every run.
// The file stays open while it is set, and every line reaches it as it is written.
// Thread safe.
#pragma once

#include <cstdio>
#include <mutex>
#include <string>
#include <vector>

#include "host/time/HostClock.h"
#include "host/record/Timeline.h"

namespace velmora {

class EventLog {
public:
    EventLog(HostClock& clock, Timeline& timeline);
    ~EventLog();
    EventLog(const EventLog&) = delete;
    EventLog& operator=(const EventLog&) = delete;

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
    mutable std::mutex mLock;  // guards the members below and the file
    std::string mPath;
    FILE* mFile = nullptr;  // mPath, open for appending; each line is flushed as written
    std::vector<std::string> mLines;
};

}  // namespace velmora
