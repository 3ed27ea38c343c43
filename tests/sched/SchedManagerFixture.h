// Fixture for direct tests of SchedLevelManager: a manager on a bare platform object whose
// executor records every call, helpers to send events and client requests, and a copy of every
// table taken under the manager's lock.
#pragma once

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "platform/VelmoraPlat.h"
#include "sched/SchedLevelManager.h"
#include "tests/fakes/FakeExecutor.h"
#include "tests/fakes/LogCapture.h"
#include "tests/sched/SchedTestHelpers.h"

namespace velmora {
namespace fake {

using LevelMap = SchedLevelManager::LevelMap;

inline constexpr int kFailed = 7;  // an executor result that is neither 0 nor -1
inline const char* const kSendFailed = "doSchedLevelAction failed!";

// Every table and flag, copied under the manager's lock.
struct Tables {
    LevelMap defaults, current, kx, jn, zola, zolaFirst, zolaEvent;
    bool zolaFirstSeen;
    bool hmp;
    bool operator==(const Tables& o) const {
        return defaults == o.defaults && current == o.current && kx == o.kx && jn == o.jn &&
               zola == o.zola && zolaFirst == o.zolaFirst && zolaEvent == o.zolaEvent &&
               zolaFirstSeen == o.zolaFirstSeen && hmp == o.hmp;
    }
};

// All nine tags at `level`, with `overrides` on top.
inline LevelMap allGroups(int level, const LevelMap& overrides = {}) {
    LevelMap table = easLevels(level, overrides);
    table.emplace(50, level);  // kept when `overrides` names it
    return table;
}

class SchedLevelManagerTest : public ::testing::Test {
protected:
    void SetUp() override {
        LogCapture::start();
        mPlat.mExecutorPtr = &mExecutor;
    }

    Tables snapshot() {
        android::Mutex::Autolock lock(mManager.mLock);
        return {
            mManager.mDefaultLevelMap, mManager.mCurrentLevelMap,    mManager.mKxLevelMap,
            mManager.mJnLevelMap,      mManager.mZolaLevelMap,       mManager.mZolaFirstEventMap,
            mManager.mZolaEventMap,    mManager.mZolaFirstEventSeen, mManager.mHmpMode};
    }

    int event(int cmdId, const std::vector<int>& pairs) {
        const Action action = schedEvent(cmdId, pairs);
        return mManager.doEventSchedLevel(&action);
    }

    // Installs EAS defaults at `level` and forgets what that logged or sent.
    void easDefaults(int level = 0) {
        ASSERT_EQ(event(5376, easPairs(level)), 0);
        mExecutor.clear();
        LogCapture::clear();
    }

    int request(int clientId, const std::vector<int>& tags, const std::vector<int>& configs) {
        return mManager.doPerfSetSchedLevel(clientId, static_cast<int>(tags.size()), tags.data(),
                                            configs.data());
    }

    // Groups and levels of the only doSchedLevelAction call so far, as one table.
    LevelMap onlySent() {
        const auto calls = mExecutor.calls(Op::SchedLevel);
        EXPECT_EQ(calls.size(), 1u);
        LevelMap sent;
        if (calls.empty()) {
            return sent;
        }
        for (size_t i = 0; i < calls[0].tags.size(); ++i) {
            sent[calls[0].tags[i]] = calls[0].values[i];
        }
        return sent;
    }

    size_t sendCount() { return mExecutor.calls(Op::SchedLevel).size(); }

    FakeExecutor mExecutor;
    VelmoraPlat mPlat;
    SchedLevelManager mManager{&mPlat};
};

}  // namespace fake
}  // namespace velmora
