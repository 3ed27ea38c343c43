#include "tools/lint/CommandClass.h"

namespace velmora {

DispatchClass CommandClass::classify(int cmdId, bool hasAction, int duration) {
    // Ids from 20224 up are taken apart before any parse; 20481 parses but ignores duration.
    const CommandKind kind = velmora::classify(cmdId);
    if (kind == CommandKind::kMemoryLatency && cmdId == kCmdMemLatency) {
        return DispatchClass::kMemoryLatency;
    }
    if (cmdId >= kCmdClientRestart) {
        return DispatchClass::kNeverRead;
    }
    if (kind == CommandKind::kProbe) {
        return DispatchClass::kProbe;
    }
    if (!hasAction) {
        return DispatchClass::kNoAction;
    }
    if (duration < 0) {
        return DispatchClass::kDisabled;
    }
    if (kind == CommandKind::kSpecialScene) {
        return DispatchClass::kSpecialScene;
    }
    if (kind == CommandKind::kGovernorScene) {
        return DispatchClass::kGovernorScene;
    }
    if (kind == CommandKind::kOnOff) {
        return DispatchClass::kOnOff;
    }
    if (duration == 0) {
        return cmdId == kCmdDefaultSchedLevel ? DispatchClass::kStartupLevels
                                              : DispatchClass::kSchedLevel;
    }
    return DispatchClass::kTimedAction;
}

const char* CommandClass::name(DispatchClass dispatchClass) {
    switch (dispatchClass) {
        case DispatchClass::kMemoryLatency:
            return "memory latency";
        case DispatchClass::kNeverRead:
            return "never read";
        case DispatchClass::kProbe:
            return "probe boost";
        case DispatchClass::kNoAction:
            return "no action";
        case DispatchClass::kDisabled:
            return "disabled";
        case DispatchClass::kSpecialScene:
            return "special scene";
        case DispatchClass::kGovernorScene:
            return "governor scene";
        case DispatchClass::kOnOff:
            return "on/off";
        case DispatchClass::kStartupLevels:
            return "start-up levels";
        case DispatchClass::kSchedLevel:
            return "sched levels";
        case DispatchClass::kTimedAction:
            break;
    }
    return "timed action";
}

std::string CommandClass::effect(DispatchClass dispatchClass, int cmdId, int duration) {
    switch (dispatchClass) {
        case DispatchClass::kMemoryLatency:
            return "payload 0/-1 applies/withdraws the pairs through the platform";
        case DispatchClass::kNeverRead:
            return cmdId == kCmdMemLatencyRatio
                       ? "events take their ratios from the event text, this entry is unused"
                       : "events with this id never read the configuration";
        case DispatchClass::kProbe:
            return "probed threads get the pairs for " + std::to_string(duration) +
                   " ms; a message that does not begin \"pid=<n>\" is answered with 0, as if "
                   "it had worked, and boosts nothing";
        case DispatchClass::kNoAction:
        case DispatchClass::kDisabled:
            return "events do nothing and return 0";
        case DispatchClass::kSpecialScene:
        case DispatchClass::kGovernorScene:
            return "payload 0/-1 switches the scene on/off; the highest priority on is applied";
        case DispatchClass::kOnOff:
            return duration > 0 ? "payload 0/-1 hands the action to the platform"
                                : "payload 0/-1 sets/clears frequency limits as client " +
                                      std::to_string(cmdId);
        case DispatchClass::kStartupLevels:
            return "sent at start-up: records the default group levels";
        case DispatchClass::kSchedLevel:
            return "sets scheduling-group levels";
        case DispatchClass::kTimedAction:
            break;
    }
    std::string text =
        "the platform applies the pairs and reverts them after " + std::to_string(duration) + " ms";
    if (cmdId == kCmdWinSwitch || cmdId == kCmdColdStart) {
        text += "; the launch policy \"";
        text += cmdId == kCmdColdStart ? kColdPolicyName : kWinSwitchPolicyName;
        text += "\" may replace the duration";
    }
    return text;
}

int CommandClass::builtInPriority(int cmdId) {
    for (const auto& scene : kBuiltInScenePriorities) {
        if (scene.cmdId == cmdId) {
            return scene.priority;
        }
    }
    return 0;
}

}  // namespace velmora
