#include "probe/ProbeHandler.h"

#include <unistd.h>

#include "compat/BoundedString.h"
#include "platform/VelmoraLog.h"
#include "probe/ProbeThread.h"

namespace {

constexpr int32_t kBoostDelayMs = 8;
constexpr int kStateBoost = 0;
constexpr int kStateUnboost = -1;
constexpr int kBadPayload = 2;
// The worker lets go within microseconds of stopping; 100 ms covers a descheduled worker.
constexpr int kReleasePolls = 1000;
constexpr useconds_t kReleasePollUs = 100;

}  // namespace

ProbeHandler::ProbeHandler(VelmoraPlat* plat, Action* action) : mBoostDelayMs(kBoostDelayMs) {
    // Taking the first strong reference starts the worker, so mBoostDelayMs is set first.
    mProbeThreadPtr = new ProbeThread(*this, plat, action);
}

ProbeHandler::~ProbeHandler() {
    // Left alone, the worker would run on for the life of the process and go on reading this
    // handler (mBoostDelayMs) and the platform object after the server has deleted both; a
    // host may delete and recreate the server at any time. Stopping it here, and waiting for
    // it, is the last moment at which the handler is still whole. The platform object is
    // already gone when the server deletes us, which is why the server stops the worker
    // (stopProbeThread()) before it deletes the platform; this call then does nothing.
    stopProbeThread();
    mProbeThreadPtr.clear();
}

void ProbeHandler::stopProbeThread() {
    if (mProbeThreadPtr == nullptr) {
        return;
    }
    mProbeThreadPtr->shutdown();
    // The worker's loop lets go of its own strong reference just after it reports that it has
    // stopped. Wait for that, so that our reference is the last one: the worker (its action
    // chain included) is then destroyed on the thread that drops it, before the server's
    // deletion returns, rather than later on a detached thread that may by then be running
    // code of an unloaded library. Bounded: should anything else still hold a reference, it
    // simply goes last.
    for (int i = 0; i < kReleasePolls && mProbeThreadPtr->getStrongCount() > 1; ++i) {
        usleep(kReleasePollUs);
    }
}

int ProbeHandler::handle(const char* msg, unsigned int payloadNum, const int* payload) {
    int pid = 0;
    int tid = 0;
    const int read = sscanf_s(msg, "pid=%d|tid=%d", &pid, &tid);
    if (read != 2) {
        VLOGE("velmora: get msg info failed!");
        return read;
    }
    if (payloadNum != 1) {
        VLOGE("invalid payload, payloadNum=%d", payloadNum);
        return kBadPayload;
    }
    if (payload == nullptr) {
        VLOGE("payload is NULL");
        return kBadPayload;
    }
    ProbeThread* thread = mProbeThreadPtr.get();
    if (thread == nullptr) {
        return 0;
    }
    const int state = payload[0];
    android::Mutex::Autolock lock(thread->mLock);
    if (state == kStateUnboost) {
        thread->moveItemToUnboostQueue(static_cast<uint32_t>(tid));
    } else if (state == kStateBoost) {
        thread->addItemToQueue(pid, static_cast<uint32_t>(tid));
    } else {
        VLOGD("error case: state=%d, pid=%d, tid=%d\n", state, pid, tid);
        return kBadPayload;
    }
    return 0;
}

int ProbeHandler::updateProbeThread(Action* action) {
    if (mProbeThreadPtr == nullptr) {
        VLOGE("updateProbeThread:mProbeThreadPtr is NULL!");
        return -1;
    }
    mProbeThreadPtr->update(action);
    return 0;
}
