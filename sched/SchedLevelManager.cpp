#include "sched/SchedLevelManager.h"

#include "config/Action.h"

SchedLevelManager::SchedLevelManager(VelmoraPlat* plat) : mPlatPtr(plat) {}
SchedLevelManager::~SchedLevelManager() = default;

int SchedLevelManager::doEventSchedLevel(const Action* action) {
    return action != nullptr && action->mCmdId == 5376 ? 0 : -1;
}

int SchedLevelManager::doPerfSetSchedLevel(int, int, const int*, const int*) {
    return -1;
}

void SchedLevelManager::dumpEasGroupList(android::String8&) {}

SchedLevelManager* getSchedLevel(VelmoraPlat* plat) {
    return new SchedLevelManager(plat);
}
