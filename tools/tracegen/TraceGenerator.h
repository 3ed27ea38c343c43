// Seeded random event traces for velmora-replay (format: tools/replay/TraceParser.h), for the
// property tests and the benchmarks. The same options give the same trace on every machine.
//
// A trace opens with the host's notification word, then follows DeviceUseModel's idea of a
// user, with probe events at a chosen share of the calls, `sleep` lines, calls made at the
// time reached (no "@", or an "@" time below it, which the replay warns about and runs at the
// time reached) and rare reloads and refused calls.
//
// With a margin, every call (and the end of every sleep) is kept at least that far from every
// deadline the generator can foresee (DeadlineBook), deadlines as far from each other, and the
// trace ends with a sleep past the last probe boost and clear of deadlines, so that a real-time
// replay of it has no race to lose and ends in the same state as a replay in virtual time.
#pragma once

#include <cstdint>
#include <string>

#include "tools/tracegen/DeadlineBook.h"
#include "tools/tracegen/DeviceUseModel.h"
#include "tools/tracegen/SplitMix64.h"

namespace velmora {

struct TraceGenOptions {
    uint64_t seed = 1;
    int64_t startMs = 100;      // time of the first call
    int64_t durationMs = 3000;  // no call starts after this trace time
    int64_t meanGapMs = 40;     // mean trace time from one call to the next
    // Shares, in parts per million: of the calls that are probe events, of the lines that are
    // sleeps, of the calls stamped below the time reached, that are reloads, that are refused.
    uint32_t probePpm = 150000;
    uint32_t sleepPpm = 30000;
    uint32_t backwardsPpm = 10000;
    uint32_t reloadPpm = 2000;
    uint32_t oddPpm = 5000;
    int64_t marginMs = 0;  // > 0: keep clear of foreseen deadlines by this much
    // > 0: a load line for the example device's clusters and GPU this often (a random walk of
    // its own, so the calls are those of the same trace without load lines).
    int64_t loadEveryMs = 0;

    // An hour of device use, about 120,000 host calls, for the replay benchmark.
    static TraceGenOptions hour(uint64_t seed, uint32_t probePpm);
};

struct TraceGenStats {
    int64_t lines = 0;        // lines with a call, a policy answer or a sleep
    int64_t hostCalls = 0;    // events, reloads, setconfig and getconfig: what the replay counts
    int64_t probeEvents = 0;  // of the host calls
    int64_t sleeps = 0;
    int64_t backwards = 0;  // calls stamped below the time reached
    int64_t endMs = 0;      // trace time at the end of the last line
    int64_t loadLines = 0;  // of the lines
};

class TraceGenerator {
public:
    // The whole trace, and what it holds in `stats` when given.
    static std::string generate(const TraceGenOptions& options, TraceGenStats* stats = nullptr);
    // The velmora-gen-trace arguments that write the same trace.
    static std::string arguments(const TraceGenOptions& options);

private:
    explicit TraceGenerator(const TraceGenOptions& options);

    std::string run();
    GeneratedCall nextCall();
    // The time prefix of the next line, for a call arming `deadlines`; moves the time reached
    // to when the line runs.
    std::string stamp(const std::vector<int64_t>& deadlines);
    void sleep();
    void write(const std::string& at, const GeneratedCall& call);
    void line(const std::string& text);
    // Load lines due by the time reached, stamped with it: they never move the replay's clock.
    void loads();

    const TraceGenOptions& mOptions;
    SplitMix64 mRandom;
    DeviceUseModel mModel;
    DeadlineBook mBook;
    TraceGenStats mStats;
    int64_t mNow;  // the time reached
    int64_t mLastProbeDeadline = -1;
    SplitMix64 mLoadRandom;
    int64_t mNextLoadMs = 0;
    int mLoadPermille[3] = {100, 50, 50};  // cpu.little, cpu.big, gpu
    std::string mText;
};

}  // namespace velmora
