// Virtual time gives the answers of real time: a trace replayed with --fast and at ten times real
// speed ends with the same node summary, report lines and counter events, and two --fast runs
// write byte-identical timelines.
#include <gtest/gtest.h>

#include <unistd.h>

#include <chrono>
#include <cstdio>
#include <sstream>
#include <string>
#include <thread>
#include <vector>

#include "host/platform/HostEnvironment.h"
#include "tests/host/HostTestSupport.h"
#include "tools/replay/ReplaySession.h"

namespace velmora {
namespace {

struct Replayed {
    std::string summary;
    std::string timeline;
    std::vector<std::string> reports;   // wall-clock stamps blanked
    std::vector<std::string> counters;  // counter events without their time
};

Replayed replay(const std::string& trace, bool fast, double speed, const std::string& name) {
    const std::string dir = hosttest::makeScratchDir(name);
    ReplayOptions options = hosttest::replayOptions(dir, trace);
    options.configDirs = {hosttest::examplesDir()};
    options.fast = fast;
    options.speed = speed;
    FILE* out = fopen((dir + "/stdout.txt").c_str(), "w");
    ReplaySession session(options, out, stderr);
    EXPECT_EQ(ReplaySession::kOk, session.run());
    fclose(out);

    Replayed r;
    r.summary = session.summaryText();
    r.timeline = hosttest::readFile(options.timelinePath);
    for (std::string line : HostEnvironment::get().eventLog().lines()) {
        if (line.size() >= 21) {
            line.replace(7, 14, 14, '#');  // "#ARG1:<" YYYYMMDDhhmmss
        }
        r.reports.push_back(line);
    }
    std::istringstream events(r.timeline);
    for (std::string line; std::getline(events, line);) {
        const size_t ts = line.find("\"ts\":");
        if (line.find("\"ph\":\"C\"") != std::string::npos && ts != std::string::npos) {
            r.counters.push_back(line.substr(0, ts) + line.substr(line.find(',', ts)));
        }
    }
    return r;
}

class ReplayTimeTest : public testing::TestWithParam<const char*> {};

TEST_P(ReplayTimeTest, FastAgreesWithRealTimeAndRepeatsExactly) {
    const std::string trace = std::string(VELMORA_SOURCE_DIR) + "/" + GetParam();
    const Replayed fast = replay(trace, true, 1.0, "fast-a");
    const Replayed again = replay(trace, true, 1.0, "fast-b");
    const Replayed real = replay(trace, false, 10.0, "speed10");

    ASSERT_FALSE(fast.counters.empty());
    EXPECT_EQ(fast.timeline, again.timeline);
    // Paced time is the same virtual time: the whole timeline agrees, not only the nodes.
    EXPECT_EQ(fast.timeline, real.timeline);
    EXPECT_EQ(fast.summary, real.summary);
    EXPECT_EQ(fast.reports, real.reports);
    EXPECT_EQ(fast.counters, real.counters);
}

INSTANTIATE_TEST_SUITE_P(Traces, ReplayTimeTest,
                         testing::Values("examples/minute.trace", "tests/host/data/probes.trace",
                                         "tests/host/data/sleeps.trace"));

// A paced replay whose trace ends in a sleep finishes; a time that goes backwards is named with
// its line and the call runs at the time reached.
TEST(ReplayPacedTest, EndsAfterTrailingSleepAndWarnsAboutTimeGoingBack) {
    const std::string dir = hosttest::makeScratchDir("paced-sleep");
    const std::string trace = dir + "/back.trace";
    hosttest::writeFile(trace,
                        "@100 event 4101 0\n@300 sleep 20\n@200 event 4101 -1\n@400 sleep 10\n");
    ReplayOptions options = hosttest::replayOptions(dir, trace);
    options.configDirs = {hosttest::examplesDir()};
    options.fast = false;
    options.speed = 20;
    options.quiet = false;
    FILE* out = fopen((dir + "/stdout.txt").c_str(), "w");
    FILE* err = fopen((dir + "/stderr.txt").c_str(), "w");
    ReplaySession session(options, out, err);
    EXPECT_EQ(ReplaySession::kOk, session.run());
    fclose(out);
    fclose(err);
    EXPECT_NE(std::string::npos,
              hosttest::readFile(dir + "/stderr.txt")
                  .find("back.trace:3: warning: @200 is before the time already reached (320 "
                        "ms); the call runs at 320 ms"));
    EXPECT_NE(std::string::npos,
              hosttest::readFile(dir + "/stdout.txt")
                  .find("[      0.320] " + trace + ":3 @200 event 4101 -1 -> 0"));
}

// A paced interactive replay keeps the device up to the wall clock while nobody types: the
// window switch's 400 ms action ends at its own trace time, before the next line arrives.
TEST(ReplayPacedTest, InteractiveDeviceFollowsTheWallClockBetweenLines) {
    const std::string dir = hosttest::makeScratchDir("paced-interactive");
    ReplayOptions options = hosttest::replayOptions(dir, "");
    options.interactive = true;
    options.configDirs = {hosttest::examplesDir()};
    options.fast = false;
    options.speed = 10;
    options.quiet = false;
    int fds[2];
    ASSERT_EQ(0, pipe(fds));
    FILE* input = fdopen(fds[0], "r");
    const std::string littleMin = HostEnvironment::get().nodeMap().find("cpu.little.min")->path;
    std::string whileWaiting;
    std::thread typist([fd = fds[1], &dir, &littleMin, &whileWaiting] {
        const std::string first = "event 4098 0\n";
        const std::string second = "getconfig 22\n";
        EXPECT_EQ(static_cast<ssize_t>(first.size()), write(fd, first.data(), first.size()));
        // Once applied, 200 ms of wall clock are two trace seconds: long reverted by then.
        for (int i = 0; i < 1000 && hosttest::readFile(dir + "/device/" + littleMin) != "1401600";
             ++i)
            std::this_thread::sleep_for(std::chrono::milliseconds(5));
        std::this_thread::sleep_for(std::chrono::milliseconds(200));
        whileWaiting = hosttest::readFile(dir + "/device/" + littleMin);
        EXPECT_EQ(static_cast<ssize_t>(second.size()), write(fd, second.data(), second.size()));
        close(fd);
    });
    FILE* out = fopen((dir + "/stdout.txt").c_str(), "w");
    ReplaySession session(options, out, stderr, input);
    EXPECT_EQ(ReplaySession::kOk, session.run());
    typist.join();
    fclose(out);
    fclose(input);

    const SpanInsight* window = nullptr;
    for (const auto& span : session.insight().spans) {
        if (span.name.find("4098") != std::string::npos)
            window = &span;
    }
    ASSERT_NE(nullptr, window);
    EXPECT_EQ(400000, window->endUs - window->beginUs);
    EXPECT_EQ("300000", whileWaiting);  // reverted before anyone typed again
    const auto calls = HostEnvironment::get().timeline().instants("call");
    ASSERT_EQ(2u, calls.size());
    EXPECT_GE(calls[1].us, 2000000);
    EXPECT_LT(window->endUs, calls[1].us);
}

}  // namespace
}  // namespace velmora
