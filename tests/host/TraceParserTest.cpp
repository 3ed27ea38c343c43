// The trace format of velmora-replay: the kinds of line the example minute's replay leaves out,
// and errors that name the file and line.
#include <gtest/gtest.h>

#include <cstdint>

#include "tools/replay/TraceParser.h"

namespace velmora {
namespace {

// Only what the example minute's replay does not exercise: a hex payload, a negative value, a
// sleep, and comments after a call.
TEST(TraceParserTest, CallsTheExampleMinuteLacksParse) {
    std::vector<TraceCall> calls;
    std::string error;
    ASSERT_EQ(0, TraceParser::parseText("# header\n"
                                        "@1500 event 20225 0x50000   # feature switch\n"
                                        "setconfig 1 2=1497600 5=-1\n"
                                        "sleep 250\n"
                                        "\n",
                                        "t.trace", &calls, &error))
        << error;
    ASSERT_EQ(3u, calls.size());
    EXPECT_EQ(std::vector<int>{0x50000}, calls[0].payload);
    EXPECT_EQ((std::vector<int>{1497600, -1}), calls[1].values);
    EXPECT_EQ(250, calls[2].sleepMs);
}

// A load line: the domains it names with their loads, at its time.
TEST(TraceParserTest, LoadLineNamesDomainsAndShares) {
    std::vector<TraceCall> calls;
    std::string error;
    ASSERT_EQ(0, TraceParser::parseText("@4000 load cpu.little=0.35 cpu.big=1 gpu=.5 ddr=0\n",
                                        "t.trace", &calls, &error))
        << error;
    ASSERT_EQ(1u, calls.size());
    EXPECT_EQ(TraceCall::Kind::Load, calls[0].kind);
    EXPECT_EQ(4000, calls[0].atMs);
    ASSERT_EQ(4u, calls[0].loads.size());
    EXPECT_EQ("cpu.little", calls[0].loads[0].domain);
    EXPECT_DOUBLE_EQ(0.35, calls[0].loads[0].u);
    EXPECT_DOUBLE_EQ(1, calls[0].loads[1].u);
    EXPECT_DOUBLE_EQ(0.5, calls[0].loads[2].u);
    EXPECT_DOUBLE_EQ(0, calls[0].loads[3].u);
}

// A call with `n` pairs, tags or payload ints: "setconfig 1 2=1 2=1 ...", "getconfig 22 22 ...",
// "event 4099 0 0 ...".
std::string longCall(const std::string& verb, int n) {
    std::string line = verb + (verb == "setconfig" ? " 1" : verb == "event" ? " 4099" : "");
    for (int i = 0; i < n; ++i)
        line += verb == "setconfig" ? " 2=1" : verb == "event" ? " 0" : " 22";
    return line;
}

TEST(TraceParserTest, RequestsAndQueriesTakeUpToTheMostTags) {
    std::vector<TraceCall> calls;
    std::string error;
    ASSERT_EQ(0, TraceParser::parseText(longCall("setconfig", TraceParser::kMaxTags) + "\n" +
                                            longCall("getconfig", TraceParser::kMaxTags) + "\n",
                                        "t.trace", &calls, &error))
        << error;
    ASSERT_EQ(2u, calls.size());
    EXPECT_EQ(1024u, calls[0].values.size());
    EXPECT_EQ(1024u, calls[1].tags.size());
}

// Plain decimals are read without strtoll; every other spelling must still read as strtoll
// reads it (base 0), and the range limits hold for both (bad spellings: the table below).
TEST(TraceParserTest, NumbersReadAsStrtollReadsThem) {
    std::vector<TraceCall> calls;
    std::string error;
    ASSERT_EQ(0, TraceParser::parseText("event 4099 010 0x10 -0 0 -7 4294967295 -2147483648 +5\n"
                                        "@9223372036854775 sleep 0\n",
                                        "t.trace", &calls, &error))
        << error;
    ASSERT_EQ(2u, calls.size());
    // Octal, hex, zeros, the unsigned top wrapping to -1 as a command id or payload does.
    EXPECT_EQ((std::vector<int>{8, 16, 0, 0, -7, -1, INT32_MIN, 5}), calls[0].payload);
    EXPECT_EQ(9223372036854775, calls[1].atMs);  // the largest time in milliseconds
    EXPECT_EQ(0, calls[1].sleepMs);
}

TEST(TraceParserTest, BadLineNamesFileAndLine) {
    const std::pair<std::string, std::string> rows[] = {
        {"evnt 4098 0", "minute.trace:2: unknown call 'evnt'; did you mean 'event'?"},
        {"event 40x9 0", "minute.trace:2: malformed number '40x9' for command id"},
        {"@-5 reload", "minute.trace:2: malformed time '-5' for time stamp"},
        // A sleep goes forward by a whole number of milliseconds, written as a number.
        {"sleep -5", "minute.trace:2: malformed time '-5' for sleep"},
        {"sleep -0x10", "minute.trace:2: malformed time '-0x10' for sleep"},
        {"sleep 2.5", "minute.trace:2: malformed time '2.5' for sleep"},
        {"sleep soon", "minute.trace:2: malformed time 'soon' for sleep"},
        {"sleep \" 5\"", "minute.trace:2: malformed time ' 5' for sleep"},
        {"event 99999999999 0", "minute.trace:2: malformed number '99999999999' for command id"},
        {"event 4294967296 0", "minute.trace:2: malformed number '4294967296' for command id"},
        {"event -2147483649 0", "minute.trace:2: malformed number '-2147483649' for command id"},
        {"event 1234567890123456789 0",
         "minute.trace:2: malformed number '1234567890123456789' for command id"},
        {"event 4099 \"\"", "minute.trace:2: malformed number '' for payload"},
        {"sleep 0009", "minute.trace:2: malformed time '0009' for sleep"},
        {"sleep 9223372036854776", "minute.trace:2: malformed time '9223372036854776' for sleep"},
        // Wrong shapes (a wrong argument count: the byte-order-mark test below).
        {"setconfig 1 2:1497600", "minute.trace:2: expected <tag>=<value>, got '2:1497600'"},
        {"event 4116 0 msg=\"pid=1", "minute.trace:2: unterminated quote"},
        // One argument past the most each call takes.
        {longCall("setconfig", 1025),
         "minute.trace:2: 'setconfig' takes 2..1025 argument(s), got 1026"},
        {longCall("getconfig", 1025),
         "minute.trace:2: 'getconfig' takes 1..1024 argument(s), got 1025"},
        {longCall("event", 64), "minute.trace:2: 'event' takes 1..64 argument(s), got 65"},
        // Loads: a share of the domain's top capacity, written as a plain decimal.
        {"load cpu.big=1.5", "minute.trace:2: load '1.5' of cpu.big is not a number in [0, 1]"},
        {"load cpu.big=-0.1", "minute.trace:2: load '-0.1' of cpu.big is not a number in [0, 1]"},
        {"load cpu.big=nan", "minute.trace:2: load 'nan' of cpu.big is not a number in [0, 1]"},
        {"load cpu.big=1e-3", "minute.trace:2: load '1e-3' of cpu.big is not a number in [0, 1]"},
        {"load cpu.big=.", "minute.trace:2: load '.' of cpu.big is not a number in [0, 1]"},
        {"load cpu.big", "minute.trace:2: expected <domain>=<load>, got 'cpu.big'"},
        {"load =0.5", "minute.trace:2: expected <domain>=<load>, got '=0.5'"},
        {"load", "minute.trace:2: 'load' takes 1..64 argument(s), got 0"},
        {"load gpu=0.1 gpu=0.2", "minute.trace:2: load line names gpu twice"},
        {"lod gpu=0.1", "minute.trace:2: unknown call 'lod'; did you mean 'load'?"},
    };
    for (const auto& row : rows) {
        std::vector<TraceCall> calls;
        std::string error;
        const std::string text = "event 4099 0\n" + row.first + "\n";
        EXPECT_EQ(-1, TraceParser::parseText(text, "minute.trace", &calls, &error)) << row.first;
        EXPECT_EQ(row.second, error);
    }
}

TEST(TraceParserTest, EveryBadLineIsReportedAndAByteOrderMarkIsSkipped) {
    std::vector<TraceCall> calls;
    std::string error;
    EXPECT_EQ(-1, TraceParser::parseText("\xEF\xBB\xBF"
                                         "event 4099 0\nsetconfig 1\nreload\nsleeep 5\n",
                                         "t.trace", &calls, &error));
    EXPECT_EQ(
        "t.trace:2: 'setconfig' takes 2..1025 argument(s), got 1\n"
        "t.trace:4: unknown call 'sleeep'; did you mean 'sleep'?",
        error);
}

}  // namespace
}  // namespace velmora
