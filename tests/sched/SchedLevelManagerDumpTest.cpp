// The "--easgrouplist" text of SchedLevelManager, line for line.
#include <gtest/gtest.h>

#include <utils/String8.h>

#include <string>

#include "platform/VelmoraPlat.h"
#include "sched/SchedLevelManager.h"
#include "tests/fakes/FakeExecutor.h"
#include "tests/fakes/LogCapture.h"
#include "tests/sched/SchedTestHelpers.h"

namespace velmora {
namespace fake {
namespace {

class SchedLevelManagerDumpTest : public ::testing::Test {
protected:
    void SetUp() override {
        LogCapture::start();
        mPlat.mExecutorPtr = &mExecutor;
    }

    std::string dump() {
        android::String8 out;
        mManager.dumpEasGroupList(out);
        return std::string(out.string());
    }

    int event(int cmdId, const std::vector<int>& pairs) {
        const Action action = schedEvent(cmdId, pairs);
        return mManager.doEventSchedLevel(&action);
    }

    FakeExecutor mExecutor;
    VelmoraPlat mPlat;
    SchedLevelManager mManager{&mPlat};
};

TEST_F(SchedLevelManagerDumpTest, FreshManagerDumpsFiveBlocksOfZeros) {
    const std::string zeros =
        "group=boost,             value=0\n"
        "group=vip,               value=0\n"
        "group=top-app,           value=0\n"
        "group=root,              value=0\n"
        "group=foreground,        value=0\n"
        "group=key-background,    value=0\n"
        "group=system-background, value=0\n"
        "group=background,        value=0\n";
    EXPECT_EQ(dump(), "default eas group value is:\n" + zeros + "current eas group value is:\n" +
                          zeros + "KX set eas group value is:\n" + zeros +
                          "JN set eas group value is:\n" + zeros +
                          "ZOLA set eas group value is:\n" + zeros);
}

TEST_F(SchedLevelManagerDumpTest, KeyBackgroundIsListedBeforeSystemBackground) {
    std::vector<int> pairs = easPairs(0);
    pairs[11] = 6;  // tag 56, system-background
    pairs[13] = 7;  // tag 57, key-background
    ASSERT_EQ(event(5376, pairs), 0);
    const std::string text = dump();
    const std::string block = text.substr(0, text.find("current eas group value is:\n"));
    EXPECT_EQ(block,
              "default eas group value is:\n"
              "group=boost,             value=0\n"
              "group=vip,               value=0\n"
              "group=top-app,           value=0\n"
              "group=root,              value=0\n"
              "group=foreground,        value=0\n"
              "group=key-background,    value=7\n"
              "group=system-background, value=6\n"
              "group=background,        value=0\n");
}

TEST_F(SchedLevelManagerDumpTest, HmpModeDumpsOneLinePerBlock) {
    ASSERT_EQ(event(5376, {50, -10}), 0);
    ASSERT_EQ(event(4500, {50, 30}), 0);
    EXPECT_EQ(dump(),
              "default eas group value is:\n"
              "group=hmp,               value=-10\n"
              "current eas group value is:\n"
              "group=hmp,               value=30\n"
              "KX set eas group value is:\n"
              "group=hmp,               value=-10\n"
              "JN set eas group value is:\n"
              "group=hmp,               value=-10\n"
              "ZOLA set eas group value is:\n"
              "group=hmp,               value=30\n");
}

TEST_F(SchedLevelManagerDumpTest, EventNamingOneGroupLeavesTheOthersUnsetForZola) {
    ASSERT_EQ(event(5376, easPairs(10)), 0);
    ASSERT_EQ(event(4500, {53, 20}), 0);
    const auto zola = easLevels(-100, {{53, 20}});
    EXPECT_EQ(dump(), easDump(easLevels(10), zola, easLevels(10), easLevels(10), zola));
}

TEST_F(SchedLevelManagerDumpTest, ClientTablesShowTheirOwnRequests) {
    ASSERT_EQ(event(5376, easPairs(10)), 0);
    const int kx[] = {42, 3 * 65536 + 10};  // top-app at -10
    ASSERT_EQ(mManager.doPerfSetSchedLevel(1, 1, &kx[0], &kx[1]), 0);
    const int jn[] = {42, 8 * 65536 + 40};  // background at 20, above its default
    ASSERT_EQ(mManager.doPerfSetSchedLevel(2, 1, &jn[0], &jn[1]), 0);
    EXPECT_EQ(dump(), easDump(easLevels(10), easLevels(10, {{53, -10}}), easLevels(10, {{53, -10}}),
                              easLevels(10, {{58, 20}}), easLevels(10)));
}

TEST_F(SchedLevelManagerDumpTest, PlatformFailureLeavesTheDumpAsItWas) {
    ASSERT_EQ(event(5376, easPairs(0)), 0);
    ASSERT_EQ(event(4500, {53, 20}), 0);
    const std::string before = dump();
    mExecutor.setResult(Op::SchedLevel, 3);
    EXPECT_EQ(event(4501, {53, 30, 54, 10}), 3);
    const int step[] = {40, 1};
    EXPECT_EQ(mManager.doPerfSetSchedLevel(3, 1, &step[0], &step[1]), 3);
    EXPECT_EQ(dump(), before);
}

}  // namespace
}  // namespace fake
}  // namespace velmora
