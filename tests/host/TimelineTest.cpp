// The timeline's file: every kind of event in its place, counters of one track together however
// they were recorded, the holder of each node value as its category, and the same text whether
// written to a file or asked for; a long recording that went through the spool comes back whole.
#include <gtest/gtest.h>

#include <algorithm>
#include <climits>
#include <cstdint>
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

#include "host/record/Timeline.h"
#include "host/time/HostClock.h"
#include "tests/host/HostTestSupport.h"

namespace velmora {
namespace {

class TimelineTest : public testing::Test {
protected:
    void SetUp() override { mClock.setVirtual(); }

    HostClock mClock;
    Timeline mTimeline{mClock};
};

TEST_F(TimelineTest, WritesEachKindOfEventInItsPlace) {
    mTimeline.recordInitial("cpu.big.max", "policy4/max", "2841600");
    mTimeline.recordInitial("cpu.big.governor", "policy4/governor", "schedutil");
    mClock.advanceTo(5);
    mTimeline.recordCounter("velmora.scene", 4119);
    mTimeline.recordWrite("cpu.big.max", "policy4/max", "1804800");
    mTimeline.recordCounter("velmora.freq.big_cpu_max", 1804800);
    mTimeline.recordInstant("call", "@5 event 4119 0 -> 0");
    mTimeline.recordSlice("velmoraEvent cmdId=4119", 5000, 5000, 42);
    mClock.advanceTo(7);
    mTimeline.recordCounter("velmora.scene", 0);
    mTimeline.recordWrite("cpu.big.governor", "policy4/governor", "perf\"ormance");
    mTimeline.recordInstant("scene", "4119 game off");
    mTimeline.recordSpan("scenes", "scene", "4119 game", 5000, 7000);
    mTimeline.recordSpan("probe boosts", "probe", "tid 5", 5100, 5300);
    mTimeline.recordSpan("scenes", "scene", "4118 video", 5500, 6000);
    mTimeline.setCounterSource(
        [](const std::string& key, size_t sample) { return key + "#" + std::to_string(sample); });

    const std::string expected =
        "{\"displayTimeUnit\":\"ms\",\"traceEvents\":[\n"
        "{\"name\":\"process_name\",\"ph\":\"M\",\"pid\":1,\"tid\":0,\"args\":{\"name\":\"device "
        "nodes\"}},\n"
        "{\"name\":\"process_name\",\"ph\":\"M\",\"pid\":2,\"tid\":0,\"args\":{\"name\":"
        "\"events\"}},\n"
        "{\"name\":\"process_name\",\"ph\":\"M\",\"pid\":3,\"tid\":0,\"args\":{\"name\":\"velmora "
        "server\"}},\n"
        "{\"name\":\"cpu.big.max\",\"ph\":\"C\",\"cat\":\"cpu.big.max#0\",\"ts\":0,\"pid\":1,"
        "\"tid\":0,\"args\":{\"value\":2841600}},\n"
        "{\"name\":\"cpu.big.max\",\"ph\":\"C\",\"cat\":\"cpu.big.max#1\",\"ts\":5000,\"pid\":1,"
        "\"tid\":0,\"args\":{\"value\":1804800}},\n"
        "{\"name\":\"cpu.big.governor=schedutil\",\"cat\":\"node\",\"ph\":\"i\",\"s\":\"p\","
        "\"ts\":0,\"pid\":1,\"tid\":0},\n"
        "{\"name\":\"cpu.big.governor=perf\\\"ormance\",\"cat\":\"node\",\"ph\":\"i\",\"s\":"
        "\"p\",\"ts\":7000,\"pid\":1,\"tid\":0},\n"
        "{\"name\":\"velmora.scene\",\"ph\":\"C\",\"ts\":5000,\"pid\":3,\"tid\":0,\"args\":{"
        "\"value\":4119}},\n"
        "{\"name\":\"velmora.scene\",\"ph\":\"C\",\"ts\":7000,\"pid\":3,\"tid\":0,\"args\":{"
        "\"value\":0}},\n"
        "{\"name\":\"velmora.freq.big_cpu_max\",\"ph\":\"C\",\"ts\":5000,\"pid\":3,\"tid\":0,"
        "\"args\":{\"value\":1804800}},\n"
        "{\"name\":\"velmoraEvent cmdId=4119\",\"ph\":\"X\",\"ts\":5000,\"dur\":0,\"pid\":3,"
        "\"tid\":42},\n"
        "{\"name\":\"@5 event 4119 0 -> 0\",\"cat\":\"call\",\"ph\":\"i\",\"s\":\"g\",\"ts\":5000,"
        "\"pid\":2,\"tid\":0},\n"
        "{\"name\":\"4119 game off\",\"cat\":\"scene\",\"ph\":\"i\",\"s\":\"g\",\"ts\":7000,"
        "\"pid\":2,\"tid\":0},\n"
        "{\"name\":\"thread_name\",\"ph\":\"M\",\"pid\":2,\"tid\":1,\"args\":{\"name\":"
        "\"scenes\"}},\n"
        "{\"name\":\"4119 game\",\"cat\":\"scene\",\"ph\":\"X\",\"ts\":5000,\"dur\":2000,\"pid\":2,"
        "\"tid\":1},\n"
        "{\"name\":\"thread_name\",\"ph\":\"M\",\"pid\":2,\"tid\":2,\"args\":{\"name\":\"probe "
        "boosts\"}},\n"
        "{\"name\":\"tid 5\",\"cat\":\"probe\",\"ph\":\"X\",\"ts\":5100,\"dur\":200,\"pid\":2,"
        "\"tid\":2},\n"
        "{\"name\":\"4118 video\",\"cat\":\"scene\",\"ph\":\"X\",\"ts\":5500,\"dur\":500,\"pid\":2,"
        "\"tid\":1}\n"
        "]}\n";
    EXPECT_EQ(expected, mTimeline.chromeJson());
    const std::string path = hosttest::makeScratchDir("timeline") + "/timeline.json";
    std::string error;
    ASSERT_TRUE(mTimeline.writeChromeJson(path, &error)) << error;
    EXPECT_EQ(expected.substr(0, expected.size() - 1), hosttest::readFile(path));
}

// Far more events than a spool chunk holds: the queries and the file get every one, in order.
TEST_F(TimelineTest, ALongRecordingComesBackWhole) {
    constexpr int kCalls = 20000;
    mTimeline.recordInitial("gpu.min", "gpu/min", "257000000");
    for (int i = 0; i < kCalls; ++i) {
        mClock.advanceTo(i);
        mTimeline.recordInstant("call", "call " + std::to_string(i));
        mTimeline.recordCounter(i % 2 == 0 ? "velmora.scene" : "velmora.probe.boosted", i);
        if (i % 1000 == 0) {
            mTimeline.recordInstant("device", "note " + std::to_string(i));
            mTimeline.recordWrite("gpu.min", "gpu/min", std::to_string(300000000 + i));
        }
    }
    const auto calls = mTimeline.instants("call");
    ASSERT_EQ(static_cast<size_t>(kCalls), calls.size());
    EXPECT_EQ("call 12345", calls[12345].name);
    EXPECT_EQ(12345000, calls[12345].us);
    EXPECT_EQ(20u, mTimeline.instants("device").size());
    const auto scene = mTimeline.counter("velmora.scene");
    ASSERT_EQ(static_cast<size_t>(kCalls / 2), scene.size());
    EXPECT_EQ(19998, scene.back().value);
    EXPECT_EQ(20, mTimeline.changes("gpu.min"));

    const std::string path = hosttest::makeScratchDir("timeline-long") + "/timeline.json";
    std::string error;
    ASSERT_TRUE(mTimeline.writeChromeJson(path, &error)) << error;
    const auto json = nlohmann::json::parse(hosttest::readFile(path));
    // 3 process names, 21 node values, 20000 counters, 20020 instants.
    EXPECT_EQ(3u + 21u + kCalls + kCalls + 20u, json["traceEvents"].size());
    int64_t lastScene = -1;
    for (const auto& event : json["traceEvents"]) {
        if (event["name"] == "velmora.scene") {
            EXPECT_LT(lastScene, event["args"]["value"].get<int64_t>());
            lastScene = event["args"]["value"];
        }
    }
    EXPECT_EQ(19998, lastScene);
}

// Names of any length and any bytes, and extreme numbers, come back from the spool and the file
// exactly: longer than a record keeps inline, with control characters, quotes and UTF-8.
TEST_F(TimelineTest, AnyNameAndNumberComesBackExactly) {
    const std::string longName = "slice " + std::string(300, 'n') + " end";
    const std::string oddName = std::string("tab\there \"q\" back\\ bell\x07 \xC3\xA9", 27);
    mTimeline.recordSlice(longName, 1, 2, 7);
    mTimeline.recordInstant("device", oddName);
    mTimeline.recordCounter("velmora.low", INT64_MIN);
    mTimeline.recordCounter("velmora.high", INT64_MAX);
    ASSERT_EQ(1u, mTimeline.slices().size());
    EXPECT_EQ(longName, mTimeline.slices()[0].name);
    ASSERT_EQ(1u, mTimeline.instants("device").size());
    EXPECT_EQ(oddName, mTimeline.instants("device")[0].name);

    const auto json = nlohmann::json::parse(mTimeline.chromeJson());
    std::vector<std::string> names;
    for (const auto& event : json["traceEvents"]) {
        names.push_back(event["name"]);
        if (event["name"] == "velmora.low") {
            EXPECT_EQ(INT64_MIN, event["args"]["value"].get<int64_t>());
        }
        if (event["name"] == "velmora.high") {
            EXPECT_EQ(INT64_MAX, event["args"]["value"].get<int64_t>());
        }
    }
    EXPECT_NE(names.end(), std::find(names.begin(), names.end(), longName));
    EXPECT_NE(names.end(), std::find(names.begin(), names.end(), oddName));
    EXPECT_NE(std::string::npos, mTimeline.chromeJson().find("bell\\u0007"));
}

TEST_F(TimelineTest, AnUnwritablePathIsReported) {
    std::string error;
    EXPECT_FALSE(mTimeline.writeChromeJson("/nonexistent/dir/timeline.json", &error));
    EXPECT_EQ("cannot write /nonexistent/dir/timeline.json", error);
}

}  // namespace
}  // namespace velmora
