// Fixture for direct tests of FreqClientManager: a manager on a plain platform object whose
// executor records every call, with helpers to send client and event requests and to read the
// manager's tables under its lock.
#pragma once

#include <gtest/gtest.h>

#include <utility>
#include <vector>

#include "freq/FreqClientManager.h"
#include "platform/VelmoraPlat.h"
#include "tests/fakes/FakeEnv.h"
#include "tests/fakes/FakeExecutor.h"
#include "tests/fakes/LogCapture.h"

namespace velmora {
namespace fake {

using Pairs = std::vector<std::pair<int, int>>;
using Ints = std::vector<int>;

class FreqManagerTest : public ::testing::Test {
protected:
    static constexpr int kOn = 0;
    static constexpr int kOff = -1;

    // Copy of the manager's guarded state, taken under its lock.
    struct Snapshot {
        FreqClientManager::TagMap kx, jn, min;
        FreqClientManager::EventMap littleMin, littleMax, bigMin, bigMax, gpuMin, gpuMax;
        bool maxFreqRead;
        bool uploadEnabled;
    };

    FreqManagerTest() { mPlat.mExecutorPtr = &mExec; }
    void SetUp() override {
        FakeEnv::get().reset();
        LogCapture::start();
    }
    void TearDown() override { FakeEnv::get().reset(); }

    int send(FreqClientManager& mgr, int id, const Pairs& pairs, const int* onOff) {
        Ints tags;
        Ints values;
        for (const auto& p : pairs) {
            tags.push_back(p.first);
            values.push_back(p.second);
        }
        return mgr.doPerfSetConfig(id, static_cast<int>(pairs.size()), tags.data(), values.data(),
                                   onOff);
    }
    int client(int id, const Pairs& pairs) { return send(mMgr, id, pairs, nullptr); }
    int event(int cmdId, int onOff, const Pairs& pairs) { return send(mMgr, cmdId, pairs, &onOff); }
    void enableUpload() {
        const int tag = VELMORA_TAG_FEATURE_SWITCH;
        const int word = FREQ_INFO_UPLOAD_BIT;
        mMgr.doPerfSetConfig(0, 1, &tag, &word, nullptr);
    }

    std::vector<ExecutorCall> setCalls() const { return mExec.calls(Op::SetConfig); }
    // The values of the last set-config call, checking its id and tags.
    Ints lastSent(int id, const Ints& tags) const {
        const auto calls = setCalls();
        if (calls.empty()) {
            ADD_FAILURE() << "no set-config call";
            return {};
        }
        EXPECT_EQ(calls.back().id, id);
        EXPECT_EQ(calls.back().tags, tags);
        return calls.back().values;
    }

    Snapshot snapshot() {
        android::Mutex::Autolock lock(mMgr.mLock);
        Snapshot s;
        s.kx = mMgr.mKxConfigMap;
        s.jn = mMgr.mJnConfigMap;
        s.min = mMgr.mMinConfigMap;
        s.littleMin = mMgr.mLittleMinFreqMap;
        s.littleMax = mMgr.mLittleMaxFreqMap;
        s.bigMin = mMgr.mBigMinFreqMap;
        s.bigMax = mMgr.mBigMaxFreqMap;
        s.gpuMin = mMgr.mGpuMinFreqMap;
        s.gpuMax = mMgr.mGpuMaxFreqMap;
        s.maxFreqRead = mMgr.mMaxFreqRead;
        s.uploadEnabled = mMgr.mUploadEnabled;
        return s;
    }

    FakeExecutor mExec;
    VelmoraPlat mPlat;
    FreqClientManager mMgr{&mPlat};
};

}  // namespace fake
}  // namespace velmora
