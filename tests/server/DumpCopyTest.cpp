// The dump prints copies of the managers' tables, not the tables: each row changes a printed
// table the way a caller of a manager's own operations may (a table written directly, then one
// of the operations; or the operation alone), under the manager's lock, and reads the change
// back through the server's "--easgrouplist" or "--freqlist" dump.
#include <functional>
#include <map>
#include <string>
#include <vector>

#include "freq/FreqClientManager.h"
#include "sched/SchedLevelManager.h"
#include "tests/sched/SchedTestHelpers.h"
#include "tests/server/SceneTestSupport.h"

namespace velmora {
namespace fake {
namespace {

struct SchedDumpRow {
    const char* name;
    // Takes the manager's lock, as every caller of these operations must.
    std::function<void(SchedLevelManager&)> change;
    // The five tables the dump must show afterwards (the start-up defaults are all 0).
    std::map<int, int> defaults, current, kx, jn, zola;
};

class SchedDumpCopyTest : public ServerSceneTest,
                          public ::testing::WithParamInterface<SchedDumpRow> {};

TEST_P(SchedDumpCopyTest, DumpShowsTheChangedTable) {
    const SchedDumpRow& row = GetParam();
    start("");
    row.change(*mServer->mSchedLevelPtr);
    EXPECT_EQ(dump("--easgrouplist"),
              easDump(row.defaults, row.current, row.kx, row.jn, row.zola) + "\n");
}

const std::map<int, int> kZero = easLevels(0);

// clang-format off
INSTANTIATE_TEST_SUITE_P(
    Rows, SchedDumpCopyTest,
    ::testing::Values(
        // A client table written directly reaches the dump with the next merge.
        SchedDumpRow{"MergeAfterADirectWrite",
                     [](SchedLevelManager& m) {
                         android::Mutex::Autolock lock(m.mLock);
                         m.mKxLevelMap[53] = -10;
                         EXPECT_EQ(m.updateCurrentSchedlevel(), 0);
                     },
                     kZero, easLevels(0, {{53, -10}}), easLevels(0, {{53, -10}}), kZero, kZero},
        SchedDumpRow{"DefaultsRecordedAgain",
                     [](SchedLevelManager& m) {
                         android::Mutex::Autolock lock(m.mLock);
                         const std::vector<int> pairs = easPairs(10);
                         int groups[8];
                         int levels[8];
                         EXPECT_EQ(m.initDefaultSchedLevel(8, pairs, groups, levels), 0);
                     },
                     easLevels(10), easLevels(10), easLevels(10), easLevels(10), easLevels(10)},
        SchedDumpRow{"ClientTableOneStepDown",
                     [](SchedLevelManager& m) {
                         android::Mutex::Autolock lock(m.mLock);
                         m.updateSchedLevelByOneStep(m.mJnLevelMap, -1);
                     },
                     kZero, kZero, kZero, easLevels(-10), kZero},
        SchedDumpRow{"ZolaTakesTheEventLevels",
                     [](SchedLevelManager& m) {
                         android::Mutex::Autolock lock(m.mLock);
                         m.mZolaEventMap = m.mZolaLevelMap;
                         m.mZolaEventMap[54] = 20;
                         EXPECT_EQ(m.checkIfZolaLevelChanged(), 1);
                     },
                     kZero, kZero, kZero, kZero, easLevels(0, {{54, 20}})}),
    [](const ::testing::TestParamInfo<SchedDumpRow>& info) { return info.param.name; });
// clang-format on

struct FreqDumpRow {
    const char* name;
    // A client request sent first, through the server (empty: none).
    std::vector<int> requestTags, requestConfigs;
    // Takes the manager's lock, as every caller of these operations must.
    std::function<void(FreqClientManager&)> change;
    std::map<int, int> kx, jn;
};

class FreqDumpCopyTest : public ServerSceneTest,
                         public ::testing::WithParamInterface<FreqDumpRow> {};

TEST_P(FreqDumpCopyTest, DumpShowsTheChangedTable) {
    const FreqDumpRow& row = GetParam();
    start("");
    if (!row.requestTags.empty()) {
        ASSERT_EQ(setConfig(2, row.requestTags, row.requestConfigs), 0);
    }
    row.change(*mServer->mFreqClientPtr);
    EXPECT_EQ(dump("--freqlist"),
              freqBlock("KX", row.kx) + freqBlock("JN", row.jn) + freqBlock("ZOLA", {}) + "\n");
}

// clang-format off
INSTANTIATE_TEST_SUITE_P(
    Rows, FreqDumpCopyTest,
    ::testing::Values(
        FreqDumpRow{"RequestCopiedIntoAClientTable", {}, {},
                    [](FreqClientManager& m) {
                        android::Mutex::Autolock lock(m.mLock);
                        const int tags[] = {2, 20, 1};  // tag 1 is not a dumped tag
                        const int configs[] = {1800000, 1, 500};
                        m.updateConfigMap(3, tags, configs, m.mKxConfigMap);
                    },
                    {{2, 1800000}, {20, 1}}, {}},
        FreqDumpRow{"ClientTableCleared", {2}, {1200000},
                    [](FreqClientManager& m) {
                        android::Mutex::Autolock lock(m.mLock);
                        m.initConfigMap(m.mJnConfigMap);
                    },
                    {}, {}},
        // Not a client table: nothing printed changes.
        FreqDumpRow{"MergedTableIsNotPrinted", {2}, {1200000},
                    [](FreqClientManager& m) {
                        android::Mutex::Autolock lock(m.mLock);
                        const int tags[] = {2};
                        const int configs[] = {900000};
                        m.updateConfigMap(1, tags, configs, m.mMinConfigMap);
                    },
                    {}, {{2, 1200000}}}),
    [](const ::testing::TestParamInfo<FreqDumpRow>& info) { return info.param.name; });
// clang-format on

}  // namespace
}  // namespace fake
}  // namespace velmora
