// Hostile and malformed input at the dump entry point (arguments, unusable descriptors) and in
// the configuration file (broken, hostile or incomplete documents, tried by a reload and by a
// fresh init). Each row states the reply or status and the line the library logs.
#include <errno.h>
#include <fcntl.h>
#include <signal.h>
#include <unistd.h>

#include <atomic>
#include <functional>
#include <string>
#include <thread>
#include <utility>
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

// Descriptors a dump cannot write to. Each row opens its descriptor (and a peer to close
// afterwards, or -1); the dump must give up at once with one log line naming the error, never
// block, and never raise SIGPIPE.
struct DumpFdRow {
    const char* name;
    std::function<std::pair<int, int>()> open;  // {descriptor to dump to, peer}
    int error;
};

std::pair<int, int> closedPipeEnd() {
    int fds[2] = {-1, -1};
    if (pipe(fds) == 0) {
        close(fds[0]);
        close(fds[1]);
    }
    return {fds[1], -1};
}

std::pair<int, int> pipeWithoutReader() {
    int fds[2] = {-1, -1};
    if (pipe(fds) == 0) {
        close(fds[0]);
    }
    return {fds[1], -1};
}

std::pair<int, int> fullNonBlockingPipe() {
    int fds[2] = {-1, -1};
    if (pipe2(fds, O_NONBLOCK) != 0) {
        return {-1, -1};
    }
    const std::string chunk(4096, 'x');
    while (write(fds[1], chunk.data(), chunk.size()) > 0) {
    }
    return {fds[1], fds[0]};
}

class BadDumpFdTest : public BadInputTest, public ::testing::WithParamInterface<DumpFdRow> {};

TEST_P(BadDumpFdTest, GivesUpWithOneLogLine) {
    // SIGPIPE at its default action, which would end the process.
    struct sigaction deflt = {};
    struct sigaction previous = {};
    deflt.sa_handler = SIG_DFL;
    sigaction(SIGPIPE, &deflt, &previous);
    const std::pair<int, int> fds = GetParam().open();
    ASSERT_GE(fds.first, 0);
    mServer->dumpVelmoraServerInfo(fds.first, {"--easgrouplist"});
    close(fds.first);
    if (fds.second >= 0) {
        close(fds.second);
    }
    sigaction(SIGPIPE, &previous, nullptr);
    sigset_t pending;
    sigemptyset(&pending);
    sigpending(&pending);
    EXPECT_EQ(sigismember(&pending, SIGPIPE), 0) << "a SIGPIPE was left pending";
    EXPECT_EQ(LogCapture::countContaining("dump write failed, fd=" + std::to_string(fds.first) +
                                          ", errno=" + std::to_string(GetParam().error)),
              1);
    expectNothingLost();
}

INSTANTIATE_TEST_SUITE_P(
    Rows, BadDumpFdTest,
    ::testing::Values(DumpFdRow{"ClosedDescriptor", closedPipeEnd, EBADF},
                      DumpFdRow{"ReadOnlyDescriptor",
                                [] { return std::make_pair(open("/dev/null", O_RDONLY), -1); },
                                EBADF},
                      DumpFdRow{"PipeWithoutReader", pipeWithoutReader, EPIPE},
                      DumpFdRow{"FullNonBlockingPipe", fullNonBlockingPipe, EAGAIN}),
    [](const ::testing::TestParamInfo<DumpFdRow>& info) { return std::string(info.param.name); });

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

std::string manyCommands(int count) {
    std::string s;
    for (int id = 30000; id < 30000 + count; ++id) {
        s += "<cmd id=\"" + std::to_string(id) + "\"><a><duration>1</duration></a></cmd>";
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
        FileRow{"Unterminated", [] { return startupPlus("").substr(0, 60); }, -1, "LoadFile error"},
        FileRow{"NoPolicyElement", [] { return std::string("<other/>"); }, -1,
                "get velmora_config_cust.xml failed!,ret:3"},
        FileRow{"OnlyUnusableIds",
                [] { return policyXml("<cmd id=\"0x10\"/><cmd id=\"1e3\"/><cmd/>"); }, -1,
                "empty rawXmlDataMap!!"},
        FileRow{"DeepNesting", [] { return startupPlus(nested(100000)); }, -1, "LoadFile error"},
        // Refused by its size before it is read.
        FileRow{"SixtyFourMiB", [] { return startupPlus("") + std::string(64 << 20, ' '); }, -1,
                "bytes, at most 16777216"},
        // Loaded: many small commands stay within the size bound.
        FileRow{"HundredThousandCommands", [] { return startupPlus(manyCommands(100000)); }, 0, "",
                false},
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

// The copy is rewritten in place while reloads read it: each reload sees the whole file or a
// prefix of it, loads the one and refuses the other, and the configuration in force never goes.
TEST_F(BadInputTest, ReloadWhileTheFileIsRewrittenInPlace) {
    const std::string full = policyXml(std::string(kStartupCommands) + kCommands);
    const std::string path = env().custConfigPath;
    std::atomic<bool> stop{false};
    std::thread writer([&] {
        while (!stop.load()) {
            const int fd = open(path.c_str(), O_WRONLY);
            if (fd < 0) {
                return;
            }
            const size_t half = full.size() / 2;
            bool ok = ftruncate(fd, 0) == 0 && write(fd, full.data(), half) > 0;
            ok = ok && write(fd, full.data() + half, full.size() - half) > 0;
            close(fd);
            if (!ok) {
                return;
            }
        }
    });
    for (int i = 0; i < 30; ++i) {
        EXPECT_EQ(mServer->velmoraEvent(20230, "", 0, nullptr), 0);
        expectNothingLost();
    }
    stop = true;
    writer.join();
}

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
