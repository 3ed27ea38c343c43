// Scheduling-level manager (skeleton: the full tables and merge land with their own change).
#pragma once

#include <utils/String8.h>

class Action;
class VelmoraPlat;

class SchedLevelManager {
public:
    explicit SchedLevelManager(VelmoraPlat* plat);
    virtual ~SchedLevelManager();

    int doEventSchedLevel(const Action* action);
    int doPerfSetSchedLevel(int clientId, int tagLen, const int* tags, const int* configs);
    void dumpEasGroupList(android::String8& out);

    VelmoraPlat* mPlatPtr;
};

SchedLevelManager* getSchedLevel(VelmoraPlat* plat);
