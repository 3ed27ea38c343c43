// What a user of the example device does, one host call at a time: launches (with the launch
// policy's answer now and then), window switches, scrolling, the ZOLA client's levels, special
// and governor scenes, battery saver, memory latency, frequency and thermal clients, queries,
// notifications, reloads and probes of render and main threads. It remembers what is on so
// that scenes and switches are mostly turned off again, and tells which deadlines each call
// arms (as offsets from the call's time) for the generator's DeadlineBook.
//
// Written for the example configuration (examples/xml/velmora_config_cust.xml): its command
// ids, the durations of its timed actions and the frequencies of the example device.
#pragma once

#include <cstdint>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include "config/CommandIds.h"
#include "tools/tracegen/SplitMix64.h"

namespace velmora {

struct GeneratedCall {
    std::string prelude;  // a line made at the same time, just before the call (a policy answer)
    std::string text;     // the call as written in a trace, without a time
    // Deadlines the call arms, in ms after the call; 0 stands for the probe worker's pass
    // that follows a probe call.
    std::vector<int64_t> deadlines;
    bool probe = false;    // an event 4116
    bool hostCall = true;  // false for a policy answer, which only the host layer sees
};

class DeviceUseModel {
public:
    // Durations of the example configuration's timed actions (ms).
    static constexpr int64_t kColdLaunchMs = 1500;
    static constexpr int64_t kWindowSwitchMs = 400;
    static constexpr int64_t kAppInstallMs = 3000;
    // The probe worker: a queued thread is boosted this long after the request, and a boost
    // is withdrawn this long after it was applied.
    static constexpr int64_t kProbeDelayMs = 8;
    static constexpr int64_t kProbeLifetimeMs = kProbeBoostLifetimeMs;

    explicit DeviceUseModel(SplitMix64& random) : mRandom(random) {}

    // The feature word the host sends first (statistics upload, launch policies).
    GeneratedCall notification();
    // A boost request or withdrawal of a probed thread.
    GeneratedCall probe();
    // Anything but a probe.
    GeneratedCall deviceCall();
    GeneratedCall reload();
    // A call the server refuses: a bad probe state or message, an unknown command, a timed
    // action without payload, a level out of range.
    GeneratedCall oddCall(bool probes);

    // The kinds of deviceCall(), for a caller that chooses what the user does next.
    enum Kind {
        kLaunch,
        kWindowSwitch,
        kAppInstall,
        kTimedWithdraw,
        kScroll,
        kZola,
        kScreenOff,
        kScene,
        kGovernorScene,
        kOnOff,
        kMemLatency,
        kFreqClient,
        kThermalClient,
        kLevelClient,
        kQuery,
        kNotification,
        kPolicy,
        kKindCount
    };
    // One call of the given kind (kScene, kGovernorScene, kOnOff: one of that kind's commands).
    GeneratedCall deviceCall(Kind kind);
    // Switches a scene, governor scene or on/off command on when it is off, off when it is on.
    GeneratedCall toggle(int cmdId) { return toggle(cmdId, &mOn); }
    bool isOn(int cmdId) const { return mOn.count(cmdId) != 0; }

private:
    GeneratedCall launch(int cmdId, const char* policyName, int* policy, int64_t configuredMs);
    std::string policyLine(const char* name, int* policy);
    GeneratedCall toggle(int cmdId, std::set<int>* on);
    GeneratedCall memLatency();
    GeneratedCall freqClient();
    GeneratedCall thermalClient();
    GeneratedCall levelClient();
    GeneratedCall query();
    GeneratedCall probeRequest(const std::pair<int, int>& thread);
    GeneratedCall probeWithdrawal(const std::pair<int, int>& thread);
    std::pair<int, int> probedThread();
    int renderThread(int pid);
    std::string threadMsg(const std::pair<int, int>& thread) const;
    int frequencyFor(int tag);

    SplitMix64& mRandom;
    int mColdPolicy = -1;  // the launch policy's answers; -1: none
    int mWinSwitchPolicy = -1;
    std::set<int> mOn;  // scenes, on/off commands, memory latency, scrolling, ZOLA level
    std::vector<std::pair<int, int>> mProbed;  // (pid, tid) asked for a boost, not withdrawn
    std::string mLatencyMsg;                   // the 20480 request that is on, if any
};

}  // namespace velmora
