// The host program's handle on the host platform layer: the process-wide parts that the seam
// functions (getPlat, property_get, get_one_cfg_file, the policy server, the device event log)
// answer from, and that a host program configures before it initialises the server.
//
//     auto& env = velmora::HostEnvironment::get();
//     env.useDeviceRoot("/tmp/sim", /*fresh=*/true);   // or "/" for the real nodes
//     env.properties().setConfigDirs({"examples"});
//     env.launchPolicies().set("cold", 1500);
//     env.eventLog().setPath("events.log");
//
// The parts are thread safe on their own. useDeviceRoot and nodeMap changes must happen while
// no platform object exists. The server's trace tracks go to the timeline from the moment the
// environment exists (it installs its trace sink on construction) until setServerTracing(false).
#pragma once

#include <string>

#include "host/device/DeviceTree.h"
#include "host/device/NodeMap.h"
#include "host/platform/HostProperties.h"
#include "host/platform/LaunchPolicyTable.h"
#include "host/record/EventLog.h"
#include "host/record/Timeline.h"
#include "host/record/TimelineTraceSink.h"
#include "host/time/HostClock.h"

namespace velmora {

class ProbeClock;

class HostEnvironment {
public:
    static HostEnvironment& get();

    // Everything back to the defaults: an unpaced clock at 0, empty timeline and event
    // log, default node map and properties, no policies, the default simulated device root,
    // the server's trace tracks on.
    void reset();
    // Whether the server's trace points reach the timeline. Off, the server sees nobody tracing
    // (as on a device without a capture) and skips the work of its trace points: for a replay
    // that writes no timeline. Set while no server exists.
    void setServerTracing(bool on);

    // Device root: "/" writes the real nodes; any other directory is a simulated device, seeded
    // with every node's seed value when `fresh` (or when it was never seeded). 0 or -1 (logged).
    int useDeviceRoot(const std::string& root, bool fresh);
    // Makes sure the current root is usable (seeds the default simulated device on first use).
    int prepareDevice();
    // Directory of the default simulated device: $TMPDIR/velmora-sim-<pid>, /tmp when TMPDIR is
    // unset or not an absolute path.
    static std::string defaultSimulatedRoot();
    // Deletes the simulated device at `root` with everything in it, and goes back to the
    // default root. Refuses (false, `error` set) a directory this layer did not seed.
    bool removeSimulatedRoot(const std::string& root, std::string* error);

    HostClock& clock() { return mClock; }
    Timeline& timeline() { return mTimeline; }
    NodeMap& nodeMap() { return mNodeMap; }
    DeviceTree& device() { return mDevice; }
    HostProperties& properties() { return mProperties; }
    LaunchPolicyTable& launchPolicies() { return mPolicies; }
    EventLog& eventLog() { return mEventLog; }

    // The factory of the probe workers' clocks: each on this environment's clock.
    static ProbeClock* createProbeClock();

private:
    HostEnvironment();
    ~HostEnvironment();

    // Declaration order is construction order: the later parts refer to the earlier ones.
    HostClock mClock;
    Timeline mTimeline;
    TimelineTraceSink mTraceSink;
    NodeMap mNodeMap;
    DeviceTree mDevice;
    HostProperties mProperties;
    LaunchPolicyTable mPolicies;
    EventLog mEventLog;
    std::mutex mLock;  // guards mPrepared
    bool mPrepared = false;
};

}  // namespace velmora
