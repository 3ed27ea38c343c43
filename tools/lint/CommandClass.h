// How the server dispatches a configured command: by its id first (memory latency, probe,
// notification ids, special scenes, on/off commands), then by the duration of the action it
// parses (negative: nothing; 0: scheduling levels; positive: a timed action), in the order the
// event entry point tests them. Stateless.
#pragma once

#include <string>

#include "config/CommandIds.h"
#include "config/CommandKind.h"

namespace velmora {

enum class DispatchClass {
    kMemoryLatency,  // 20481: applied on and off through the platform, whatever the duration
    kNeverRead,      // 20480 and the other ids from 20224 up: events never read the configuration
    kProbe,          // 4116: the probe boost applied to probed threads
    kNoAction,       // no usable action: events parse a default action and do nothing
    kDisabled,       // negative duration: events do nothing
    kSpecialScene,   // 4118..4223
    kGovernorScene,  // 4224..4352
    kOnOff,          // 12288..13568
    kStartupLevels,  // 5376 with duration 0: the default scheduling-group levels
    kSchedLevel,     // duration 0: scheduling-group levels
    kTimedAction,    // positive duration: a platform action for that many ms
};

class CommandClass {
public:
    // The class of command `cmdId` whose dispatched record has `duration`; `hasAction` is
    // false when the command has no usable action.
    static DispatchClass classify(int cmdId, bool hasAction, int duration);
    // A short name of the class, e.g. "special scene".
    static const char* name(DispatchClass dispatchClass);
    // What an event of the class does, for the --explain listing.
    static std::string effect(DispatchClass dispatchClass, int cmdId, int duration);

    static bool isScene(int cmdId) { return isSceneId(cmdId); }
    static bool isOnOff(int cmdId) { return isOnOffId(cmdId); }
    // Built-in priority of a special scene, 0 when it has none.
    static int builtInPriority(int cmdId);
};

}  // namespace velmora
