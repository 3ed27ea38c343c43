// The trace format of velmora-replay: what each kind of line turns into (getconfig and dump: the
// example minute's replay), and errors that name the file and line.
#include <gtest/gtest.h>

#include "tools/replay/TraceParser.h"

namespace velmora {
namespace {

TEST(TraceParserTest, EveryCallKindParses) {
    std::vector<TraceCall> calls;
    std::string error;
    ASSERT_EQ(0,
              TraceParser::parseText("# header\n"
                                     "@1500 event 4116 0 msg=\"pid=12|tid=34\"   # probe\n"
                                     "event 20480 0 msg=\"pid=1|tid=2|ratio_b=0.5 ratio_l=0.7\"\n"
                                     "event 20225 0x50000\n"
                                     "setconfig 1 2=1497600 5=-1\n"
                                     "reload\n"
                                     "policy cold 1200\n"
                                     "sleep 250\n"
                                     "@3000\n"
                                     "\n",
                                     "t.trace", &calls, &error))
        << error;
    ASSERT_EQ(8u, calls.size());
    EXPECT_EQ(TraceCall::Kind::Event, calls[0].kind);
    EXPECT_EQ(1500, calls[0].atMs);
    EXPECT_EQ(4116, calls[0].id);
    EXPECT_EQ(std::vector<int>{0}, calls[0].payload);
    EXPECT_EQ("pid=12|tid=34", calls[0].text);
    EXPECT_EQ("pid=1|tid=2|ratio_b=0.5 ratio_l=0.7", calls[1].text);
    EXPECT_EQ(std::vector<int>{0x50000}, calls[2].payload);
    EXPECT_EQ((std::vector<int>{2, 5}), calls[3].tags);
    EXPECT_EQ((std::vector<int>{1497600, -1}), calls[3].values);
    EXPECT_EQ(TraceCall::Kind::Reload, calls[4].kind);
    EXPECT_EQ("cold", calls[5].text);
    EXPECT_EQ(1200, calls[5].id);
    EXPECT_EQ(250, calls[6].sleepMs);
    EXPECT_EQ(TraceCall::Kind::Stamp, calls[7].kind);
    EXPECT_EQ(3000, calls[7].atMs);
}

TEST(TraceParserTest, BadLineNamesFileAndLine) {
    const std::pair<const char*, const char*> rows[] = {
        // Typo in the call name.
        {"evnt 4098 0", "minute.trace:2: unknown call 'evnt'; did you mean 'event'?"},
        // Malformed numbers.
        {"event 40x9 0", "minute.trace:2: malformed number '40x9' for command id"},
        {"@-5 reload", "minute.trace:2: malformed time '-5' for time stamp"},
        {"event 99999999999 0", "minute.trace:2: malformed number '99999999999' for command id"},
        // Wrong shapes (a wrong argument count: the byte-order-mark test below).
        {"setconfig 1 2:1497600", "minute.trace:2: expected <tag>=<value>, got '2:1497600'"},
        {"event 4116 0 msg=\"pid=1", "minute.trace:2: unterminated quote"},
    };
    for (const auto& row : rows) {
        std::vector<TraceCall> calls;
        std::string error;
        const std::string text = std::string("event 4099 0\n") + row.first + "\n";
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
        "t.trace:2: 'setconfig' takes 2..64 argument(s), got 1\n"
        "t.trace:4: unknown call 'sleeep'; did you mean 'sleep'?",
        error);
    ASSERT_EQ(2u, calls.size());
    EXPECT_EQ(4099, calls[0].id);
    EXPECT_EQ(TraceCall::Kind::Reload, calls[1].kind);
}

}  // namespace
}  // namespace velmora
