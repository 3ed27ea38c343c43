// Client configuration requests, queries and the debug dump.
#include <errno.h>
#include <pthread.h>
#include <signal.h>
#include <time.h>
#include <unistd.h>

#include <utils/String8.h>

#include "freq/FreqClientManager.h"
#include "platform/PerfExecutor.h"
#include "platform/VelmoraLog.h"
#include "platform/VelmoraPlat.h"
#include "sched/SchedLevelManager.h"
#include "server/VelmoraServer.h"
#include "trace/TraceSlice.h"

using velmora::TraceSlice;

namespace {

constexpr size_t kMaxDumpArgLength = 512;

// Writes the reply with write(2) rather than dprintf: glibc's dprintf loses its 8 KiB stream
// buffer whenever the write fails (a descriptor the host closed, a reader that went away), and
// a dump is the one entry point that writes to a descriptor the host hands in.
void writeAll(int fd, const char* text, size_t length) {
    while (length > 0) {
        const ssize_t n = write(fd, text, length);
        if (n < 0 && errno == EINTR) {
            continue;
        }
        if (n <= 0) {
            VLOGW("dump write failed, fd=%d, errno=%d\n", fd, errno);
            return;
        }
        text += n;
        length -= static_cast<size_t>(n);
    }
}

// A reader that went away (a dump tool interrupted by its user) makes a pipe write raise
// SIGPIPE, whose default action ends the whole host process. The signal is blocked on this
// thread around the write; one that the write raised is taken back before the old mask
// returns, one that was already pending is left alone.
void writeReply(int fd, const char* text, size_t length) {
    sigset_t pipeSet;
    sigset_t oldSet;
    sigset_t pending;
    sigemptyset(&pipeSet);
    sigaddset(&pipeSet, SIGPIPE);
    pthread_sigmask(SIG_BLOCK, &pipeSet, &oldSet);
    sigemptyset(&pending);
    sigpending(&pending);
    const bool wasPending = sigismember(&pending, SIGPIPE) == 1;
    writeAll(fd, text, length);
    sigemptyset(&pending);
    sigpending(&pending);
    if (!wasPending && sigismember(&pending, SIGPIPE) == 1) {
        const struct timespec noWait = {0, 0};
        sigtimedwait(&pipeSet, nullptr, &noWait);
    }
    pthread_sigmask(SIG_SETMASK, &oldSet, nullptr);
}

}  // namespace

int VelmoraServer::velmoraSetConfig(int clientId, int tagLen, const int* tags, const int* configs) {
    const TraceSlice slice("velmoraSetConfig", "clientId", clientId);
    if (!mInitialized) {
        return 1;
    }
    if (mFreqClientPtr == nullptr) {
        VLOGE("init mFreqClientPtr failed!");
        return 4;
    }
    // The managers size stack arrays by tagLen and read both arrays in full.
    if (tagLen < 0 || (tagLen > 0 && (tags == nullptr || configs == nullptr))) {
        VLOGE("velmoraSetConfig invalid request, clientId=%d, tagLen=%d", clientId, tagLen);
        return 3;
    }
    if (clientId != 0) {
        for (int i = 0; i < tagLen; ++i) {
            VLOGI("setConfig clientId=%d, tagLen=%d, tags[%d]=%d, configs[%d]=%d", clientId, tagLen,
                  i, tags[i], i, configs[i]);
        }
    }
    for (int i = 0; i < tagLen; ++i) {
        if (tags[i] != VELMORA_TAG_SCHED_LEVEL_STEP && tags[i] != VELMORA_TAG_SET_SCHED_LEVEL) {
            continue;
        }
        if (mSchedLevelPtr == nullptr) {
            VLOGE("init mSchedLevelPtr failed!");
            return 4;
        }
        const int ret = mSchedLevelPtr->doPerfSetSchedLevel(clientId, tagLen, tags, configs);
        if (ret != 0) {
            VLOGE("velmoraSetConfig doPerfSetSchedLevel failed! clientId=%d", clientId);
        }
        return ret;
    }
    if (mFreqClientPtr->doPerfSetConfig(clientId, tagLen, tags, configs, nullptr) != 0) {
        VLOGE("velmoraSetConfig failed!");
        return 3;
    }
    return 0;
}

int VelmoraServer::velmoraGetConfig(int tagLen, const int* tags, int* configs) {
    if (!mInitialized) {
        return 1;
    }
    if (mDebugLog.load(std::memory_order_relaxed)) {
        VLOGI("velmoraGetConfig tagLen=%d", tagLen);
    }
    if (mPlatPtr == nullptr) {
        VLOGE("init mPlatPtr failed!");
        return 4;
    }
    if (tagLen < 0 || (tagLen > 0 && (tags == nullptr || configs == nullptr))) {
        VLOGE("velmoraGetConfig invalid request, tagLen=%d", tagLen);
        return 3;
    }
    PerfExecutor* executor = mPlatPtr->mExecutorPtr;
    if (executor != nullptr && executor->doPerfGetConfig(tagLen, tags, configs) == 0) {
        return 0;
    }
    VLOGE("velmoraGetConfig doPerfGetConfig failed!");
    return 3;
}

void VelmoraServer::dumpVelmoraServerInfo(int fd, const std::vector<std::string>& args) {
    const TraceSlice slice("dumpVelmoraServerInfo");
    if (fd < 0) {
        VLOGW("invalid dump FD, %d\n", fd);
        return;
    }
    if (args.empty()) {
        VLOGW("dump parameter is NULL!\n");
        return;
    }
    if (args.size() >= 2) {
        VLOGW("there is too many dump parameter!\n");
        return;
    }
    const std::string& option = args[0];
    if (option.size() > kMaxDumpArgLength) {
        VLOGW("debug parameter is too long!\n");
        return;
    }

    android::String8 out;
    if (option == "--help") {
        out.append("--help: print debug usage\n");
        out.append("--logon: open debug log\n");
        out.append("--logoff: close debug log\n");
        out.append("--freqlist: print set freq list\n");
        out.append("--easgrouplist: print set eas group list\n");
    } else if (option == "--logon") {
        mDebugLog.store(true, std::memory_order_relaxed);
        out.appendFormat("velmora log is %s\n", "ON");
    } else if (option == "--logoff") {
        mDebugLog.store(false, std::memory_order_relaxed);
        out.appendFormat("velmora log is %s\n", "OFF");
    } else if (option == "--freqlist") {
        if (mFreqClientPtr != nullptr) {
            mFreqClientPtr->dumpFreqList(out);
        }
    } else if (option == "--easgrouplist") {
        if (mSchedLevelPtr != nullptr) {
            mSchedLevelPtr->dumpEasGroupList(out);
        }
    } else {
        out.append("invalid parameter!\n");
    }
    out.append("\n");
    writeReply(fd, out.string(), out.length());
}
