// Probe handler (skeleton: the worker thread and queues land with their own change).
#pragma once

#include "config/Action.h"

class VelmoraPlat;

class ProbeHandler : public Action {
public:
    // Takes ownership of the `action` chain.
    ProbeHandler(VelmoraPlat* plat, Action* action);
    ~ProbeHandler() override;

    int handle(const char* msg, unsigned int payloadNum, const int* payload);
    // Replaces the probe action; takes ownership of the `action` chain on success (0).
    int updateProbeThread(Action* action);

    Action* mAction;
};
