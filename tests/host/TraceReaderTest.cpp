// Reading a trace a call at a time: the calls and messages of the parser, a line too long to
// hold, and the first pass that keeps only distinct names.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "tests/host/HostTestSupport.h"
#include "tools/replay/TraceReader.h"
#include "tools/replay/TraceSurvey.h"

namespace velmora {
namespace {

struct Read {
    std::vector<std::string> calls;   // source of each call
    std::vector<std::string> errors;  // message of each bad line
};

Read readAll(TraceReader& reader) {
    Read read;
    TraceCall call;
    std::string error;
    for (TraceReader::Step step; (step = reader.next(&call, &error)) != TraceReader::Step::End;) {
        if (step == TraceReader::Step::Call)
            read.calls.push_back(call.source);
        else
            read.errors.push_back(error);
    }
    return read;
}

TEST(TraceReaderTest, ReadsAFileCallByCallGoingOnPastBadLines) {
    const std::string dir = hosttest::makeScratchDir("reader");
    const std::string path = dir + "/t.trace";
    hosttest::writeFile(path,
                        "\xEF\xBB\xBF@100 event 4099 0\r\n"
                        "# a comment\n\n"
                        "sleep -5\n"
                        "setconfig 1 2=1497600\n"
                        "sleep soon\n"
                        "@200");  // no newline at the end
    TraceReader reader(path);
    ASSERT_TRUE(reader.isOpen());
    const Read read = readAll(reader);
    EXPECT_EQ((std::vector<std::string>{"@100 event 4099 0", "setconfig 1 2=1497600", "@200"}),
              read.calls);
    EXPECT_EQ((std::vector<std::string>{path + ":4: malformed time '-5' for sleep",
                                        path + ":6: malformed time 'soon' for sleep"}),
              read.errors);
    EXPECT_EQ(3u, reader.calls());
    EXPECT_FALSE(TraceReader(dir + "/missing.trace").isOpen());
}

// The reader takes the file a block at a time: lines that straddle blocks come back whole, a
// line of exactly the limit is no bad line, and a last line without a newline still counts.
TEST(TraceReaderTest, LinesAcrossBlocksComeBackWhole) {
    std::string text;
    std::vector<std::string> expected;
    for (int i = 0; text.size() < 3 * 64 * 1024; ++i) {
        expected.push_back("@" + std::to_string(i) + " event 4099 " + std::to_string(i * 7));
        text += expected.back() + (i % 3 == 0 ? "\r\n" : "\n");
    }
    const std::string longest = "event 4099 msg=" + std::string(TraceReader::kMaxLineBytes - 15, 'x');
    text += longest + "\nreload";
    expected.push_back(longest);
    expected.push_back("reload");
    const std::string path = hosttest::makeScratchDir("blocks") + "/t.trace";
    hosttest::writeFile(path, text);
    TraceReader reader(path);
    const Read read = readAll(reader);
    EXPECT_TRUE(read.errors.empty()) << read.errors.front();
    EXPECT_EQ(expected, read.calls);
}

// A line is read into memory up to the limit and no further; the lines after it still count.
TEST(TraceReaderTest, AnOverlongLineIsABadLineAndReadingGoesOn) {
    const std::string text = "event " + std::string(TraceReader::kMaxLineBytes, '1') + "\nreload\n";
    TraceReader reader(text, "long.trace");
    const Read read = readAll(reader);
    EXPECT_EQ(std::vector<std::string>{"reload"}, read.calls);
    EXPECT_EQ(std::vector<std::string>{"long.trace:1: line longer than 65536 bytes"}, read.errors);
}

TEST(TraceSurveyTest, KeepsEachCommandAndPolicyOnceWithItsFirstUseAndCount) {
    const std::string dir = hosttest::makeScratchDir("survey");
    const std::string path = dir + "/t.trace";
    hosttest::writeFile(path,
                        "event 4321 0\npolicy colde 100\nevent 4099 0\nevent 4321 -1\n"
                        "reload\nsetconfig 1 2=0\npolicy colde -1\nevent 4321 0\n");
    TraceSurvey survey;
    std::vector<std::string> errors;
    EXPECT_EQ(0, survey.read(path, [&](const std::string& e) { errors.push_back(e); }));
    EXPECT_TRUE(errors.empty());
    std::vector<std::string> uses;
    for (const auto& use : survey.uses()) {
        uses.push_back(
            (use.kind == TraceCall::Kind::Event ? std::to_string(use.cmdId) : use.policy) + " " +
            use.where.substr(dir.size() + 1) + " " + std::to_string(use.calls));
    }
    EXPECT_EQ(
        (std::vector<std::string>{"4321 t.trace:1 3", "colde t.trace:2 2", "4099 t.trace:3 1"}),
        uses);
}

TEST(TraceSurveyTest, ReportsEveryBadLineAndAMissingTrace) {
    const std::string dir = hosttest::makeScratchDir("survey-bad");
    hosttest::writeFile(dir + "/t.trace", "evnt 1\nreload\nsleep -1\n");
    std::vector<std::string> errors;
    auto collect = [&](const std::string& e) { errors.push_back(e.substr(dir.size() + 1)); };
    EXPECT_EQ(2, TraceSurvey().read(dir + "/t.trace", collect));
    EXPECT_EQ(1, TraceSurvey().read(dir + "/none.trace", collect));
    EXPECT_EQ((std::vector<std::string>{"t.trace:1: unknown call 'evnt'; did you mean 'event'?",
                                        "t.trace:3: malformed time '-1' for sleep",
                                        "none.trace: cannot open trace"}),
              errors);
}

}  // namespace
}  // namespace velmora
