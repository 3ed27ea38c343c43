// Memory-latency hints: 20480 builds its action from the event text, 20481 is a configured
// command switched on or off. Checks what reached the platform, what was logged and returned.
#include <string>
#include <vector>

#include "platform/VelmoraPlat.h"
#include "tests/server/SceneTestSupport.h"

namespace velmora {
namespace fake {
namespace {

constexpr int kRatioEvent = 20480;
constexpr int kLatencyEvent = 20481;

const std::string kLatencyCommand =
    "<cmd id=\"20481\" name=\"mem_latency\"><act><duration>100</duration>"
    "<t30>1</t30><t31>2</t31></act></cmd>";

std::string ratioText(const std::string& big, const std::string& little) {
    return "pid=12|tid=34|ratio_b=" + big + " ratio_l=" + little;
}

class ServerMemlatencyTest : public ServerSceneTest {
protected:
    int ratio(const std::string& msg, int value = kOn) {
        return mServer->velmoraEvent(kRatioEvent, msg.c_str(), 1, &value);
    }
};

TEST_F(ServerMemlatencyTest, RatiosReachThePlatformAsStringPairs) {
    // A configured command of the same id is ignored: the action comes from the text alone.
    start(
        "<cmd id=\"20480\" name=\"configured\"><act><duration>7</duration><t1>999</t1></act>"
        "</cmd>");
    EXPECT_EQ(ratio(ratioText("0.5", "0.7")), 0);
    EXPECT_EQ(ratio(ratioText("0.9", "1.25"), kOff), 0);
    const auto calls = actions();
    ASSERT_EQ(calls.size(), 2u);
    EXPECT_EQ(calls[0].id, kRatioEvent);
    EXPECT_EQ(calls[0].name, "");
    EXPECT_EQ(calls[0].duration, 0);
    EXPECT_EQ(calls[0].params, std::vector<std::string>(
                                   {"mem_latency_ratio_b", "0.5", "mem_latency_ratio_l", "0.7"}));
    EXPECT_TRUE(calls[0].tagValues.empty());
    EXPECT_EQ(calls[0].payload, std::vector<int>({kOn}));
    EXPECT_EQ(calls[1].params, std::vector<std::string>(
                                   {"mem_latency_ratio_b", "0.9", "mem_latency_ratio_l", "1.25"}));
    EXPECT_EQ(calls[1].payload, std::vector<int>({kOff}));
}

TEST_F(ServerMemlatencyTest, RatioKeepsAtMost510Characters) {
    start();
    const std::string fits(510, '3');
    const std::string tooLong(511, '3');
    EXPECT_EQ(ratio(ratioText(fits, fits)), 0);
    auto calls = actions();
    ASSERT_EQ(calls.size(), 1u);
    EXPECT_EQ(calls[0].params[1], fits);
    EXPECT_EQ(calls[0].params[3], fits);

    executor().clear();
    EXPECT_EQ(ratio(ratioText(tooLong, "0.7")), 3);
    EXPECT_EQ(ratio(ratioText("0.5", tooLong)), 3);
    EXPECT_EQ(LogCapture::count(ANDROID_LOG_ERROR, "parser failed! cmdId=20480"), 2);
    EXPECT_TRUE(actions().empty());
}

// Event texts that do not carry both ratios.
struct TextRow {
    const char* what;
    const char* msg;  // null: no text at all
};

class ServerMemlatencyTextTest : public ServerMemlatencyTest,
                                 public ::testing::WithParamInterface<TextRow> {};

TEST_P(ServerMemlatencyTextTest, FailsToParse) {
    start();
    const int on = kOn;
    EXPECT_EQ(mServer->velmoraEvent(kRatioEvent, GetParam().msg, 1, &on), 3);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "parser failed! cmdId=20480"));
    EXPECT_TRUE(actions().empty());
}

INSTANTIATE_TEST_SUITE_P(
    Rows, ServerMemlatencyTextTest,
    ::testing::Values(TextRow{"second_ratio_missing", "pid=12|tid=34|ratio_b=0.5"},
                      TextRow{"second_ratio_empty", "pid=12|tid=34|ratio_b=0.5 ratio_l="},
                      TextRow{"ratios_glued", "pid=12|tid=34|ratio_b=0.5ratio_l=0.7"},
                      TextRow{"pid_not_a_number", "pid=x|tid=34|ratio_b=0.5 ratio_l=0.7"},
                      TextRow{"tid_missing", "pid=12|ratio_b=0.5 ratio_l=0.7"},
                      TextRow{"probe_text", "pid=12|tid=34"}),
    [](const ::testing::TestParamInfo<TextRow>& info) { return std::string(info.param.what); });

// Payloads other than exactly one 0 or -1 are refused for both ids before anything is parsed.
struct PayloadRow {
    const char* what;
    int cmdId;
    unsigned int payloadNum;
    std::vector<int> payload;  // empty: null pointer
};

class ServerMemlatencyPayloadTest : public ServerMemlatencyTest,
                                    public ::testing::WithParamInterface<PayloadRow> {};

TEST_P(ServerMemlatencyPayloadTest, IsRefused) {
    start(kLatencyCommand);
    const PayloadRow& row = GetParam();
    const int* payload = row.payload.empty() ? nullptr : row.payload.data();
    // A broken text too: the payload check comes first.
    EXPECT_EQ(mServer->velmoraEvent(row.cmdId, "pid=12", row.payloadNum, payload), 3);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR,
                                "payload is invalid! cmdId=" + std::to_string(row.cmdId)));
    EXPECT_EQ(LogCapture::countContaining("parser failed"), 0);
    EXPECT_TRUE(actions().empty());
}

