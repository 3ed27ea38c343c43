// Frequency paths through the server: client requests, on/off commands with frequency pairs,
// the notification that enables statistics upload, queries and the "--freqlist" dump.
#include <unistd.h>

#include "tests/freq/FreqReportLines.h"
#include "tests/server/SceneTestSupport.h"

namespace velmora {
namespace fake {
namespace {

using Ints = std::vector<int>;
using Strings = std::vector<std::string>;

const char* const kFreqCommands =
    "<cmd id=\"12288\" name=\"little_cap\"><act><duration>0</duration>"
    "<t2>1500000</t2></act></cmd>"
    "<cmd id=\"12289\" name=\"floor_over_cap\"><act><duration>0</duration>"
    "<t1>2000000</t1><t2>1000000</t2></act></cmd>"
    "<cmd id=\"12291\" name=\"big_cap_and_platform\"><act><duration>0</duration>"
    "<t10>1</t10><t5>1900000</t5></act></cmd>";

class ServerFreqTest : public ServerSceneTest {
protected:
    void SetUp() override {
        ServerSceneTest::SetUp();
        start(kFreqCommands);
    }

    int notify(int word) { return mServer->velmoraEvent(kNotification, "", 1, &word); }

    // (id, tags, values) of the last set-config call that reached the platform.
    ExecutorCall lastSet() {
        const auto calls = executor().calls(Op::SetConfig);
        return calls.empty() ? ExecutorCall(Op::DoAction) : calls.back();
    }
};

TEST_F(ServerFreqTest, ClientCapIsMergedWithTheOtherClients) {
    EXPECT_EQ(setConfig(2, {2}, {1200000}), 0);
    EXPECT_EQ(setConfig(1, {2, 1}, {1800000, 900000}), 0);
    const ExecutorCall call = lastSet();
    EXPECT_EQ(call.id, 1);
    EXPECT_EQ(call.tags, (Ints{2, 1}));
    EXPECT_EQ(call.values, (Ints{1200000, 900000}));
    EXPECT_EQ(setConfig(3, {2}, {1000000}), 0);
    EXPECT_EQ(lastSet().values, (Ints{1000000}));
    // JN withdraws: the smallest of KX and ZOLA remains.
    EXPECT_EQ(setConfig(2, {2}, {0}), 0);
    EXPECT_EQ(lastSet().id, 2);
    EXPECT_EQ(lastSet().values, (Ints{1000000}));
    // ZOLA raises its cap: KX's still holds, and JN's withdrawn 0 caps nothing.
    EXPECT_EQ(setConfig(3, {2}, {2000000}), 0);
    EXPECT_EQ(lastSet().values, (Ints{1800000}));
}

TEST_F(ServerFreqTest, RejectedClientRequestsAnswerThree) {
    EXPECT_EQ(setConfig(1, {2}, {-2}), 3);
    EXPECT_EQ(setConfig(3, {20}, {2}), 3);
    executor().setResult(Op::SetConfig, 5);
    EXPECT_EQ(setConfig(1, {2}, {1000000}), 3);
    EXPECT_EQ(LogCapture::count(ANDROID_LOG_ERROR, "velmoraSetConfig failed!"), 3);
}

TEST_F(ServerFreqTest, OnOffCapMergesWithClientsAndLeavesTheirLimitBehind) {
    EXPECT_EQ(on(12288), 0);
    EXPECT_EQ(lastSet().id, 12288);
    EXPECT_EQ(lastSet().values, (Ints{1500000}));
    EXPECT_EQ(setConfig(1, {2}, {1800000}), 0);
    EXPECT_EQ(lastSet().values, (Ints{1500000}));
    EXPECT_EQ(off(12288), 0);
    EXPECT_EQ(lastSet().id, 12288);
    EXPECT_EQ(lastSet().values, (Ints{1800000}));
    EXPECT_EQ(setConfig(1, {2}, {1800000}), 0);
    EXPECT_EQ(lastSet().values, (Ints{1800000}));
}

TEST_F(ServerFreqTest, InvalidOnOffFrequencyCommandsAreRefused) {
    EXPECT_EQ(on(12289), -1);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_INFO,
                                "freq is invalid(min > freq), cmdId is 12289, (l_cpu(2000000,"
                                "1000000), b_cpu(0, 0), gpu(0, 0))"));
    EXPECT_TRUE(executor().calls().empty());
    // The refused switch-on left no cap behind for the clients.
    EXPECT_EQ(setConfig(2, {2}, {1700000}), 0);
    EXPECT_EQ(lastSet().values, (Ints{1700000}));
}

TEST_F(ServerFreqTest, PlatformOnOffPairsGoToTheExecutorBesideTheFrequencyPairs) {
    EXPECT_EQ(on(12291), 0);
    EXPECT_EQ(lastSet().id, 12291);
    EXPECT_EQ(lastSet().tags, (Ints{5}));
    EXPECT_EQ(lastSet().values, (Ints{1900000}));
    const auto actions = executor().calls(Op::DoAction);
    ASSERT_EQ(actions.size(), 1u);
    EXPECT_EQ(actions[0].id, 12291);
    EXPECT_EQ(actions[0].payload, (Ints{kOn}));
}

TEST_F(ServerFreqTest, NotificationEnablesUploadOnceAndForAll) {
    executor().setConfigValue(22, 1804800);
    executor().setConfigValue(24, 2419200);
    executor().setConfigValue(26, 2841600);
    EXPECT_EQ(setConfig(1, {5}, {1209600}), 0);  // not reported: upload is still off
    EXPECT_EQ(notify(0x10000), 0);
    EXPECT_EQ(setConfig(1, {5}, {1209600}), 0);
    EXPECT_EQ(notify(0), 0);  // a later word without the bit does not switch it off
    EXPECT_EQ(setConfig(1, {5}, {0}), 0);
    EXPECT_EQ(reportBodies(), (Strings{",1,,1209,,4>", ",2,,-1,,0>"}));
    EXPECT_EQ(executor().calls(Op::GetConfig).size(), 1u);
    // Feature-switch words are not client requests: nothing of them reaches set-config.
    EXPECT_EQ(executor().calls(Op::SetConfig).size(), 3u);
}

TEST_F(ServerFreqTest, EmptyRequestReachesTheFrequencyManager) {
    EXPECT_EQ(mServer->velmoraSetConfig(1, 0, nullptr, nullptr), 0);
    ASSERT_EQ(executor().calls(Op::SetConfig).size(), 1u);
    EXPECT_EQ(lastSet().id, 1);
    EXPECT_TRUE(lastSet().tags.empty());
}

TEST_F(ServerFreqTest, QueriesGoStraightToThePlatform) {
    executor().setConfigValue(24, 2419200);
    const int tags[] = {24, 99};
    int values[] = {-1, -1};
    EXPECT_EQ(dump("--logon"), "velmora log is ON\n\n");
    EXPECT_EQ(mServer->velmoraGetConfig(2, tags, values), 0);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_INFO, "velmoraGetConfig tagLen=2"));
    EXPECT_EQ(values[0], 2419200);
    EXPECT_EQ(values[1], -1);
    executor().setResult(Op::GetConfig, 1);
    EXPECT_EQ(mServer->velmoraGetConfig(2, tags, values), 3);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "velmoraGetConfig doPerfGetConfig failed!"));
}

TEST_F(ServerFreqTest, FreqListDumpShowsEachClientsRawRequest) {
    ASSERT_EQ(setConfig(2, {2}, {1200000}), 0);
    ASSERT_EQ(setConfig(1, {2, 20}, {1800000, 1}), 0);
    EXPECT_EQ(dump("--freqlist"), freqBlock("KX", {{2, 1800000}, {20, 1}}) +
                                      freqBlock("JN", {{2, 1200000}}) + freqBlock("ZOLA", {}) +
                                      "\n");
}

}  // namespace
}  // namespace fake
}  // namespace velmora
