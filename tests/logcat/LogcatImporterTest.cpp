// velmora-import-logcat on small logs: every logcat format it reads, the server lines it turns
// into calls (requests joined per thread, placeholders where the log lacks text), and bad input.
#include <gtest/gtest.h>

#include <sstream>
#include <string>
#include <vector>

#include "tests/host/HostTestSupport.h"
#include "tools/logcat/LogcatImportCommand.h"
#include "tools/logcat/LogcatImporter.h"

namespace velmora {
namespace {

const char* const kEvent = "velmoraEvent cmdId=4099, payload=0";
const char* const kPair = "setConfig clientId=1, tagLen=1, tags[0]=2, configs[0]=1497600";

// The trace without its header comment.
std::string body(const std::string& trace) {
    const size_t blank = trace.find("\n\n");
    return blank == std::string::npos ? trace : trace.substr(blank + 2);
}

// ---- Formats: an event, a request 1.5 s later, and another tag's line in between.

struct FormatRow {
    const char* format;  // as detected
    const char* first;   // everything before the message, for the event
    const char* second;  // for the request
};

class LogcatFormatTest : public testing::TestWithParam<FormatRow> {};

TEST_P(LogcatFormatTest, ReadsTheServerLinesOfTheFormat) {
    const FormatRow& row = GetParam();
    std::string other = row.first;
    other.replace(other.find("velmora server"), 14, "ActivityManager");
    const std::string log = "--------- beginning of main\n" + std::string(row.first) + kEvent +
                            "\n" + other + "Start proc\n" + row.second + kPair + "\n";
    LogcatImporter importer;
    std::string error;
    ASSERT_EQ(0, importer.importText(log, "device.log", &error)) << error;
    EXPECT_EQ(row.format, importer.formatName());
    EXPECT_EQ(
        "@0      dump --logon  # debug logging was on: the entry points are logged\n"
        "@0      event 4099 0\n"
        "@1500   setconfig 1 2=1497600\n",
        body(importer.trace()));
    EXPECT_EQ(1, importer.counts().otherTags);
    EXPECT_EQ(1, importer.counts().garbage);
}

INSTANTIATE_TEST_SUITE_P(
    Formats, LogcatFormatTest,
    testing::Values(FormatRow{"threadtime", "11-23 18:09:30.100  1234  1250 I velmora server: ",
                              "11-23 18:09:31.600  1234  1251 I velmora server: "},
                    // Across the new year, in microseconds.
                    FormatRow{"threadtime", "12-31 23:59:59.100000  1234  1250 I velmora server: ",
                              "01-01 00:00:00.600000  1234  1251 I velmora server: "},
                    FormatRow{"threadtime,monotonic,uid",
                              "  5123.100  1000:  1234  1250 I velmora server: ",
                              "  5124.600  1000:  1234  1251 I velmora server: "},
                    FormatRow{"time,year,uid",
                              "2026-11-23 18:09:30.100 I/velmora server( 1000: 1234): ",
                              "2026-11-23 18:09:31.600 I/velmora server( 1000: 1234): "},
                    FormatRow{"time,epoch", "1795457370.100000000 I/velmora server( 1234): ",
                              "1795457371.600000000 I/velmora server( 1234): "}));

// ---- Server lines to calls, in threadtime; line k is logged at k * 100 ms.

struct LineRow {
    const char* name;
    std::vector<std::pair<int, std::string>> lines;  // thread id, message
    const char* expected;                            // the trace after its header
    int placeholders;
    int unjoined;
};

std::string threadtimeLog(const std::vector<std::pair<int, std::string>>& lines) {
    std::string log;
    char prefix[96];
    for (size_t k = 0; k < lines.size(); ++k) {
        snprintf(prefix, sizeof(prefix),
                 "11-23 18:09:%02zu.%03zu  1234 %5d I velmora server: ", 10 + k / 10,
                 (k % 10) * 100, lines[k].first);
        log += prefix + lines[k].second + "\n";
    }
    return log;
}

class ServerLinesTest : public testing::TestWithParam<LineRow> {};

TEST_P(ServerLinesTest, BecomeCalls) {
    const LineRow& row = GetParam();
    LogcatImporter importer;
    std::string error;
    ASSERT_EQ(0, importer.importText(threadtimeLog(row.lines), "device.log", &error)) << error;
    EXPECT_EQ(row.expected, body(importer.trace()));
    EXPECT_EQ(row.placeholders, importer.counts().placeholders);
    EXPECT_EQ(row.unjoined, importer.counts().unjoined);
}

const char* const kA0 = "setConfig clientId=1, tagLen=2, tags[0]=2, configs[0]=1497600";
const char* const kA1 = "setConfig clientId=1, tagLen=2, tags[1]=5, configs[1]=2016000";
const char* const kB0 = "setConfig clientId=1, tagLen=2, tags[0]=2, configs[0]=1401600";
const char* const kB1 = "setConfig clientId=1, tagLen=2, tags[1]=5, configs[1]=1804800";

INSTANTIATE_TEST_SUITE_P(
    Lines, ServerLinesTest,
    testing::Values(
        // Two threads of the same client at the same moment.
        LineRow{"SplitsInterleavedThreads",
                {{7, kA0}, {8, kB0}, {7, kA1}, {8, kB1}},
                "@0      setconfig 1 2=1497600 5=2016000\n"
                "@100    setconfig 1 2=1401600 5=1804800\n",
                0,
                0},
        // Pair 1 of the first request was lost; the second is cut short by the log's end.
        LineRow{"SaysWhenPairsCannotBeJoined",
                {{7, kA0}, {7, kB0}, {7, kB1}, {8, kA1}},
                "@0      setconfig 1 2=1497600  # not joined: only pairs 0 of 2, thread 7, log "
                "line 1\n"
                "@100    setconfig 1 2=1401600 5=1804800\n"
                "@300    setconfig 1 5=2016000  # not joined: only pairs 1 of 2, thread 8, log "
                "line 4\n",
                0,
                2},
        LineRow{"PlaceholdersForTextTheLogLacks",
                {{7, "velmoraEvent cmdId=4116, payload=0"},
                 {7, "velmoraEvent cmdId=20480, payload=-1"},
                 {7, "velmoraGetConfig tagLen=2"},
                 {7, "velmoraEvent cmdId=20481, payload=0"}},
                "@0      dump --logon  # debug logging was on: the entry points are logged\n"
                "@0      event 4116 0 msg=\"pid=0|tid=0\"  # EDIT: the log lacks the message of "
                "the probe\n"
                "@100    event 20480 -1 msg=\"pid=0|tid=0\"  # EDIT: the log lacks the message "
                "of the memory-latency event\n"
                "@200    getconfig 22 22  # EDIT: the log names 2 tags but not which\n"
                "@300    event 20481 0\n",
                3,
                0},
        // The restart line stands for event 20224 only when its event line is missing.
        LineRow{"ClientRestartReloadAndDumps",
                {{7, "velmoraEvent cmdId=20224, payload=0"},
                 {7, "client may rebooted, clean special scene set, cmdId is 20224"},
                 {9, "client may rebooted, clean special scene set, cmdId is 20224"},
                 {7, "velmoraEvent cmdId=20230"},
                 {7, "there is too many dump parameter!"},
                 {7, "host: platform ready on /tmp/x"}},
                "@0      dump --logon  # debug logging was on: the entry points are logged\n"
                "@0      event 20224 0\n"
                "@200    event 20224  # from the client-restart line\n"
                "@300    reload\n"
                "# @400 a dump the server turned down: there is too many dump parameter!\n",
                0,
                0}),
    [](const testing::TestParamInfo<LineRow>& info) { return std::string(info.param.name); });

// ---- The program on bad input: one line, exit 1 and no trace.

TEST(ImportCommandTest, RejectsBadInput) {
    const std::pair<const char*, const char*> rows[] = {
        {"velmora server I 11-23 18:14:04 17979 17979 velmoraEvent\n",
         "not logcat text in a known format"},
        {"11-23 18:09:30.100  1234  1250 I ActivityManager: x\n",
         "no \"velmora server\" lines among 1 line of logcat -v threadtime"},
        {"11-23 18:09:30.100  1234  1250 E velmora server: init mPlatPtr failed!\n",
         "no host calls among 1 velmora server line"},
    };
    for (const auto& row : rows) {
        const std::string dir = hosttest::makeScratchDir("logcat");
        hosttest::writeFile(dir + "/device.log", row.first);
        std::ostringstream out, err;
        EXPECT_EQ(
            LogcatImportCommand::kBadInput,
            LogcatImportCommand::run({dir + "/device.log", "-o", dir + "/out.trace"}, out, err));
        EXPECT_NE(std::string::npos, err.str().find(row.second)) << err.str();
        EXPECT_EQ(err.str().find('\n'), err.str().size() - 1) << err.str();
        EXPECT_EQ("<missing>", hosttest::readFile(dir + "/out.trace"));
    }
}

// A trace that is there may hold the user's edits: kept unless --force, replaced whole with it.
TEST(ImportCommandTest, KeepsAnExistingTraceUnlessForced) {
    const std::string dir = hosttest::makeScratchDir("logcat-force");
    hosttest::writeFile(dir + "/device.log", threadtimeLog({{7, kEvent}}));
    hosttest::writeFile(dir + "/out.trace", "@0 event 4116 0 msg=\"pid=42|tid=43\"  # edited\n");
    const std::vector<std::pair<std::vector<std::string>, int>> rows = {
        {{dir + "/device.log", "-o", dir + "/out.trace"}, LogcatImportCommand::kBadInput},
        {{"--force", dir + "/device.log", "-o", dir + "/out.trace"}, LogcatImportCommand::kOk}};
    for (const auto& row : rows) {
        std::ostringstream out, err;
        EXPECT_EQ(row.second, LogcatImportCommand::run(row.first, out, err)) << err.str();
        const std::string trace = hosttest::readFile(dir + "/out.trace");
        if (row.second == LogcatImportCommand::kBadInput) {
            EXPECT_EQ("velmora-import-logcat: " + dir +
                          "/out.trace exists and is kept (it may hold your edits); --force "
                          "overwrites it\n",
                      err.str());
            EXPECT_NE(std::string::npos, trace.find("pid=42|tid=43"));
        } else {
            EXPECT_NE(std::string::npos, trace.find("event 4099 0")) << trace;
            EXPECT_EQ("<missing>", hosttest::readFile(dir + "/out.trace.partial"));
        }
    }
}

}  // namespace
}  // namespace velmora
