#include "host/record/EventLog.h"

#include <cstdarg>
#include <cstdio>
#include <ctime>


namespace velmora {

namespace {

constexpr char kReportPrefix[] = "#ARG1:<";
constexpr size_t kStampDigits = 14;          // YYYYMMDDhhmmss
constexpr time_t kVirtualEpoch = 946684800;  // 2000-01-01 00:00:00 UTC

// `text` with the report stamp replaced by the trace time `ms` past kVirtualEpoch; other lines
// are returned as they are.
std::string restamped(const std::string& text, int64_t ms) {
    const size_t start = sizeof(kReportPrefix) - 1;
    if (text.compare(0, start, kReportPrefix) != 0 || text.size() < start + kStampDigits) {
        return text;
    }
    const time_t when = kVirtualEpoch + static_cast<time_t>(ms / 1000);
    struct tm utc = {};
    gmtime_r(&when, &utc);
    char stamp[32];
    strftime(stamp, sizeof(stamp), "%Y%m%d%H%M%S", &utc);
    std::string out = text;
    out.replace(start, kStampDigits, stamp, kStampDigits);
    return out;
}

}  // namespace

EventLog::EventLog(HostClock& clock, Timeline& timeline) : mClock(clock), mTimeline(timeline) {}

EventLog::~EventLog() {
    if (mFile != nullptr)
        fclose(mFile);
}

bool EventLog::setPath(const std::string& path) {
    std::lock_guard<std::mutex> lock(mLock);
    mPath = path;
    if (mFile != nullptr) {
        fclose(mFile);
        mFile = nullptr;
    }
    if (path.empty()) {
        return true;
    }
    // Truncated now; lines are appended from here on.
    mFile = fopen(path.c_str(), "we");
    return mFile != nullptr;
}

std::string EventLog::path() const {
    std::lock_guard<std::mutex> lock(mLock);
    return mPath;
}

void EventLog::clear() {
    std::lock_guard<std::mutex> lock(mLock);
    mLines.clear();
}

void EventLog::write(int prio, int tag, const std::string& line) {
    const int64_t ms = mClock.nowMs();
    const std::string text = restamped(line, ms);
    mTimeline.recordInstant("report", text);
    std::lock_guard<std::mutex> lock(mLock);
    mLines.push_back(text);
    if (mFile != nullptr) {
        fprintf(mFile, "%lld.%03lld prio=%d tag=%d ", static_cast<long long>(ms / 1000),
                static_cast<long long>(ms % 1000), prio, tag);
        fwrite(text.data(), 1, text.size(), mFile);
        fputc('\n', mFile);
        fflush(mFile);
    }
}

std::vector<std::string> EventLog::lines() const {
    std::lock_guard<std::mutex> lock(mLock);
    return mLines;
}

}  // namespace velmora
