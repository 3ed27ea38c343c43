// End to end: the example minute of device use replayed through the server on the host layer,
// in virtual time on a fresh simulated device. Asserts what the device nodes ended at and went
// through, the report lines of the device event log, and the timeline file.
#include <gtest/gtest.h>

#include <sys/stat.h>

#include <cstdio>
#include <cstring>
#include <sstream>
#include <string>
#include <vector>

#include "host/platform/HostEnvironment.h"
#include "tests/host/HostTestSupport.h"
#include "tools/replay/ReplaySession.h"

namespace velmora {
namespace {

class ReplayEndToEndTest : public testing::Test {
protected:
    static void SetUpTestSuite() {
        sDir = new std::string(hosttest::makeScratchDir("replay"));
        // First as a plain replay runs (no timeline, no event log: the server's trace points
        // off), then with both files; the tests below look at the second.
        ReplayOptions plain =
            hosttest::replayOptions(*sDir, hosttest::examplesDir() + "/minute.trace");
        plain.timelinePath.clear();
        plain.eventLogPath.clear();
        FILE* plainOut = fopen((*sDir + "/stdout-plain.txt").c_str(), "w");
        ReplaySession(plain, plainOut, stderr).run();
        fclose(plainOut);
        FILE* out = fopen((*sDir + "/stdout.txt").c_str(), "w");
        ReplaySession session(
            hosttest::replayOptions(*sDir, hosttest::examplesDir() + "/minute.trace"), out, stderr);
        sResult = session.run();
        sFailedCalls = session.failedCalls();
        fclose(out);
    }
    static void TearDownTestSuite() { delete sDir; }

    static std::string node(const std::string& key) {
        return hosttest::readFile(HostEnvironment::get().device().pathOf(key));
    }
    static Timeline::NodeSummary summaryOf(const std::string& key) {
        for (const auto& s : HostEnvironment::get().timeline().summary()) {
            if (s.key == key)
                return s;
        }
        ADD_FAILURE() << "no summary for " << key;
        return {};
    }

