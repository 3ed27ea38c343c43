// Hostile and malformed input at the dump entry point (arguments, unusable descriptors) and in
// the configuration file (broken, hostile or incomplete documents, tried by a reload and by a
// fresh init). Each row states the reply or status and the line the library logs.
#include <fcntl.h>
#include <signal.h>
#include <unistd.h>

#include <functional>
#include <string>
#include <vector>

#include "config/VelmoraLoadXml.h"
#include "tests/robustness/BadInputFixture.h"

namespace velmora {
namespace fake {
namespace {

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
    EXPECT_EQ(dumpArgs(row.args), row.reply);
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

}  // namespace
}  // namespace fake
}  // namespace velmora
