// Replays of random traces (tools/tracegen) agree with each other: two --fast replays of a trace
// print and write byte for byte the same, and a replay paced at 20 times real speed prints and
// writes what --fast does. The traces keep every call 20 ms clear of the deadlines the generator
// foresees and end past the last probe boost, so nothing in them hinges on which of two nearly
// simultaneous things goes first.
//
// 30 seeds by default; VELMORA_PROPERTY_SEEDS=N runs seeds 1..N (ctest -C property -L property
// runs 300, see docs/testing.md). A failing seed is reproduced with velmora-gen-trace (the
// arguments are in the failure).
#include <gtest/gtest.h>
#include <unistd.h>

#include <chrono>
#include <condition_variable>
#include <cstdio>
#include <cstdlib>
#include <functional>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "host/platform/HostEnvironment.h"
#include "tests/host/HostTestSupport.h"
#include "tools/replay/ReplaySession.h"
#include "tools/tracegen/TraceGenerator.h"

namespace velmora {
namespace {

constexpr int kDefaultSeeds = 30;
constexpr double kSpeed = 20;
// Real seconds a paced replay may take beyond its trace's duration at kSpeed before the
// test gives up on it (a replay that hangs would otherwise hold the suite until its timeout).
constexpr int kSlackSeconds = 5;

int seedCount() {
    const char* text = getenv("VELMORA_PROPERTY_SEEDS");
    const int n = text != nullptr ? atoi(text) : 0;
    return n > 0 ? n : kDefaultSeeds;
}

TraceGenOptions traceOptions(uint64_t seed) {
    TraceGenOptions options;
    options.seed = seed;
    options.durationMs = 2000;
    options.meanGapMs = 25;
    options.marginMs = 20;
    return options;
}

struct Replayed {
    int status = -1;
    int calls = -1;
    std::string printed;     // everything the replay printed
    std::string summary;     // the node table
    std::string reportFile;  // the event log as written
    std::string timeline;
};

// Ends the test program with a message if `run` has not returned within `seconds`.
void withinSeconds(int seconds, const std::string& what, const std::function<void()>& run) {
    std::mutex lock;
    std::condition_variable done;
    bool finished = false;
    std::thread watchdog([&] {
        std::unique_lock<std::mutex> hold(lock);
        if (!done.wait_for(hold, std::chrono::seconds(seconds), [&] { return finished; })) {
            fprintf(stderr, "ReplayPropertyTest: %s did not finish in %d s\n", what.c_str(),
                    seconds);
            fflush(stderr);
            _exit(1);
        }
    });
    run();
    {
        std::lock_guard<std::mutex> hold(lock);
        finished = true;
    }
    done.notify_one();
    watchdog.join();
}

Replayed replay(const std::string& dir, const std::string& trace, bool fast) {
    ReplayOptions options = hosttest::replayOptions(dir, trace);
    options.configDirs = {hosttest::examplesDir()};
    options.quiet = false;
    options.fast = fast;
    options.speed = fast ? 1.0 : kSpeed;
    Replayed r;
    FILE* out = tmpfile();
    {
        ReplaySession session(options, out, stderr);
        r.status = session.run();
        r.calls = session.calls();
        r.summary = session.summaryText();
    }
    r.printed = hosttest::readAndClose(out);
    r.reportFile = hosttest::readFile(options.eventLogPath);
    r.timeline = hosttest::readFile(options.timelinePath);
    return r;
}

class ReplayPropertyTest : public testing::TestWithParam<uint64_t> {
protected:
    void SetUp() override {
        mDir = hosttest::makeScratchDir("property-" + std::to_string(GetParam()));
        mTrace = mDir + "/random.trace";
        hosttest::writeFile(mTrace, TraceGenerator::generate(traceOptions(GetParam()), &mStats));
    }

    // How to write this seed's trace again, for a failure message.
    std::string reproduce() const {
        return "trace: velmora-gen-trace " + TraceGenerator::arguments(traceOptions(GetParam()));
    }