    static std::string* sDir;
    static int sResult;
    static int sFailedCalls;
};

std::string* ReplayEndToEndTest::sDir = nullptr;
int ReplayEndToEndTest::sResult = -1;
int ReplayEndToEndTest::sFailedCalls = -1;

// Client caps and event limits reach the cpufreq and devfreq nodes through the frequency
// manager's merge; at the end only ZOLA's big-cluster cap remains.
TEST_F(ReplayEndToEndTest, FrequencyLimitsReachedTheNodesAndWereReleased) {
    EXPECT_EQ("2419200", node("cpu.big.max"));
    EXPECT_EQ("1804800", node("cpu.little.max"));
    EXPECT_EQ("900000000", node("gpu.max"));
    EXPECT_EQ("300000", node("cpu.little.min"));
    EXPECT_EQ("65000", node("ipa.switch_temp"));
    EXPECT_EQ(1804800, summaryOf("cpu.big.max").min);  // thermal cap and battery saver
    EXPECT_EQ(1401600, summaryOf("cpu.little.max").min);
    EXPECT_EQ(60000, summaryOf("ipa.switch_temp").min);
    EXPECT_EQ(800000000,
              summaryOf("ddr.min").max);  // tag 10 of the touch floor, left to the platform
}

// The 5376 defaults, the scroll and ZOLA events and KX's step all end up in the group nodes.
TEST_F(ReplayEndToEndTest, GroupLevelsFollowDefaultsEventsAndClients) {
    EXPECT_EQ("-10", node("sched.group.top_app"));  // KX lowered it below the default 10
    EXPECT_EQ("10", node("sched.group.vip"));       // 4113 restored the ZOLA level
    EXPECT_EQ("-20", node("sched.group.background"));
    EXPECT_EQ("-20", node("sched.group.system_background"));
    EXPECT_EQ(30, summaryOf("sched.group.top_app").max);  // first ZOLA level event
}

TEST_F(ReplayEndToEndTest, EveryCallSucceededAndScenesAndTimedBoostsWereUndone) {
    EXPECT_EQ(ReplaySession::kOk, sResult);
    EXPECT_EQ(0, sFailedCalls);
    const std::string out = hosttest::readFile(*sDir + "/stdout.txt");
    EXPECT_NE(std::string::npos, out.find("init -> 0"));
    EXPECT_EQ("schedutil", node("cpu.big.governor"));
    EXPECT_EQ("simple_ondemand", node("gpu.governor"));
    EXPECT_EQ("0", node("sched.fork_on_big"));
    EXPECT_EQ("1", node("memlat.ratio_b"));
    const auto actions = HostEnvironment::get().timeline().instants("action");
    ASSERT_FALSE(actions.empty());
    // The launch policy answered 1200 for the cold launch.
    EXPECT_EQ("4099 cold_launch for 1200 ms", actions.front().name);
    EXPECT_EQ(1000000, actions.front().us);
}

// The thermal client's caps start, continue and end a limiting period; ZOLA starts another.
TEST_F(ReplayEndToEndTest, ReportLinesWentToTheEventLogAndTimeline) {
    const auto lines = HostEnvironment::get().eventLog().lines();
    ASSERT_EQ(4u, lines.size());
    const char* tails[] = {",1,1497,2016,700000,4>", ",3,1401,1804,600000,4>", ",2,-1,-1,-1,0>",
                           ",1,,2419,,1>"};
    for (size_t i = 0; i < lines.size(); ++i) {
        EXPECT_EQ(0u, lines[i].find("#ARG1:<")) << lines[i];
        EXPECT_EQ(lines[i].size() - strlen(tails[i]), lines[i].rfind(tails[i])) << lines[i];
    }
    const std::string file = hosttest::readFile(*sDir + "/events.log");
    EXPECT_NE(std::string::npos, file.find("25.000 prio=3 tag=361 #ARG1:<"));
    EXPECT_EQ(4u, HostEnvironment::get().timeline().instants("report").size());
}

// The timeline in Chrome's JSON (whether it parses is host.replay_timeline_is_json's check): a
// counter track per node, and the server's own tracks under the names a device capture shows.
TEST_F(ReplayEndToEndTest, TimelineHoldsTheNodeAndServerTracks) {
    const std::string json = hosttest::readFile(*sDir + "/timeline.json");
    EXPECT_EQ(0u, json.find("{\"displayTimeUnit\":\"ms\",\"traceEvents\":["));
    for (const auto& node : HostEnvironment::get().nodeMap().nodes()) {
        if (node.kind == NodeKind::Text)
            continue;
        EXPECT_NE(std::string::npos, json.find("{\"name\":\"" + node.key + "\",\"ph\":\"C\""))
            << node.key;
    }
    for (const char* event :
         {"\"cat\":\"report\",\"ph\":\"i\"", "{\"name\":\"4119 game on\",\"cat\":\"scene\"",
          "\"name\":\"cpu.big.governor=performance\"", "{\"name\":\"velmora.scene\",\"ph\":\"C\"",
          "{\"name\":\"velmoraEvent cmdId=4119\",\"ph\":\"X\"",
          "{\"name\":\"velmoraSetConfig clientId=1\",\"ph\":\"X\"",
          "{\"name\":\"dumpVelmoraServerInfo\",\"ph\":\"X\"",
          "{\"name\":\"velmora.sched.top_app\",\"ph\":\"C\""}) {
        EXPECT_NE(std::string::npos, json.find(event)) << event;
    }
    std::vector<int64_t> scenes;
    for (const auto& sample : HostEnvironment::get().timeline().counter("velmora.scene"))
        scenes.push_back(sample.value);
    EXPECT_EQ((std::vector<int64_t>{4118, 0, 4119, 4224, 4230, 0}), scenes);
}

// Writing the files changes nothing of what the replay prints but the lines that name them.
TEST_F(ReplayEndToEndTest, PlainReplayPrintsWhatTheOneWithFilesPrints) {
    auto without = [](std::string text) {
        std::string kept;
        std::istringstream in(text);
        for (std::string line; std::getline(in, line);) {
            if (line.rfind("timeline: ", 0) != 0 && line.rfind("event log: ", 0) != 0)
                kept += line + "\n";
        }
        while (kept.size() > 1 && kept.compare(kept.size() - 2, 2, "\n\n") == 0)
            kept.pop_back();  // the blank line before the files' lines
        return kept;
    };
    const std::string plain = hosttest::readFile(*sDir + "/stdout-plain.txt");
    EXPECT_NE(std::string::npos, plain.find(" host calls, ")) << plain;
    EXPECT_EQ(without(hosttest::readFile(*sDir + "/stdout.txt")), without(plain));
}

// No configuration, one that does not know the trace's calls (warned about once per command, where
// first used), one the server cannot start with.
TEST(ReplaySessionTest, WarnsAboutCallsTheServerCannotMeanAndPointsAtTheChecker) {
    const std::string dir = hosttest::makeScratchDir("warn");
    hosttest::writeFile(dir + "/t.trace",
                        "policy colde 1200\nevent 4321 0\nevent 20225 0\nevent 4321 -1\n");
    ReplayOptions options = hosttest::replayOptions(dir, dir + "/t.trace");
    ReplaySession unconfigured(options, stdout, stderr);  // none beside the trace
    EXPECT_EQ(ReplaySession::kBadInput, unconfigured.run());
    EXPECT_EQ(0, unconfigured.calls());

    options.configDirs = {hosttest::examplesDir()};
    FILE* err = tmpfile();
    EXPECT_EQ(ReplaySession::kOk, ReplaySession(options, stdout, err).run());
    const std::string where = "velmora-replay: " + dir + "/t.trace:";
    EXPECT_EQ(where +
                  "1: warning: policy 'colde' is never asked for: the server asks for "
                  "\"cold\" (4099) and \"winswitch\" (4098); did you mean 'cold'?\n" +
                  where +
                  "2: warning: command 4321 (2 calls) is not in the configuration: the server "
                  "answers 2\n",
              hosttest::readAndClose(err));

    // A configuration the server cannot start with (no start-up command 5376).
    ASSERT_EQ(0, mkdir((dir + "/xml").c_str(), 0755));
    hosttest::writeFile(dir + "/xml/velmora_config_cust.xml",
                        "<policy><cmd id=\"4099\"><a><duration>5</duration></a></cmd></policy>\n");
    options.configDirs = {dir};
    err = tmpfile();
    EXPECT_EQ(ReplaySession::kSetupFailed, ReplaySession(options, stdout, err).run());
    EXPECT_NE(std::string::npos,
              hosttest::readAndClose(err).find("server init failed with 2; check the "
                                               "configuration with velmora-lint " +
                                               dir + "/xml/velmora_config_cust.xml"));
}

}  // namespace
}  // namespace velmora
