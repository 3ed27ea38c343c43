// One run of velmora-replay: sets up the host platform layer, initialises a VelmoraServer on it,
// replays the calls of a trace (or of stdin, interactively), and reports what the device nodes
// went through: a per-node summary and, for each output path that is set, a timeline in Chrome's
// JSON trace format, the device event log, the summary JSON and the HTML report. Nothing else is
// left behind: the default simulated device (in $TMPDIR) goes at the end unless kept.
//
// Used by the velmora-replay program and by the end-to-end tests; single threaded.
#pragma once

#include <cstdint>
#include <cstdio>
#include <map>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "host/device/profile/DeviceProfile.h"
#include "tools/energy/LoadTimeline.h"
#include "tools/insight/InsightResult.h"
#include "tools/replay/TraceParser.h"

class VelmoraServer;

namespace velmora {

class ReplayInsight;
class SameCpuScope;
class TraceSurvey;

struct ReplayOptions {
    std::string tracePath;                // ignored when interactive
    bool interactive = false;             // read calls from `input` until end of file
    std::vector<std::string> configDirs;  // default: the trace's directory
    std::string deviceRoot;               // default: a fresh simulated device in $TMPDIR
    bool keepRoot = false;                // the default simulated device stays after the run
    std::string devicePath;               // device profile; default: the example device
    std::string nodeMapPath;              // node map overrides, optional
    double speed = 1.0;                   // trace ms per real ms
    bool fast = false;                    // virtual time: no waiting at all
    std::string timelinePath;             // Chrome JSON timeline; optional
    std::string eventLogPath;             // device event log lines; optional
    std::vector<std::pair<std::string, std::string>> properties;
    bool quiet = false;           // no per-call lines
    std::string summaryJsonPath;  // everything the analysis found, as JSON; optional
    std::string reportPath;       // self-contained HTML report; optional
    bool writeFiles = true;       // false: timeline, summary JSON and report are not written
    bool insight = true;          // false: no analysis (the plain summary), for measuring its cost
    // Comparing two runs (ComparisonRun): the first keeps every call's digest, the second is
    // compared with them as it goes. A plain replay keeps nothing per call.
    bool keepCallDigests = false;
    std::vector<uint64_t> compareWithDigests;
};

class ReplaySession {
public:
    // Exit codes of run().
    static constexpr int kOk = 0;
    static constexpr int kBadInput = 1;  // unknown call, malformed number, missing file
    static constexpr int kSetupFailed = 2;

    ReplaySession(ReplayOptions options, FILE* out, FILE* err, FILE* input = stdin);
    ~ReplaySession();

    // Whole run: set-up, replay, summary, timeline. One of the exit codes above.
    int run();

    // Parts of run(), for tests.
    int setUp();
    // Performs one call; returns the host status (0 for calls that are not host calls).
    int perform(const TraceCall& call);
    void tearDown();
    std::string summaryText() const;
    int calls() const { return mCalls; }
    int failedCalls() const { return mFailed; }
    // What the analysis found; complete after run() (or finishInsight()).
    const InsightResult& insight() const { return mResult; }
    // Ends the analysis at the current trace time. Called by run() before the tear-down.
    void finishInsight();

private:
    int performCall(const TraceCall& call);
    // A load line: what the energy model reads, at the time it names.
    int performLoad(const TraceCall& call);
    int replayFile();
    // Reads the device profile into mProfile once (the example device's without --device).
    int loadProfile();
    int replayInteractive();
    void waitForProbeBoosts();
    // Removes the simulated device root when this session made it.
    void removeOwnedRoot();
    void echo(const TraceCall& call, const std::string& result);
    // A time stamp behind the time reached: a warning with the line, ending "<what> N ms".
    void warnIfBehind(const TraceCall& call, const char* what) const;
    std::string commandName(int cmdId) const;
    // The timeline file is asked for: only then are the server's tracks, the per-call instants
    // and the analysis's spans recorded.
    bool writesTimeline() const { return !mOptions.timelinePath.empty(); }

    ReplayOptions mOptions;
    FILE* mOut;
    FILE* mErr;
    FILE* mInput;
    std::string mOwnedRoot;  // the simulated device root made by setUp, removed at tear-down
    // --fast: the replay thread and the probe worker share one processor (SameCpuScope.h).
    std::unique_ptr<SameCpuScope> mSameCpu;
    std::unique_ptr<VelmoraServer> mServer;
    std::unique_ptr<ReplayInsight> mInsight;  // watches the executor while the server runs
    InsightResult mResult;
    DeviceProfile mProfile;  // of the simulated device, for its energy tables
    bool mProfileLoaded = false;
    LoadTimeline mLoads;                        // what the trace's load lines said
    mutable std::map<int, std::string> mNames;  // commandName() cache, dropped on reload
    int mCalls = 0;
    int mFailed = 0;  // host calls with a nonzero status
};

}  // namespace velmora
