// What a command id is, before its configured action is looked at: the one classification of
// ids that the server's event dispatch, the host layer, the replay analysis and the
// configuration checker share, so that a range changed in CommandIds.h changes all of them.
//
// The ranges do not overlap, so the order of the tests below is not a priority order. Within
// kConfigured the duration of the parsed action decides (negative: nothing, 0: scheduling-group
// levels, positive: a timed platform action); that is left to each caller, which alone has the
// action.
#pragma once

#include "config/CommandIds.h"

namespace velmora {

enum class CommandKind {
    kMemoryLatency,  // 20480 (ratios in the event text), 20481 (pairs through the platform)
    kReload,         // 20230: the configuration is read again
    kNotification,   // 20225: the feature-switch word
    kClientRestart,  // 20224: every special scene switched off
    kIgnored,        // the other ids from 20224 up: never parsed, nothing done
    kProbe,          // 4116: a boost of the thread named in the event text
    kSpecialScene,   // 4118..4223
    kGovernorScene,  // 4224..4352
    kOnOff,          // 12288..13568
    kConfigured,     // any other id: the parsed action's duration decides
};

inline constexpr bool isSceneId(int cmdId) {
    return cmdId >= kSpecialSceneFirst && cmdId <= kSpecialSceneLast;
}
inline constexpr bool isGovernorSceneId(int cmdId) {
    return cmdId >= kGovSceneFirst && cmdId <= kSpecialSceneLast;
}
inline constexpr bool isOnOffId(int cmdId) {
    return cmdId >= kOnOffFirst && cmdId <= kOnOffLast;
}
inline constexpr bool isMemLatencyId(int cmdId) {
    return cmdId == kCmdMemLatencyRatio || cmdId == kCmdMemLatency;
}

inline constexpr CommandKind classify(int cmdId) {
    if (isMemLatencyId(cmdId)) {
        return CommandKind::kMemoryLatency;
    }
    if (cmdId >= kCmdClientRestart) {
        switch (cmdId) {
            case kCmdReload:
                return CommandKind::kReload;
            case kCmdNotification:
                return CommandKind::kNotification;
            case kCmdClientRestart:
                return CommandKind::kClientRestart;
            default:
                return CommandKind::kIgnored;
        }
    }
    if (cmdId == kCmdProbe) {
        return CommandKind::kProbe;
    }
    if (isSceneId(cmdId)) {
        return isGovernorSceneId(cmdId) ? CommandKind::kGovernorScene : CommandKind::kSpecialScene;
    }
    if (isOnOffId(cmdId)) {
        return CommandKind::kOnOff;
    }
    return CommandKind::kConfigured;
}

}  // namespace velmora
