// Hostile and malformed input at the event, set-config, get-config and dump entry points and
// around the server's lifecycle: null pointers, negative and oversized counts, over-long texts.
// Each row states what the host gets back and the line the library logs, checks that nothing
// reached the platform and that what was accepted before the bad call is still in force.
#include <climits>
#include <functional>
#include <string>
#include <vector>

#include "tests/robustness/BadInputFixture.h"

namespace velmora {
namespace fake {
namespace {

// What the host gets back: the status, or the reply a dump writes to its descriptor.
using Call = std::function<std::string(BadInputTest&)>;

constexpr int kNull = INT_MIN;  // payload word standing for a null payload pointer

Call event(int cmdId, const char* msg, unsigned int payloadNum, int word = kOn) {
    return [=](BadInputTest& test) {
        return std::to_string(
            test.server().velmoraEvent(cmdId, msg, payloadNum, word == kNull ? nullptr : &word));
    };
}

// Empty tags or configs stand for a null pointer.
Call setConfig(int clientId, int tagLen, std::vector<int> tags, std::vector<int> configs) {
    return [=](BadInputTest& test) {
        return std::to_string(
            test.server().velmoraSetConfig(clientId, tagLen, tags.empty() ? nullptr : tags.data(),
                                           configs.empty() ? nullptr : configs.data()));
    };
}

Call getConfig(int tagLen, bool withTags, bool withConfigs) {
    return [=](BadInputTest& test) {
        const int tag = 22;
        int value = -1;
        return std::to_string(test.server().velmoraGetConfig(tagLen, withTags ? &tag : nullptr,
                                                             withConfigs ? &value : nullptr));
    };
}

Call dump(std::vector<std::string> args) {
    return [=](BadInputTest& test) { return test.dumpArgs(args); };
}

struct CallRow {
    const char* name;
    Call call;
    std::string result;
    std::string log;  // the one line logged; empty: nothing logged
    int prio = ANDROID_LOG_ERROR;
    bool reachesPlatform = false;
};

class BadCallTest : public BadInputTest, public ::testing::WithParamInterface<CallRow> {};

TEST_P(BadCallTest, ResultLogAndNothingLost) {
    const CallRow& row = GetParam();
    EXPECT_EQ(row.call(*this), row.result);
    expectLog(row.log, row.prio);
    if (!row.reachesPlatform) {
        EXPECT_TRUE(executor().calls().empty()) << "the platform was called";
    }
    expectNothingLost();
}

const std::string kLong(1 << 20, '7');
const std::string kLongIds = "pid=" + kLong + "|tid=" + kLong;
const std::string kLongRatio = "pid=1|tid=2|ratio_b=" + kLong + " ratio_l=2";
const char* const kSceneError = "invalid special scene parameters, cmdId is 4118";
const char* const kOnOffError = "invalid special scene parameters, cmdId is 12288";
const char* const kMsgError = "velmora: get msg info failed!";
const char* const kSetError = "velmoraSetConfig failed!";
const char* const kSchedError = "velmoraSetConfig doPerfSetSchedLevel failed! clientId=1";

INSTANTIATE_TEST_SUITE_P(
    Rows, BadCallTest,
    ::testing::Values(
        // velmoraEvent: unknown and out-of-range command ids.
        CallRow{"UnknownCommand", event(9999, nullptr, 0, kNull), "2",
                "velmoraEvent doParse failed! cmdId=9999, errno=1"},
        CallRow{"MostNegativeCommand", event(INT_MIN, nullptr, 0, kNull), "2",
                "velmoraEvent doParse failed! cmdId=-2147483648, errno=1"},
        CallRow{"LargestCommandIsIgnored", event(INT_MAX, nullptr, 0, kNull), "0", ""},
        // Scenes and on/off commands: exactly one payload int, 0 or -1.
        CallRow{"SceneNullPayload", event(4118, nullptr, 1, kNull), "-1", kSceneError},
        CallRow{"SceneHugeCount", event(4118, nullptr, UINT_MAX), "-1", kSceneError},
        CallRow{"SceneBadWord", event(4118, nullptr, 1, 7), "-1", kSceneError},
        CallRow{"OnOffNullPayload", event(12288, nullptr, 1, kNull), "-1", kOnOffError},
        CallRow{"OnOffHugeCount", event(12288, nullptr, UINT_MAX), "-1", kOnOffError},
        // A timed action hands the host's count and array to the platform unread.
        CallRow{"TimedActionNullPayloadHugeCount", event(4098, nullptr, UINT_MAX, kNull), "0", "",
                ANDROID_LOG_ERROR, true},
        // Probe events: "pid=%d|tid=%d" and one state int. A message without both ids answers
        // the number of ids read.
        CallRow{"ProbeNullMsg", event(4116, nullptr, 1), "-1", kMsgError},
        CallRow{"ProbeGarbageMsgReadsNothing", event(4116, "garbage", 1), "0", kMsgError},
        CallRow{"ProbePidOnly", event(4116, "pid=12", 1), "1", kMsgError},
        CallRow{"ProbeOverlongNumber", event(4116, kLongIds.c_str(), 1), "0", "", ANDROID_LOG_ERROR,
                true},
        CallRow{"ProbeNonUtf8Msg", event(4116, "pid=\xff\xfe|tid=\xc3", 1), "0", kMsgError},
        CallRow{"ProbeNullPayload", event(4116, "pid=1|tid=2", 1, kNull), "2", "payload is NULL"},
        CallRow{"ProbeHugeCount", event(4116, "pid=1|tid=2", UINT_MAX), "2",
                "invalid payload, payloadNum=-1"},
        CallRow{"ProbeBadState", event(4116, "pid=1|tid=2", 1, 3), "2",
                "error case: state=3, pid=1, tid=2\n", ANDROID_LOG_DEBUG},
        // Memory latency: payload checked first, then the text of 20480.
        CallRow{"MemlatNullPayload", event(20480, "pid=1|tid=2|ratio_b=1 ratio_l=2", 1, kNull), "3",
                "payload is invalid! cmdId=20480"},
        CallRow{"MemlatHugeCount", event(20481, nullptr, UINT_MAX), "3",
                "payload is invalid! cmdId=20481"},
        CallRow{"MemlatNullMsg", event(20480, nullptr, 1), "3", "parser failed! cmdId=20480"},
        CallRow{"MemlatOverlongRatio", event(20480, kLongRatio.c_str(), 1), "3",
                "parser failed! cmdId=20480"},
        CallRow{"MemlatUnconfiguredCommand", event(20481, nullptr, 1), "2",
                "doParse failed! cmdId=20481, errno=1"},
        // Notification with odd payloads: ignored.
        CallRow{"NotificationNullPayload", event(20225, nullptr, 1, kNull), "0", ""},
        CallRow{"NotificationHugeCount", event(20225, nullptr, UINT_MAX), "0", ""},
        // velmoraSetConfig
        CallRow{"SetConfigNegativeCount", setConfig(1, -1, {2}, {100}), "3",
                "velmoraSetConfig invalid request, clientId=1, tagLen=-1"},
        CallRow{"SetConfigMostNegativeCount", setConfig(2, INT_MIN, {}, {}), "3",
                "velmoraSetConfig invalid request, clientId=2, tagLen=-2147483648"},
        CallRow{"SetConfigNullTags", setConfig(1, 1, {}, {100}), "3",
                "velmoraSetConfig invalid request, clientId=1, tagLen=1"},
        CallRow{"SetConfigNullConfigs", setConfig(1, 1, {2}, {}), "3",
                "velmoraSetConfig invalid request, clientId=1, tagLen=1"},
        CallRow{"NegativeConfig", setConfig(1, 1, {2}, {-5}), "3", kSetError},
        CallRow{"EventIdAsClient", setConfig(4096, 1, {2}, {100}), "3", kSetError},
        CallRow{"SchedRequestOfUnknownClient", setConfig(9, 1, {42}, {0x10014}), "-1",
                "invalid clientId is 9"},
        CallRow{"SchedRequestTooManyPairs",
                setConfig(1, 9, std::vector<int>(9, 42), std::vector<int>(9, 0x10014)), "-1",
                kSchedError},
        CallRow{"SchedLevelOffTheScale", setConfig(1, 1, {42}, {0x10000 | 200}), "-1", kSchedError},
        CallRow{"SchedGroupOutOfRange", setConfig(1, 1, {42}, {static_cast<int>(0xFFFF0014)}), "-1",
                kSchedError},
        // velmoraGetConfig
        CallRow{"GetConfigNegativeCount", getConfig(-3, true, true), "3",
                "velmoraGetConfig invalid request, tagLen=-3"},
        CallRow{"GetConfigNullTags", getConfig(1, false, true), "3",
                "velmoraGetConfig invalid request, tagLen=1"},
        CallRow{"GetConfigNullConfigs", getConfig(1, true, false), "3",
                "velmoraGetConfig invalid request, tagLen=1"},
        // dumpVelmoraServerInfo
        CallRow{"DumpToNegativeDescriptorOnlyLogs",
                [](BadInputTest& test) {
                    test.server().dumpVelmoraServerInfo(-1, {"--help"});
                    return std::string();
                },
                "", "invalid dump FD, -1\n", ANDROID_LOG_WARN},
        CallRow{"DumpNoArgument", dump({}), "", "dump parameter is NULL!\n", ANDROID_LOG_WARN},
        CallRow{"DumpTwoArguments", dump({"--help", "--help"}), "",
                "there is too many dump parameter!\n", ANDROID_LOG_WARN},
        CallRow{"DumpOverlong", dump({std::string(513, 'a')}), "", "debug parameter is too long!\n",
                ANDROID_LOG_WARN},
        CallRow{"DumpHugeArgument", dump({std::string(1 << 20, '-')}), "",
                "debug parameter is too long!\n", ANDROID_LOG_WARN},
        CallRow{"DumpEmbeddedNul", dump({std::string("--help\0x", 8)}), "invalid parameter!\n\n",
                ""},
        CallRow{"DumpNonUtf8", dump({"--\xff\xfe"}), "invalid parameter!\n\n", ""},
        CallRow{"DumpEmptyString", dump({""}), "invalid parameter!\n\n", ""}),
    [](const ::testing::TestParamInfo<CallRow>& info) { return std::string(info.param.name); });

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
