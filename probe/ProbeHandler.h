// Entry object for probe events (command 4116): one thread of one process that is about to do
// latency-critical work (state 0) or has finished it (state -1).
//
// Owns the probe worker (ProbeThread) through mProbeThreadPtr; the worker owns the probe
// command's action chain. The server builds one handler in init, calls handle() from any host
// thread for every probe event and updateProbeThread() from a configuration reload (under the
// parser's write lock). Callers need no lock: both calls take the worker's mutex for the whole
// queue or action change, so they serialise with each other and with the worker's passes.
//
// Lock order: the parser's write lock, then the worker's mLock. The executor is called with
// mLock held and must not call back into this handler.
//
// The Action base is left in its default state and never read; it only gives the handler the
// virtual destructor that the server deletes it through.
#pragma once

#include <stdint.h>
#include <utils/StrongPointer.h>

#include "config/Action.h"

class VelmoraPlat;

class ProbeHandler : public Action {
public:
    class ProbeThread;

    // Starts the worker at once. Takes ownership of the `action` chain; `plat` is not owned
    // and must stay valid until stopProbeThread() or the destructor has run.
    ProbeHandler(VelmoraPlat* plat, Action* action);
    // Stops the worker (see stopProbeThread) and drops it.
    ~ProbeHandler() override;

    ProbeHandler(const ProbeHandler&) = delete;
    ProbeHandler& operator=(const ProbeHandler&) = delete;

    // Queues (state 0) or withdraws (state -1) the thread named by `msg` ("pid=%d|tid=%d").
    // 0 on success; 2 for a payload that is not exactly one state or an unknown state; when
    // `msg` does not hold both ids, the number of values read (0 or 1), or -1 when nothing
    // could be read at all.
    int handle(const char* msg, unsigned int payloadNum, const int* payload);
    // Replaces the worker's action chain with `action` (taken over, not clamped). 0 on
    // success, -1 when there is no worker (the caller keeps `action`).
    int updateProbeThread(Action* action);
    // Makes the worker leave for good and returns once it no longer runs, so that it never
    // touches the platform object or this handler afterwards. Call it before the platform
    // object is deleted; later probe events still queue but nothing is boosted by the worker.
    // Idempotent.
    void stopProbeThread();

    android::sp<ProbeThread> mProbeThreadPtr;
    // Time between a thread's arrival and its boost. Read by the worker on every pass.
    int32_t mBoostDelayMs;
};
