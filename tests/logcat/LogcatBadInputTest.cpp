// velmora-import-logcat on logs that are valid but unusual: long sessions, oversized requests
// and queries, odd file names. Each row's trace must be one velmora-replay reads without a bad
// line; rows that once gave traces the replay refused are marked with what went wrong.
#include <gtest/gtest.h>

#include <ostream>
#include <string>
#include <vector>

#include "tools/logcat/LogcatImporter.h"
#include "tools/replay/TraceReader.h"

namespace velmora {
namespace {

// One threadtime line of the server at `seconds` after 18:00:00.
std::string serverLine(long seconds, const std::string& message) {
    char stamp[64];
    snprintf(stamp, sizeof(stamp), "11-23 %02ld:%02ld:%02ld.000  1234  1250 I velmora server: ",
             18 + seconds / 3600, seconds / 60 % 60, seconds % 60);
    return stamp + message + "\n";
}

std::string pair(int index, int count) {
    return "setConfig clientId=1, tagLen=" + std::to_string(count) + ", tags[" +
           std::to_string(index) + "]=2, configs[" + std::to_string(index) + "]=1497600";
}

// A request of `count` pairs, one line each, all at `seconds`.
std::string request(long seconds, int count) {
    std::string log;
    for (int i = 0; i < count; ++i)
        log += serverLine(seconds, pair(i, count));
    return log;
}

struct BadLogRow {
    const char* name;
    std::string log;
    const char* sourceName;
    std::vector<std::string> expected;  // lines the trace must hold, in order
    int requests;
    int tooLong;
};

// Rows print as their name.
void PrintTo(const BadLogRow& row, std::ostream* out) {
    *out << row.name;
}

class LogcatBadInputTest : public testing::TestWithParam<BadLogRow> {};

TEST_P(LogcatBadInputTest, WritesATraceTheReplayReads) {
    const BadLogRow& row = GetParam();
    LogcatImporter importer;
    std::string error;
    ASSERT_EQ(0, importer.importText(row.log, row.sourceName, &error)) << error;
    const std::string& trace = importer.trace();
    size_t at = 0;
    for (const auto& line : row.expected) {
        const size_t found = trace.find(line, at);
        ASSERT_NE(std::string::npos, found) << "missing: " << line << "\nin:\n" << trace;
        at = found + line.size();
    }
    EXPECT_EQ(row.requests, importer.counts().requests);
    EXPECT_EQ(row.tooLong, importer.counts().tooLong);

    TraceReader reader(trace, "imported.trace");
    TraceCall call;
    std::string lineError;
    for (TraceReader::Step step; (step = reader.next(&call, &lineError)) != TraceReader::Step::End;)
        EXPECT_EQ(TraceReader::Step::Call, step) << lineError;
}

INSTANTIATE_TEST_SUITE_P(
    Rows, LogcatBadInputTest,
    testing::Values(
        // The stamp filled its column from 10,000,000 ms on and the call was glued to it
        // ("@10000000event 4099 0").
        BadLogRow{"SessionLongerThanTheStampColumn",
                  serverLine(0, "velmoraEvent cmdId=4099, payload=0") +
                      serverLine(10000, "velmoraEvent cmdId=4099, payload=1"),
                  "device.log",
                  {"@0      event 4099 0\n", "@10000000 event 4099 1\n"},
                  0,
                  0},
        // More tags than the trace format took (64) and than it takes now (1024): the largest
        // query the importer believes, and the largest request a trace line holds.
        BadLogRow{"QueryOf256Tags",
                  serverLine(0, "velmoraGetConfig tagLen=256"),
                  "device.log",
                  {"@0      getconfig 22 22 22"},
                  0,
                  0},
        BadLogRow{"RequestOf1024Pairs",
                  request(1, 1024),
                  "device.log",
                  {"@0      setconfig 1 2=1497600 2=1497600"},
                  1,
                  0},
        BadLogRow{"RequestOf1025PairsIsANote",
                  request(1, 1025) + serverLine(2, pair(0, 1)),
                  "device.log",
                  {"# @0 not written: a request of client 1 with 1025 pairs, more than a trace "
                   "call takes (1024), log line 1\n",
                   "@0      setconfig 1 2=1497600\n"},
                  1,
                  1},
        // A newline in the file name started a line of the header that was not a comment.
        BadLogRow{"FileNameWithANewline",
                  serverLine(0, "velmoraEvent cmdId=4099, payload=0"),
                  "dev\nice.log",
                  {"# Imported by velmora-import-logcat from dev?ice.log ("},
                  0,
                  0}),
    [](const testing::TestParamInfo<BadLogRow>& info) { return std::string(info.param.name); });

}  // namespace
}  // namespace velmora