    std::string mDir;
    std::string mTrace;
    TraceGenStats mStats;
};

TEST_P(ReplayPropertyTest, FastReplayRepeatsItselfExactly) {
    SCOPED_TRACE(reproduce());
    const Replayed first = replay(mDir, mTrace, true);
    const Replayed second = replay(mDir, mTrace, true);

    ASSERT_EQ(ReplaySession::kOk, first.status);
    // Every host call of the trace was made, the ones stamped in the past included.
    EXPECT_EQ(mStats.hostCalls, first.calls);
    EXPECT_EQ(first.printed, second.printed);
    EXPECT_EQ(first.timeline, second.timeline);
    EXPECT_EQ(first.reportFile, second.reportFile);
}

TEST_P(ReplayPropertyTest, PacedReplayWritesWhatFastWrites) {
    SCOPED_TRACE(reproduce());
    // One directory for both, so that even the paths they print are the same.
    const Replayed fast = replay(mDir, mTrace, true);
    Replayed paced;
    const int limit = static_cast<int>(mStats.endMs / 1000 / kSpeed) + kSlackSeconds;
    withinSeconds(
        limit,
        "the --speed 20 replay of seed " + std::to_string(GetParam()) + " (" + reproduce() + ")",
        [&] { paced = replay(mDir, mTrace, false); });

    ASSERT_EQ(ReplaySession::kOk, paced.status);
    // The node table first: where a difference is easiest to read.
    EXPECT_EQ(fast.summary, paced.summary);
    EXPECT_EQ(fast.printed, paced.printed);
    EXPECT_EQ(fast.timeline, paced.timeline);
    EXPECT_EQ(fast.reportFile, paced.reportFile);
}

// The generated probes reach both of the worker's ways to boost, as the margins assume: a thread
// is boosted 8 ms after its request, or at once when its process's main thread is boosted; and
// a boost lasts at most its 256 ms lifetime, ending on time or at a later request's boost.
TEST(ReplayPropertyProbeTest, BoostsStartAtTheRequestOrEightMsLater) {
    int atOnce = 0;
    int delayed = 0;
    for (uint64_t seed = 1; seed <= 10; ++seed) {
        SCOPED_TRACE(seed);
        const std::string dir = hosttest::makeScratchDir("probe-paths");
        const std::string trace = dir + "/random.trace";
        hosttest::writeFile(trace, TraceGenerator::generate(traceOptions(seed)));
        ReplayOptions options = hosttest::replayOptions(dir, trace);
        options.configDirs = {hosttest::examplesDir()};
        FILE* out = tmpfile();
        ReplaySession session(options, out, stderr);
        ASSERT_EQ(ReplaySession::kOk, session.run());
        fclose(out);
        const InsightResult& result = session.insight();
        const auto calls = HostEnvironment::get().timeline().instants("call");
        for (const SpanInsight& span : result.spans) {
            if (span.category != "probe") {
                continue;
            }
            // The last boost request of that thread id before the boost began.
            const std::string tid = "|tid=" + span.name.substr(span.name.find(' ') + 1) + "\"";
            int64_t requestUs = -1;
            for (const auto& call : calls) {
                if (call.us <= span.beginUs &&
                    call.name.find("event 4116 0 ") != std::string::npos &&
                    call.name.find(tid) != std::string::npos) {
                    requestUs = call.us;
                }
            }
            const int64_t delayUs = span.beginUs - requestUs;
            EXPECT_TRUE(requestUs >= 0 && (delayUs == 0 || delayUs == 8000))
                << span.name << " boosted at " << span.beginUs << " us, asked at " << requestUs;
            EXPECT_LE(span.endUs - span.beginUs, 264000) << span.name << " at " << span.beginUs;
            (delayUs == 0 ? atOnce : delayed) += 1;
        }
    }
    EXPECT_GT(atOnce, 0);
    EXPECT_GT(delayed, 0);
}

INSTANTIATE_TEST_SUITE_P(Seeds, ReplayPropertyTest, testing::Range<uint64_t>(1, seedCount() + 1),
                         [](const testing::TestParamInfo<uint64_t>& info) {
                             return "seed" + std::to_string(info.param);
                         });

}  // namespace
}  // namespace velmora
