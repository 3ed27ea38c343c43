#include "host/EventLog.h"

#include <cstdarg>
#include <cstdio>
#include <fstream>

#include "host/HostEnvironment.h"
#include "platform/PlatformImports.h"

namespace velmora {

namespace {
constexpr size_t kMaxLine = 1024;
}  // namespace

EventLog::EventLog(HostClock& clock, Timeline& timeline) : mClock(clock), mTimeline(timeline) {}

bool EventLog::setPath(const std::string& path) {
    std::lock_guard<std::mutex> lock(mLock);
    mPath = path;
    if (path.empty()) {
        return true;
    }
    std::ofstream file(path, std::ios::trunc);
    return static_cast<bool>(file);
}

std::string EventLog::path() const {
    std::lock_guard<std::mutex> lock(mLock);
    return mPath;
}

void EventLog::clear() {
    std::lock_guard<std::mutex> lock(mLock);
    mLines.clear();
}

void EventLog::write(int prio, int tag, const std::string& text) {
    const int64_t ms = mClock.nowMs();
    mTimeline.recordInstant("report", text);
    std::lock_guard<std::mutex> lock(mLock);
    mLines.push_back(text);
    if (!mPath.empty()) {
        std::ofstream file(mPath, std::ios::app);
        char stamp[64];
        snprintf(stamp, sizeof(stamp), "%lld.%03lld", static_cast<long long>(ms / 1000),
                 static_cast<long long>(ms % 1000));
        file << stamp << " prio=" << prio << " tag=" << tag << " " << text << "\n";
    }
}

std::vector<std::string> EventLog::lines() const {
    std::lock_guard<std::mutex> lock(mLock);
    return mLines;
}

}  // namespace velmora

extern "C" int __zklog_jank_print(int prio, int tag, const char* fmt, ...) {
    if (fmt == nullptr) {
        return -1;
    }
    char line[velmora::kMaxLine];
    va_list args;
    va_start(args, fmt);
    const int n = vsnprintf(line, sizeof(line), fmt, args);
    va_end(args);
    velmora::HostEnvironment::get().eventLog().write(prio, tag, line);
    return n;
}
