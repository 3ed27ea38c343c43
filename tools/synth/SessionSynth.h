// A plausible recorded session of the example device, for fleet runs, benchmarks and the demo:
// what velmora-import-logcat makes of a device log, with the load lines of scripts/record-load
// merged in. The same options give the same session on every machine.
//
// The user goes from one activity to the next: the screen off for a while (a notification or
// a query now and then), an app (a launch with the launch policy's answer now and then, then
// scrolling with probed render threads, window switches, queries and frequency clients), a
// game (launched, the game scene and its governor scenes, a memory-latency request, the thermal
// client capping the clusters, probes; mostly switched off again when the game ends, not
// always). The calls themselves come from DeviceUseModel, the property tests' model of a user.
// Every load period a `load` line (LoadModel) tells how busy the domains were.
#pragma once

#include <cstdint>
#include <string>

#include "tools/synth/LoadModel.h"
#include "tools/tracegen/DeviceUseModel.h"
#include "tools/tracegen/SplitMix64.h"

namespace velmora {

struct SessionOptions {
    uint64_t seed = 1;
    int64_t durationMs = 600000;  // no call starts after this trace time
    bool load = true;             // write load lines
    int64_t loadPeriodMs = 1000;  // time between two load lines
};

struct SessionStats {
    int64_t hostCalls = 0;  // what the replay counts as calls
    int64_t loadLines = 0;
    int64_t games = 0;
    int64_t apps = 0;
    int64_t idles = 0;
};

class SessionSynth {
public:
    static std::string generate(const SessionOptions& options, SessionStats* stats = nullptr);

private:
    explicit SessionSynth(const SessionOptions& options);

    std::string run();
    void idle(int64_t until);
    void app(int64_t until);
    void game(int64_t until);
    // Moves the time on by a random gap around `meanMs` (0: not at all), writing the load lines
    // that fall due.
    void advance(int64_t meanMs);
    // A call at the time reached.
    void write(const GeneratedCall& call);
    void line(const std::string& text);

    const SessionOptions& mOptions;
    SplitMix64 mRandom;
    DeviceUseModel mModel;
    LoadModel mLoad;
    SessionStats mStats;
    LoadModel::Activity mActivity = LoadModel::kIdle;
    int64_t mNow = 100;
    int64_t mNextLoadMs = 0;
    std::string mText;
};

}  // namespace velmora
