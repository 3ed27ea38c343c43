#include "probe/ProbeHandler.h"

#include "compat/BoundedString.h"
#include "platform/VelmoraLog.h"
#include "probe/ProbeThread.h"

namespace {

constexpr int32_t kBoostDelayMs = 8;
constexpr int kStateBoost = 0;
constexpr int kStateUnboost = -1;
constexpr int kBadPayload = 2;

}  // namespace

ProbeHandler::ProbeHandler(VelmoraPlat* plat, Action* action) : mBoostDelayMs(kBoostDelayMs) {
    // Taking the first strong reference starts the worker, so mBoostDelayMs is set first.
    mProbeThreadPtr = new ProbeThread(*this, plat, action);
}

ProbeHandler::~ProbeHandler() {
    // The worker's loop would otherwise run on for the life of the process and read this
    // handler (mBoostDelayMs) and the platform object after they are gone: the server deletes
    // both, and tests create and delete servers all the time. Stopping it here is the last
    // moment at which the handler is still whole.
    stopProbeThread();
    mProbeThreadPtr.clear();
}

void ProbeHandler::stopProbeThread() {
    if (mProbeThreadPtr != nullptr) {
        mProbeThreadPtr->shutdown();
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
