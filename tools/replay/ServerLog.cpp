#include "tools/replay/ServerLog.h"

#include <android/log.h>

#include <cstdio>
#include <mutex>

namespace velmora {

namespace {

std::mutex gLock;        // guards gFile and gToStderr; the server logs from threads
FILE* gFile = nullptr;   // --server-log, or null
bool gToStderr = false;  // --verbose
// liblog's threshold before route(): with no file and no stderr, route() raises it above every
// priority, so liblog drops a line before formatting it.
int gPriorityBefore = ANDROID_LOG_DEFAULT;
bool gSilenced = false;

char priorityLetter(int priority) {
    switch (priority) {
        case ANDROID_LOG_VERBOSE:
            return 'V';
        case ANDROID_LOG_DEBUG:
            return 'D';
        case ANDROID_LOG_INFO:
            return 'I';
        case ANDROID_LOG_WARN:
            return 'W';
        case ANDROID_LOG_ERROR:
            return 'E';
        case ANDROID_LOG_FATAL:
            return 'F';
        default:
            return '?';
    }
}

void routedLogger(const struct __android_logger_data* data, const char* message) {
    std::lock_guard<std::mutex> lock(gLock);
    if (gToStderr)
        __android_log_stderr_logger(data, message);
    if (gFile == nullptr || data == nullptr || message == nullptr)
        return;
    fprintf(gFile, "%c %s: %s\n", priorityLetter(data->priority),
            data->tag != nullptr ? data->tag : "", message);
    fflush(gFile);  // a replay that crashes or is killed still leaves what was logged
}

}  // namespace

bool ServerLog::route(const std::string& path, bool toStderr, std::string* error) {
    FILE* file = nullptr;
    if (!path.empty()) {
        file = fopen(path.c_str(), "w");
        if (file == nullptr) {
            *error = "cannot write " + path;
            return false;
        }
    }
    {
        std::lock_guard<std::mutex> lock(gLock);
        if (gFile != nullptr)
            fclose(gFile);
        gFile = file;
        gToStderr = toStderr;
    }
    __android_log_set_logger(routedLogger);
    if (path.empty() && !toStderr) {
        if (!gSilenced)
            gPriorityBefore = __android_log_set_minimum_priority(ANDROID_LOG_SILENT);
        gSilenced = true;
    } else if (gSilenced) {
        __android_log_set_minimum_priority(gPriorityBefore);
        gSilenced = false;
    }
    return true;
}

void ServerLog::restore() {
    __android_log_set_logger(__android_log_stderr_logger);
    if (gSilenced)
        __android_log_set_minimum_priority(gPriorityBefore);
    gSilenced = false;
    std::lock_guard<std::mutex> lock(gLock);
    if (gFile != nullptr)
        fclose(gFile);
    gFile = nullptr;
    gToStderr = false;
}

}  // namespace velmora