INSTANTIATE_TEST_SUITE_P(
    Rows, ServerMemlatencyPayloadTest,
    ::testing::Values(PayloadRow{"ratio_payload_one", kRatioEvent, 1, {1}},
                      PayloadRow{"ratio_two_ints", kRatioEvent, 2, {0, 0}},
                      PayloadRow{"latency_payload_one", kLatencyEvent, 1, {1}},
                      PayloadRow{"latency_two_ints", kLatencyEvent, 2, {-1, 0}},
                      PayloadRow{"latency_payload_minus_two", kLatencyEvent, 1, {-2}}),
    [](const ::testing::TestParamInfo<PayloadRow>& info) { return std::string(info.param.what); });

TEST_F(ServerMemlatencyTest, ConfiguredLatencyCommandIsSwitchedOnAndOff) {
    start(kLatencyCommand);
    EXPECT_EQ(mServer->velmoraEvent(kLatencyEvent, "", 1, &kOn), 0);
    EXPECT_EQ(mServer->velmoraEvent(kLatencyEvent, "", 1, &kOff), 0);
    const auto calls = actions();
    ASSERT_EQ(calls.size(), 2u);
    EXPECT_EQ(calls[0].id, kLatencyEvent);
    EXPECT_EQ(calls[0].name, "mem_latency");
    EXPECT_EQ(calls[0].duration, 100);
    EXPECT_EQ(calls[0].tagValues, std::vector<int>({30, 1, 31, 2}));
    EXPECT_EQ(calls[0].payload, std::vector<int>({kOn}));
    EXPECT_EQ(calls[1].payload, std::vector<int>({kOff}));
}

// A refusing platform and a missing executor both come back as 3, logged per id.
TEST_F(ServerMemlatencyTest, PlatformFailureIsReportedAsThree) {
    start(kLatencyCommand);
    executor().setResult(Op::DoAction, 7);
    EXPECT_EQ(ratio(ratioText("0.5", "0.7")), 3);
    EXPECT_EQ(mServer->velmoraEvent(kLatencyEvent, "", 1, &kOn), 3);
    EXPECT_EQ(actions().size(), 2u);
    env().lastPlat->mExecutorPtr = nullptr;
    EXPECT_EQ(ratio(ratioText("0.5", "0.7")), 3);
    EXPECT_EQ(mServer->velmoraEvent(kLatencyEvent, "", 1, &kOn), 3);
    EXPECT_EQ(LogCapture::count(ANDROID_LOG_ERROR, "doAction failed! cmdId=20480"), 2);
    EXPECT_EQ(LogCapture::count(ANDROID_LOG_ERROR, "doAction failed! cmdId=20481"), 2);
    EXPECT_EQ(LogCapture::countContaining("velmoraEvent"), 0);
}

}  // namespace
}  // namespace fake
}  // namespace velmora
