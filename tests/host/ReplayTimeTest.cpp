// Virtual time gives the answers of real time: a trace replayed with --fast and at ten times real
// speed ends with the same node summary, report lines and counter events, and two --fast runs
// write byte-identical timelines.
#include <gtest/gtest.h>

#include <cstdio>
#include <sstream>
#include <string>
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
    EXPECT_EQ(fast.summary, real.summary);
    EXPECT_EQ(fast.reports, real.reports);
    EXPECT_EQ(fast.counters, real.counters);
}

INSTANTIATE_TEST_SUITE_P(Traces, ReplayTimeTest,
                         testing::Values("examples/minute.trace", "tests/host/data/probes.trace"));

}  // namespace
}  // namespace velmora
