// Hostile and malformed input at every entry point: null pointers, negative and oversized
// counts, over-long texts, broken or hostile configuration files, unusable dump descriptors.
// Each row states the status the host gets and the line the library logs; every row also
// checks that what was accepted before the bad call is still in force afterwards (a client cap
// in the "--freqlist" dump, the current scene, a configured timed action).
// docs/bad-input.md lists the same rows.
#include <fcntl.h>
#include <signal.h>
#include <unistd.h>

#include <climits>
#include <cstdio>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "config/VelmoraLoadXml.h"
#include "tests/fakes/ServerTest.h"

namespace velmora {
namespace fake {
namespace {

constexpr int kOn = 0;
constexpr int kScene = 4118;
constexpr int kTimed = 4098;
constexpr int kKxCap = 1200000;
constexpr int kNoLog = -1;  // prio of a row that logs nothing

const char* const kCommands =
    "<cmd id=\"4098\" name=\"winswitch\"><act><duration>500</duration><t1>1000000</t1></act></cmd>"
    "<cmd id=\"4118\" name=\"scene\"><act><duration>0</duration><t1>1500</t1></act></cmd>"
    "<cmd id=\"12288\" name=\"little_cap\"><act><duration>0</duration><t2>1500000</t2></act>"
    "</cmd>";

// The prefix of the "--freqlist" dump that shows client KX's accepted little-cluster cap.
const std::string kKxCapLine = "KX set freq is:\ntag=little cpu max,        value=1200000\n";

class BadInputTest : public ServerTest {
protected:
    void SetUp() override {
        ServerTest::SetUp();
        ASSERT_EQ(startServer(kCommands), 0);
        // Accepted before the bad call; must survive it.
        const int tag = 2;
        ASSERT_EQ(mServer->velmoraSetConfig(1, 1, &tag, &kKxCap), 0);
        ASSERT_EQ(mServer->velmoraEvent(kScene, "", 1, &kOn), 0);
        executor().clear();
        LogCapture::clear();
    }


    // What was accepted before is still in force: the client cap is listed, the scene is still
    // current, and the configured timed action still runs.
    void expectNothingLost() {
        EXPECT_EQ(dump("--freqlist").compare(0, kKxCapLine.size(), kKxCapLine), 0)
            << "client cap lost";
        {
            android::Mutex::Autolock lock(mServer->mMutex);
            EXPECT_EQ(mServer->mCurSpecialCmdId, kScene);
        }
        executor().clear();
        EXPECT_EQ(mServer->velmoraEvent(kTimed, "", 1, &kOn), 0);
        const auto calls = executor().calls(Op::DoAction);
        ASSERT_EQ(calls.size(), 1u);
        EXPECT_EQ(calls[0].tagValues, (std::vector<int>{1, 1000000}));
    }

