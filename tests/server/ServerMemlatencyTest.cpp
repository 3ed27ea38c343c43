// Memory-latency hints: 20480 builds its action from the event text, 20481 is a configured
// command switched on or off. Checks what reached the platform, what was logged and returned.
#include <string>
#include <vector>

#include "platform/VelmoraPlat.h"
#include "tests/fakes/ServerTest.h"

namespace velmora {
namespace fake {
namespace {

constexpr int kOn = 0;
constexpr int kOff = -1;
constexpr int kRatioEvent = 20480;
constexpr int kLatencyEvent = 20481;

const std::string kLatencyCommand =
    "<cmd id=\"20481\" name=\"mem_latency\"><act><duration>100</duration>"
    "<t30>1</t30><t31>2</t31></act></cmd>";

std::string ratioText(const std::string& big, const std::string& little) {
    return "pid=12|tid=34|ratio_b=" + big + " ratio_l=" + little;
}

class ServerMemlatencyTest : public ServerTest {
protected:
    void start(const std::string& extra = "") {
        ASSERT_EQ(startServer(extra), 0);
        executor().clear();
        LogCapture::clear();
    }
    int ratio(const std::string& msg, int value = kOn) {
        return mServer->velmoraEvent(kRatioEvent, msg.c_str(), 1, &value);
    }
    std::vector<ExecutorCall> actions() { return executor().calls(Op::DoAction); }
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
    EXPECT_EQ(ratio(ratioText(fits, fits)), 0);
    const auto calls = actions();
    ASSERT_EQ(calls.size(), 1u);
    EXPECT_EQ(calls[0].params[1], fits);
    EXPECT_EQ(calls[0].params[3], fits);
}

// Refused events: texts that do not carry both ratios fail to parse; payloads other than
// exactly one 0 or -1 are refused for both ids before the text is looked at.
const std::string kTooLong(511, '3');
const char* const kParserFailed = "parser failed! cmdId=20480";

struct RefusedRow {
    const char* what;
    int cmdId;
    std::string msg;
    std::vector<int> payload;  // empty: null pointer
    unsigned int payloadNum;
    std::string log;
};

class ServerMemlatencyRefusedTest : public ServerMemlatencyTest,
                                    public ::testing::WithParamInterface<RefusedRow> {};

TEST_P(ServerMemlatencyRefusedTest, ReturnsThreeAndLeavesThePlatformAlone) {
    start(kLatencyCommand);
    const RefusedRow& row = GetParam();
    const int* payload = row.payload.empty() ? nullptr : row.payload.data();
    EXPECT_EQ(mServer->velmoraEvent(row.cmdId, row.msg.c_str(), row.payloadNum, payload), 3);
    EXPECT_EQ(LogCapture::count(ANDROID_LOG_ERROR, row.log), 1) << row.log;
    EXPECT_TRUE(actions().empty());
}

std::string payloadInvalid(int cmdId) {
    return "payload is invalid! cmdId=" + std::to_string(cmdId);
}

INSTANTIATE_TEST_SUITE_P(
    Rows, ServerMemlatencyRefusedTest,
    ::testing::Values(
        RefusedRow{"first_ratio_too_long",
                   kRatioEvent,
                   ratioText(kTooLong, "0.7"),
                   {kOn},
                   1,
                   kParserFailed},
        RefusedRow{"second_ratio_too_long",
                   kRatioEvent,
                   ratioText("0.5", kTooLong),
                   {kOn},
                   1,
                   kParserFailed},
        RefusedRow{"second_ratio_missing",
                   kRatioEvent,
                   "pid=12|tid=34|ratio_b=0.5",
                   {kOn},
                   1,
                   kParserFailed},
        RefusedRow{"second_ratio_empty",
                   kRatioEvent,
                   "pid=12|tid=34|ratio_b=0.5 ratio_l=",
                   {kOn},
                   1,
                   kParserFailed},
        RefusedRow{"ratios_glued",
                   kRatioEvent,
                   "pid=12|tid=34|ratio_b=0.5ratio_l=0.7",
                   {kOn},
                   1,
                   kParserFailed},
        RefusedRow{"pid_not_a_number",
                   kRatioEvent,
                   "pid=x|tid=34|ratio_b=0.5 ratio_l=0.7",
                   {kOn},
                   1,
                   kParserFailed},
        RefusedRow{
            "tid_missing", kRatioEvent, "pid=12|ratio_b=0.5 ratio_l=0.7", {kOn}, 1, kParserFailed},
        RefusedRow{"probe_text", kRatioEvent, "pid=12|tid=34", {kOn}, 1, kParserFailed},
        // A broken text too: the payload check comes first.
        RefusedRow{"ratio_payload_one", kRatioEvent, "pid=12", {1}, 1, payloadInvalid(20480)},
        RefusedRow{"ratio_two_ints", kRatioEvent, "pid=12", {0, 0}, 2, payloadInvalid(20480)},
        RefusedRow{"latency_payload_one", kLatencyEvent, "pid=12", {1}, 1, payloadInvalid(20481)},
        RefusedRow{"latency_two_ints", kLatencyEvent, "pid=12", {-1, 0}, 2, payloadInvalid(20481)},
        RefusedRow{
            "latency_payload_minus_two", kLatencyEvent, "pid=12", {-2}, 1, payloadInvalid(20481)}),
    [](const ::testing::TestParamInfo<RefusedRow>& info) { return std::string(info.param.what); });

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
