// Hostile and malformed input at the event, set-config and get-config entry points and around
// the server's lifecycle: null pointers, negative and oversized counts, over-long texts. Each
// row states the status the host gets and the line the library logs, and checks that what was
// accepted before the bad call is still in force.
#include <climits>
#include <functional>
#include <string>
#include <vector>

#include "tests/robustness/BadInputFixture.h"

namespace velmora {
namespace fake {
namespace {

// ---------------------------------------------------------------------------------------------
// velmoraEvent

struct EventRow {
    const char* name;
    int cmdId;
    std::function<std::string()> msg;  // null: a null msg pointer
    unsigned int payloadNum;
    bool nullPayload;
    int payload;
    int status;
    int prio;
    std::string log;
};

std::string text(const std::string& s) {
    return s;
}

class BadEventTest : public BadInputTest, public ::testing::WithParamInterface<EventRow> {};

TEST_P(BadEventTest, StatusLogAndNothingLost) {
    const EventRow& row = GetParam();
    const std::string msg = row.msg ? row.msg() : std::string();
    const int payload = row.payload;
    EXPECT_EQ(mServer->velmoraEvent(row.cmdId, row.msg ? msg.c_str() : nullptr, row.payloadNum,
                                    row.nullPayload ? nullptr : &payload),
              row.status);
    expectLog(row.prio, row.log);
    expectNothingLost();
}

const std::string kLong(1 << 20, '7');

INSTANTIATE_TEST_SUITE_P(
    Rows, BadEventTest,
    ::testing::Values(
        // Unknown and out-of-range command ids.
        EventRow{"UnknownCommand", 9999, nullptr, 0, true, 0, 2, ANDROID_LOG_ERROR,
                 "velmoraEvent doParse failed! cmdId=9999, errno=1"},
        EventRow{"MostNegativeCommand", INT_MIN, nullptr, 0, true, 0, 2, ANDROID_LOG_ERROR,
                 "velmoraEvent doParse failed! cmdId=-2147483648, errno=1"},
        EventRow{"LargestCommandIsIgnored", INT_MAX, nullptr, 0, true, 0, 0, kNoLog, ""},
        // Scenes and on/off commands: exactly one payload int, 0 or -1.
        EventRow{"SceneHugeCount", 4118, nullptr, UINT_MAX, false, 0, -1, ANDROID_LOG_ERROR,
                 "invalid special scene parameters, cmdId is 4118"},
        EventRow{"OnOffNullPayload", 12288, nullptr, 1, true, 0, -1, ANDROID_LOG_ERROR,
                 "invalid special scene parameters, cmdId is 12288"},
        EventRow{"OnOffHugeCount", 12288, nullptr, UINT_MAX, false, 0, -1, ANDROID_LOG_ERROR,
                 "invalid special scene parameters, cmdId is 12288"},
        // A timed action hands the host's count and array to the platform unread.
        EventRow{"TimedActionNullPayloadHugeCount", 4098, nullptr, UINT_MAX, true, 0, 0, kNoLog,
                 ""},
        // Probe events: "pid=%d|tid=%d" and one state int.
        EventRow{"ProbeNullMsg", 4116, nullptr, 1, false, 0, -1, ANDROID_LOG_ERROR,
                 "velmora: get msg info failed!"},
        EventRow{"ProbeOverlongNumber", 4116, [] { return "pid=" + kLong + "|tid=" + kLong; }, 1,
                 false, 0, 0, kNoLog, ""},
        EventRow{"ProbeNonUtf8Msg", 4116, [] { return text("pid=\xff\xfe|tid=\xc3"); }, 1,
                 false, 0, 0, ANDROID_LOG_ERROR, "velmora: get msg info failed!"},
        EventRow{"ProbeNullPayload", 4116, [] { return text("pid=1|tid=2"); }, 1, true, 0, 2,
                 ANDROID_LOG_ERROR, "payload is NULL"},
        EventRow{"ProbeHugeCount", 4116, [] { return text("pid=1|tid=2"); }, UINT_MAX, false, 0,
                 2, ANDROID_LOG_ERROR, "invalid payload, payloadNum=-1"},
        // Memory latency: payload checked first, then the text of 20480.
        EventRow{"MemlatNullPayload", 20480, [] { return text("pid=1|tid=2|ratio_b=1 ratio_l=2"); },
                 1, true, 0, 3, ANDROID_LOG_ERROR, "payload is invalid! cmdId=20480"},
        EventRow{"MemlatHugeCount", 20481, nullptr, UINT_MAX, false, 0, 3, ANDROID_LOG_ERROR,
                 "payload is invalid! cmdId=20481"},
        EventRow{"MemlatNullMsg", 20480, nullptr, 1, false, 0, 3, ANDROID_LOG_ERROR,
                 "parser failed! cmdId=20480"},
        EventRow{"MemlatUnconfiguredCommand", 20481, nullptr, 1, false, 0, 2, ANDROID_LOG_ERROR,
                 "doParse failed! cmdId=20481, errno=1"},
        // Notification and client restart with odd payloads.
        EventRow{"NotificationNullPayload", 20225, nullptr, 1, true, 0, 0, kNoLog, ""},
        EventRow{"NotificationHugeCount", 20225, nullptr, UINT_MAX, false, 0, 0, kNoLog, ""}),
    [](const ::testing::TestParamInfo<EventRow>& info) { return std::string(info.param.name); });

// ---------------------------------------------------------------------------------------------
// velmoraSetConfig / velmoraGetConfig

struct SetConfigRow {
    const char* name;
    int clientId;
    int tagLen;
    std::vector<int> tags;     // empty: null pointer
    std::vector<int> configs;  // empty: null pointer
    int status;
    int prio;
    std::string log;
};

class BadSetConfigTest : public BadInputTest,
                         public ::testing::WithParamInterface<SetConfigRow> {};

TEST_P(BadSetConfigTest, StatusLogAndNothingLost) {
    const SetConfigRow& row = GetParam();
    EXPECT_EQ(mServer->velmoraSetConfig(row.clientId, row.tagLen,
                                        row.tags.empty() ? nullptr : row.tags.data(),
                                        row.configs.empty() ? nullptr : row.configs.data()),
              row.status);
    expectLog(row.prio, row.log);
    EXPECT_TRUE(executor().calls(Op::SetConfig).empty());
    EXPECT_TRUE(executor().calls(Op::SchedLevel).empty());
    expectNothingLost();
}

INSTANTIATE_TEST_SUITE_P(
    Rows, BadSetConfigTest,
    ::testing::Values(
        SetConfigRow{"NegativeCount", 1, -1, {2}, {100}, 3, ANDROID_LOG_ERROR,
                     "velmoraSetConfig invalid request, clientId=1, tagLen=-1"},
        SetConfigRow{"MostNegativeCount", 2, INT_MIN, {}, {}, 3, ANDROID_LOG_ERROR,
                     "velmoraSetConfig invalid request, clientId=2, tagLen=-2147483648"},
        SetConfigRow{"NullTags", 1, 1, {}, {100}, 3, ANDROID_LOG_ERROR,
                     "velmoraSetConfig invalid request, clientId=1, tagLen=1"},
        SetConfigRow{"NullConfigs", 1, 1, {2}, {}, 3, ANDROID_LOG_ERROR,
                     "velmoraSetConfig invalid request, clientId=1, tagLen=1"},
        SetConfigRow{"NegativeConfig", 1, 1, {2}, {-5}, 3, ANDROID_LOG_ERROR,
                     "velmoraSetConfig failed!"},
        SetConfigRow{"EventIdAsClient", 4096, 1, {2}, {100}, 3, ANDROID_LOG_ERROR,
                     "velmoraSetConfig failed!"},
        SetConfigRow{"SchedRequestOfUnknownClient", 9, 1, {42}, {0x10014}, -1, ANDROID_LOG_ERROR,
                     "invalid clientId is 9"},
        SetConfigRow{"SchedRequestTooManyPairs", 1, 9, std::vector<int>(9, 42),
                     std::vector<int>(9, 0x10014), -1, ANDROID_LOG_ERROR,
                     "velmoraSetConfig doPerfSetSchedLevel failed! clientId=1"},
        SetConfigRow{"SchedLevelOffTheScale", 1, 1, {42}, {0x10000 | 200}, -1, ANDROID_LOG_ERROR,
                     "velmoraSetConfig doPerfSetSchedLevel failed! clientId=1"},
        SetConfigRow{"SchedGroupOutOfRange", 1, 1, {42}, {static_cast<int>(0xFFFF0014)}, -1,
                     ANDROID_LOG_ERROR, "velmoraSetConfig doPerfSetSchedLevel failed! clientId=1"}),
    [](const ::testing::TestParamInfo<SetConfigRow>& info) {
        return std::string(info.param.name);
    });

TEST_F(BadInputTest, OversizedClientRequestSpillsToTheHeapAndIsLoggedPerTag) {
    // Far more tags than an event may carry: the manager spills its arrays to the heap, the
    // platform gets all of them, and each one is logged.
    constexpr int kTags = 20000;
    std::vector<int> tags(kTags, 99);
    std::vector<int> configs(kTags, 1);
    EXPECT_EQ(mServer->velmoraSetConfig(2, kTags, tags.data(), configs.data()), 0);
    const auto calls = executor().calls(Op::SetConfig);
    ASSERT_EQ(calls.size(), 1u);
    EXPECT_EQ(calls[0].tags.size(), static_cast<size_t>(kTags));
    EXPECT_EQ(LogCapture::countContaining("setConfig clientId=2, tagLen=20000"), kTags);
    expectNothingLost();
}

struct GetConfigRow {
    const char* name;
    int tagLen;
    bool nullTags;
    bool nullConfigs;
    int status;
    int prio;
    std::string log;
};

class BadGetConfigTest : public BadInputTest,
                         public ::testing::WithParamInterface<GetConfigRow> {};

TEST_P(BadGetConfigTest, StatusLogAndNothingLost) {
    const GetConfigRow& row = GetParam();
    const int tags[1] = {22};
    int configs[1] = {-1};
    EXPECT_EQ(mServer->velmoraGetConfig(row.tagLen, row.nullTags ? nullptr : tags,
                                        row.nullConfigs ? nullptr : configs),
              row.status);
    expectLog(row.prio, row.log);
    EXPECT_TRUE(executor().calls(Op::GetConfig).empty());
    expectNothingLost();
}

INSTANTIATE_TEST_SUITE_P(
    Rows, BadGetConfigTest,
    ::testing::Values(GetConfigRow{"NegativeCount", -3, false, false, 3, ANDROID_LOG_ERROR,
                                   "velmoraGetConfig invalid request, tagLen=-3"},
                      GetConfigRow{"NullTags", 1, true, false, 3, ANDROID_LOG_ERROR,
                                   "velmoraGetConfig invalid request, tagLen=1"},
                      GetConfigRow{"NullConfigs", 1, false, true, 3, ANDROID_LOG_ERROR,
                                   "velmoraGetConfig invalid request, tagLen=1"}),
    [](const ::testing::TestParamInfo<GetConfigRow>& info) {
        return std::string(info.param.name);
    });

// ---------------------------------------------------------------------------------------------
// Lifecycle misuse

TEST_F(BadInputTest, EntryPointsAfterDeleteObject) {
    mServer->deleteObject();
    mServer->deleteObject();  // a second release finds nothing to free
    const int tag = 2;
    int value = 0;
    EXPECT_EQ(mServer->velmoraEvent(kTimed, "", 1, &kOn), 4);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "isVelmoraEnable mPlatPtr failed!"));
    EXPECT_EQ(mServer->velmoraSetConfig(1, 1, &tag, &kKxCap), 4);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "init mFreqClientPtr failed!"));
    EXPECT_EQ(mServer->velmoraGetConfig(1, &tag, &value), 4);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR, "init mPlatPtr failed!"));
    EXPECT_EQ(dump("--freqlist"), "\n");
    EXPECT_EQ(dump("--easgrouplist"), "\n");
    EXPECT_EQ(env().platformsDeleted, 1);
}

TEST_F(BadInputTest, EntryPointsBeforeInit) {
    VelmoraServer fresh;
    const int tag = 2;
    int value = 0;
    EXPECT_EQ(fresh.velmoraEvent(kTimed, "", 1, &kOn), 1);
    EXPECT_EQ(fresh.velmoraEvent(20230, "", 0, nullptr), 1);
    EXPECT_EQ(fresh.velmoraSetConfig(1, -1, nullptr, nullptr), 1);
    EXPECT_EQ(fresh.velmoraGetConfig(1, &tag, &value), 1);
    fresh.deleteObject();
    fresh.deleteActionPtr(nullptr);
    EXPECT_TRUE(LogCapture::lines().empty());
}

}  // namespace
}  // namespace fake
}  // namespace velmora
