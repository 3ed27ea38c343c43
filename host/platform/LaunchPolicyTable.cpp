#include "host/platform/LaunchPolicyTable.h"


namespace velmora {

void LaunchPolicyTable::set(const std::string& name, int duration) {
    std::lock_guard<std::mutex> lock(mLock);
    if (duration == -1) {
        mDurations.erase(name);
    } else {
        mDurations[name] = duration;
    }
}

void LaunchPolicyTable::clear() {
    std::lock_guard<std::mutex> lock(mLock);
    mDurations.clear();
    mQueries = 0;
}

int LaunchPolicyTable::get(const std::string& name) {
    std::lock_guard<std::mutex> lock(mLock);
    ++mQueries;
    auto it = mDurations.find(name);
    return it == mDurations.end() ? -1 : it->second;
}

int LaunchPolicyTable::queries() const {
    std::lock_guard<std::mutex> lock(mLock);
    return mQueries;
}

}  // namespace velmora