    void expectLog(int prio, const std::string& log) {
        if (prio == kNoLog) {
            EXPECT_TRUE(LogCapture::lines().empty()) << "first line: "
                                                     << LogCapture::lines()[0].msg;
        } else {
            EXPECT_EQ(LogCapture::count(prio, log), 1) << "missing log line: " << log;
        }
    }
};

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
        EventRow{"SceneNullPayload", 4118, nullptr, 1, true, 0, -1, ANDROID_LOG_ERROR,
                 "invalid special scene parameters, cmdId is 4118"},
        EventRow{"SceneHugeCount", 4118, nullptr, UINT_MAX, false, 0, -1, ANDROID_LOG_ERROR,
                 "invalid special scene parameters, cmdId is 4118"},
        EventRow{"SceneBadWord", 4118, nullptr, 1, false, 7, -1, ANDROID_LOG_ERROR,
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
        EventRow{"ProbeGarbageMsgReadsNothing", 4116, [] { return text("garbage"); }, 1, false,
                 0, 0, ANDROID_LOG_ERROR, "velmora: get msg info failed!"},
        EventRow{"ProbePidOnly", 4116, [] { return text("pid=12"); }, 1, false, 0, 1,
                 ANDROID_LOG_ERROR, "velmora: get msg info failed!"},
        EventRow{"ProbeOverlongNumber", 4116, [] { return "pid=" + kLong + "|tid=" + kLong; }, 1,
                 false, 0, 0, kNoLog, ""},
        EventRow{"ProbeNonUtf8Msg", 4116, [] { return text("pid=\xff\xfe|tid=\xc3"); }, 1,
                 false, 0, 0, ANDROID_LOG_ERROR, "velmora: get msg info failed!"},
        EventRow{"ProbeNullPayload", 4116, [] { return text("pid=1|tid=2"); }, 1, true, 0, 2,
                 ANDROID_LOG_ERROR, "payload is NULL"},
        EventRow{"ProbeHugeCount", 4116, [] { return text("pid=1|tid=2"); }, UINT_MAX, false, 0,
                 2, ANDROID_LOG_ERROR, "invalid payload, payloadNum=-1"},
        EventRow{"ProbeBadState", 4116, [] { return text("pid=1|tid=2"); }, 1, false, 3, 2,
                 ANDROID_LOG_DEBUG, "error case: state=3, pid=1, tid=2\n"},
        // Memory latency: payload checked first, then the text of 20480.
        EventRow{"MemlatNullPayload", 20480, [] { return text("pid=1|tid=2|ratio_b=1 ratio_l=2"); },
                 1, true, 0, 3, ANDROID_LOG_ERROR, "payload is invalid! cmdId=20480"},
        EventRow{"MemlatHugeCount", 20481, nullptr, UINT_MAX, false, 0, 3, ANDROID_LOG_ERROR,
                 "payload is invalid! cmdId=20481"},
        EventRow{"MemlatNullMsg", 20480, nullptr, 1, false, 0, 3, ANDROID_LOG_ERROR,
                 "parser failed! cmdId=20480"},
        EventRow{"MemlatOverlongRatio", 20480,
                 [] { return "pid=1|tid=2|ratio_b=" + kLong + " ratio_l=2"; }, 1, false, 0, 3,
                 ANDROID_LOG_ERROR, "parser failed! cmdId=20480"},
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
// dumpVelmoraServerInfo

struct DumpRow {
    const char* name;
    std::vector<std::string> args;
    std::string reply;  // what the descriptor receives
    int prio;
    std::string log;
};

class BadDumpTest : public BadInputTest, public ::testing::WithParamInterface<DumpRow> {};

TEST_P(BadDumpTest, ReplyLogAndNothingLost) {
    const DumpRow& row = GetParam();
    int fds[2];
    ASSERT_EQ(pipe(fds), 0);
    mServer->dumpVelmoraServerInfo(fds[1], row.args);
    close(fds[1]);
    std::string reply;
    char buf[4096];
    ssize_t n;
    while ((n = read(fds[0], buf, sizeof(buf))) > 0) {
        reply.append(buf, static_cast<size_t>(n));
    }
    close(fds[0]);
    EXPECT_EQ(reply, row.reply);
    expectLog(row.prio, row.log);
    expectNothingLost();
}

INSTANTIATE_TEST_SUITE_P(
    Rows, BadDumpTest,
    ::testing::Values(
        DumpRow{"NoArgument", {}, "", ANDROID_LOG_WARN, "dump parameter is NULL!\n"},
        DumpRow{"TwoArguments", {"--help", "--help"}, "", ANDROID_LOG_WARN,
                "there is too many dump parameter!\n"},
        DumpRow{"Overlong", {std::string(513, 'a')}, "", ANDROID_LOG_WARN,
                "debug parameter is too long!\n"},
        DumpRow{"HugeArgument", {std::string(1 << 20, '-')}, "", ANDROID_LOG_WARN,
                "debug parameter is too long!\n"},
        DumpRow{"EmbeddedNul", {std::string("--help\0x", 8)}, "invalid parameter!\n\n", kNoLog,
                ""},
        DumpRow{"NonUtf8", {"--\xff\xfe"}, "invalid parameter!\n\n", kNoLog, ""},
        DumpRow{"EmptyString", {""}, "invalid parameter!\n\n", kNoLog, ""}),
    [](const ::testing::TestParamInfo<DumpRow>& info) { return std::string(info.param.name); });

TEST_F(BadInputTest, DumpToNegativeDescriptorOnlyLogs) {
    mServer->dumpVelmoraServerInfo(-1, {"--help"});
    expectLog(ANDROID_LOG_WARN, "invalid dump FD, -1\n");
    expectNothingLost();
}

TEST_F(BadInputTest, DumpToClosedDescriptorLogsTheFailedWrite) {
    int fds[2];
    ASSERT_EQ(pipe(fds), 0);
    close(fds[0]);
    close(fds[1]);
    mServer->dumpVelmoraServerInfo(fds[1], {"--help"});
    EXPECT_EQ(LogCapture::countContaining("dump write failed, fd=" + std::to_string(fds[1]) +
                                          ", errno=9"),
              1);
    expectNothingLost();
}

TEST_F(BadInputTest, DumpToReadOnlyDescriptorLogsTheFailedWrite) {
    const int fd = open("/dev/null", O_RDONLY);
    ASSERT_GE(fd, 0);
    mServer->dumpVelmoraServerInfo(fd, {"--freqlist"});
    close(fd);
    EXPECT_EQ(LogCapture::countContaining("dump write failed, fd=" + std::to_string(fd) +
                                          ", errno=9"),
              1);
    expectNothingLost();
}

TEST_F(BadInputTest, DumpToPipeWithoutReaderLogsTheFailedWrite) {
    // SIGPIPE at its default action, which would end the process: the dump must not raise it.
    struct sigaction deflt = {};
    struct sigaction previous = {};
    deflt.sa_handler = SIG_DFL;
    sigaction(SIGPIPE, &deflt, &previous);
    int fds[2];
    ASSERT_EQ(pipe(fds), 0);
    close(fds[0]);
    mServer->dumpVelmoraServerInfo(fds[1], {"--easgrouplist"});
    close(fds[1]);
    sigaction(SIGPIPE, &previous, nullptr);
    sigset_t pending;
    sigemptyset(&pending);
    sigpending(&pending);
    EXPECT_EQ(sigismember(&pending, SIGPIPE), 0) << "a SIGPIPE was left pending";
    EXPECT_EQ(LogCapture::countContaining("dump write failed, fd=" + std::to_string(fds[1]) +
                                          ", errno=32"),
              1);
    expectNothingLost();
}

// ---------------------------------------------------------------------------------------------
// The loader on a configuration file: a reload (20230) with the bad file must keep the
// configuration in force; a fresh server on the same file reports its init status.

struct FileRow {
    const char* name;
    std::function<std::string()> content;
    int initStatus;
    std::string log;  // a line both the reload and the init write
    bool reloadRefused = true;  // the reload keeps the configuration in force
};

std::string nested(int depth) {
    std::string s;
    for (int i = 0; i < depth; ++i) {
        s += "<n>";
    }
    for (int i = 0; i < depth; ++i) {
        s += "</n>";
    }
    return s;
}

std::string billionLaughs() {
    std::string dtd = "<?xml version=\"1.0\"?>\n<!DOCTYPE policy [\n<!ENTITY lol \"lol\">\n";
    for (int i = 1; i <= 9; ++i) {
        dtd += "<!ENTITY lol" + std::to_string(i) + " \"";
        for (int j = 0; j < 10; ++j) {
            dtd += i == 1 ? "&lol;" : "&lol" + std::to_string(i - 1) + ";";
        }
        dtd += "\">\n";
    }
    return dtd + "]>\n<policy>" + kStartupCommands +
           "<cmd id=\"4098\" name=\"&lol9;\"><act><duration>500</duration><t1>&lol9;</t1></act>"
           "</cmd></policy>\n";
}

class BadFileTest : public BadInputTest, public ::testing::WithParamInterface<FileRow> {};

TEST_P(BadFileTest, ReloadKeepsTheConfigurationAndInitReportsIt) {
    const FileRow& row = GetParam();
    writeCustConfig(row.content());
    EXPECT_EQ(mServer->velmoraEvent(20230, "", 0, nullptr), 0);
    if (!row.log.empty()) {
        EXPECT_EQ(LogCapture::countContaining(row.log), 1) << row.log;
    }
    if (row.reloadRefused) {
        expectNothingLost();
    }

    LogCapture::clear();
    VelmoraServer fresh;
    EXPECT_EQ(fresh.init(), row.initStatus);
    if (!row.log.empty()) {
        EXPECT_EQ(LogCapture::countContaining(row.log), 1) << row.log;
    }
}

std::string startupPlus(const std::string& body) {
    return policyXml(std::string(kStartupCommands) + body);
}

INSTANTIATE_TEST_SUITE_P(
    Rows, BadFileTest,
    ::testing::Values(
        FileRow{"EmptyFile", [] { return std::string(); }, -1, "LoadFile error"},
        FileRow{"Unterminated",
                [] { return startupPlus("").substr(0, 60); }, -1, "LoadFile error"},
        FileRow{"NoPolicyElement", [] { return std::string("<other/>"); }, -1,
                "get velmora_config_cust.xml failed!,ret:3"},
        FileRow{"OnlyUnusableIds",
                [] { return policyXml("<cmd id=\"0x10\"/><cmd id=\"1e3\"/><cmd/>"); }, -1,
                "empty rawXmlDataMap!!"},
        FileRow{"DeepNesting", [] { return startupPlus(nested(100000)); }, -1,
                "LoadFile error"},
        FileRow{"BillionLaughs", billionLaughs, 0, "", false},
        FileRow{"HugeAttribute",
                [] {
                    return startupPlus("<cmd id=\"4098\" name=\"" + std::string(1 << 22, 'x') +
                                       "\"><act><duration>500</duration><t1>1</t1></act></cmd>");
                },
                0, "", false},
        FileRow{"NonUtf8",
                [] {
                    return startupPlus("<cmd id=\"4098\" name=\"\xff\xfe\xc3\"><act><duration>"
                                       "500</duration><t1>1</t1></act></cmd>");
                },
                0, "", false},
        FileRow{"BinaryGarbage", [] { return std::string("\x00\x01\x02\xff<policy>", 12); }, -1,
                "LoadFile error"},
        FileRow{"ParameterWithoutText",
                [] {
                    return startupPlus(
                        "<cmd id=\"4098\" name=\"w\"><act><duration/><t1>1</t1></act></cmd>");
                },
                0, "xml name or value is NULL!", false},
        FileRow{"MissingStartupCommand",
                [] {
                    return policyXml(
                        "<cmd id=\"4116\" name=\"probe\"><act><duration>8</duration></act></cmd>");
                },
                2, "", false}),
    [](const ::testing::TestParamInfo<FileRow>& info) { return std::string(info.param.name); });

TEST_F(BadInputTest, BillionLaughsIsNotExpanded) {
    // The document loads, but entity declarations are not honoured: the reference stays as it
    // was written, so memory stays bounded.
    writeCustConfig(billionLaughs());
    EXPECT_EQ(mServer->velmoraEvent(20230, "", 0, nullptr), 0);
    executor().clear();
    EXPECT_EQ(mServer->velmoraEvent(kTimed, "", 1, &kOn), 0);
    const auto calls = executor().calls(Op::DoAction);
    ASSERT_EQ(calls.size(), 1u);
    EXPECT_LT(calls[0].name.size(), 64u);
}

TEST_F(BadInputTest, MissingConfigurationFile) {
    env().custConfigPath = mTmpDir + "/does-not-exist.xml";
    EXPECT_EQ(mServer->velmoraEvent(20230, "", 0, nullptr), 0);
    EXPECT_EQ(LogCapture::countContaining("LoadFile error"), 1);
    expectNothingLost();
    env().custConfigPath.clear();
    VelmoraServer fresh;
    EXPECT_EQ(fresh.init(), -1);
    EXPECT_TRUE(LogCapture::has(ANDROID_LOG_ERROR,
                                "velmora_config_cust.xml is not exit or file is invalid!"));
}

TEST_F(BadInputTest, LoaderRejectsNullArguments) {
    struct Loader : VelmoraLoadXml {
        ActionMap* createActionMap(RawXmlDataMap&) override { return nullptr; }
    } loader;
    RawXmlDataMap map;
    EXPECT_EQ(loader.innerLoad(nullptr, &map), 2);
    EXPECT_EQ(loader.innerLoad("/dev/null", nullptr), 2);
    VelmoraLoadXml::freeRawXmlDataMap(nullptr);
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
    EXPECT_EQ(fresh.velmoraSetConfig(1, -1, nullptr, nullptr), 1);
    EXPECT_EQ(fresh.velmoraGetConfig(1, &tag, &value), 1);
    fresh.deleteObject();
    fresh.deleteActionPtr(nullptr);
    EXPECT_TRUE(LogCapture::lines().empty());
}

}  // namespace
}  // namespace fake
}  // namespace velmora
