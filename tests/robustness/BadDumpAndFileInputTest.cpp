// Hostile input at the dump entry point (unusable descriptors) and in the configuration file
// (broken, hostile or incomplete documents, tried by a reload and by a fresh init). Each row
// states the status and the line the library logs.
#include <errno.h>
#include <fcntl.h>
#include <signal.h>
#include <unistd.h>

#include <atomic>
#include <fstream>
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

// Descriptors a dump cannot write to, all made from a fresh pipe. The dump must give up at once
// with one log line naming the error, never block, and never raise SIGPIPE.
struct DumpFdRow {
    const char* name;
    int end;        // the end the dump writes to: 0 the read end, 1 the write end
    int closedEnd;  // the end closed beforehand, or -1
    bool full;      // the pipe is non-blocking and full
    int error;
};

class BadDumpFdTest : public BadInputTest, public ::testing::WithParamInterface<DumpFdRow> {};

TEST_P(BadDumpFdTest, GivesUpWithOneLogLine) {
    const DumpFdRow& row = GetParam();
    // SIGPIPE at its default action, which would end the process.
    struct sigaction deflt = {};
    struct sigaction previous = {};
    deflt.sa_handler = SIG_DFL;
    sigaction(SIGPIPE, &deflt, &previous);
    int fds[2];
    ASSERT_EQ(pipe2(fds, row.full ? O_NONBLOCK : 0), 0);
    const int fd = fds[row.end];
    if (row.closedEnd >= 0) {
        close(std::exchange(fds[row.closedEnd], -1));
    }
    const std::string chunk(4096, 'x');
    while (row.full && write(fd, chunk.data(), chunk.size()) > 0) {
    }
    mServer->dumpVelmoraServerInfo(fd, {"--easgrouplist"});
    for (int open : fds) {
        if (open >= 0) {
            close(open);
        }
    }
    sigaction(SIGPIPE, &previous, nullptr);
    sigset_t pending;
    sigemptyset(&pending);
    sigpending(&pending);
    EXPECT_EQ(sigismember(&pending, SIGPIPE), 0) << "a SIGPIPE was left pending";
    EXPECT_EQ(LogCapture::countContaining("dump write failed, fd=" + std::to_string(fd) +
                                          ", errno=" + std::to_string(row.error)),
              1);
    expectNothingLost();
}

INSTANTIATE_TEST_SUITE_P(Rows, BadDumpFdTest,
                         ::testing::Values(DumpFdRow{"ClosedDescriptor", 1, 1, false, EBADF},
                                           DumpFdRow{"ReadOnlyDescriptor", 0, -1, false, EBADF},
                                           DumpFdRow{"PipeWithoutReader", 1, 0, false, EPIPE},
                                           DumpFdRow{"FullNonBlockingPipe", 1, -1, true, EAGAIN}),
                         [](const ::testing::TestParamInfo<DumpFdRow>& info) {
                             return std::string(info.param.name);
                         });

// ---------------------------------------------------------------------------------------------
// The loader on a configuration file: a reload (20230) with the bad file must keep the
// configuration in force; a fresh server on the same file reports its init status.

struct FileRow {
    const char* name;
    std::function<std::string()> content;
    int initStatus;
    std::string log;            // a line both the reload and the init write
    bool reloadRefused = true;  // the reload keeps the configuration in force
};

std::string nested(int depth) {
    std::string open;
    std::string close;
    for (int i = 0; i < depth; ++i) {
        open += "<n>";
        close += "</n>";
    }
    return open + close;
}

std::string manyCommands(int count) {
    std::string s;
    for (int id = 30000; id < 30000 + count; ++id) {
        s += "<cmd id=\"" + std::to_string(id) + "\"><a><duration>1</duration></a></cmd>";
    }
    return s;
}

std::string startupPlus(const std::string& body) {
    return policyXml(std::string(kStartupCommands) + body);
}

// The start-up commands and timed action 4098 under `name` with the action's elements `act`.
std::string withWinswitch(const std::string& name, const std::string& act) {
    return startupPlus("<cmd id=\"4098\" name=\"" + name + "\"><act>" + act + "</act></cmd>");
}

std::string billionLaughs() {
    std::string dtd = "<?xml version=\"1.0\"?>\n<!DOCTYPE policy [\n<!ENTITY lol0 \"lol\">\n";
    for (int i = 1; i <= 9; ++i) {
        dtd += "<!ENTITY lol" + std::to_string(i) + " \"";
        for (int j = 0; j < 10; ++j) {
            dtd += "&lol" + std::to_string(i - 1) + ";";
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

const std::string kTimedAct = "<duration>500</duration><t1>1</t1>";

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
        FileRow{"HugeAttribute", [] { return withWinswitch(std::string(1 << 22, 'x'), kTimedAct); },
                0, "", false},
        FileRow{"NonUtf8", [] { return withWinswitch("\xff\xfe\xc3", kTimedAct); }, 0, "", false},
        FileRow{"BinaryGarbage", [] { return std::string("\x00\x01\x02\xff<policy>", 12); }, -1,
                "LoadFile error"},
        FileRow{"ParameterWithoutText", [] { return withWinswitch("w", "<duration/><t1>1</t1>"); },
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
            std::ofstream out(path, std::ios::trunc);
            out << full.substr(0, full.size() / 2) << std::flush << full.substr(full.size() / 2);
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
    VelmoraServer fresh;
    EXPECT_EQ(fresh.init(), 0);
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
