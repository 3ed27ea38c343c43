#include "tests/fakes/LogCapture.h"

#include <android/log.h>

#include <algorithm>
#include <mutex>

namespace velmora {
namespace fake {

namespace {

std::mutex gLock;  // guards gLines
std::vector<LogLine> gLines;

void captureLogger(const struct __android_logger_data* data, const char* message) {
    std::lock_guard<std::mutex> lock(gLock);
    gLines.push_back({data->priority, message != nullptr ? message : ""});
}

}  // namespace

void LogCapture::start() {
    __android_log_set_minimum_priority(ANDROID_LOG_VERBOSE);
    __android_log_set_logger(captureLogger);
    clear();
}

void LogCapture::clear() {
    std::lock_guard<std::mutex> lock(gLock);
    gLines.clear();
}

std::vector<LogLine> LogCapture::lines() {
    std::lock_guard<std::mutex> lock(gLock);
    return gLines;
}

int LogCapture::count(int prio, const std::string& msg) {
    std::lock_guard<std::mutex> lock(gLock);
    return static_cast<int>(std::count_if(gLines.begin(), gLines.end(), [&](const LogLine& line) {
        return line.prio == prio && line.msg == msg;
    }));
}

int LogCapture::countContaining(const std::string& part) {
    std::lock_guard<std::mutex> lock(gLock);
    return static_cast<int>(std::count_if(gLines.begin(), gLines.end(), [&](const LogLine& line) {
        return line.msg.find(part) != std::string::npos;
    }));
}

}  // namespace fake
}  // namespace velmora
