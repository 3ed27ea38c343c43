// Command ids whose meaning is fixed by the server rather than by the configuration, and the
// id ranges that decide how a configured command is dispatched. Shared by the server, the
// scheduling-level manager and the configuration checker, which must agree on them.
#pragma once

namespace velmora {

inline constexpr int kCmdWinSwitch = 4098;
inline constexpr int kCmdColdStart = 4099;
// Launch policies the launch events ask the policy server for.
inline constexpr const char* kWinSwitchPolicyName = "winswitch";
inline constexpr const char* kColdPolicyName = "cold";
// Duration-0 events with their own rules for the ZOLA levels: the first 4114 is remembered,
// 4113 only moves groups still at that remembered level.
inline constexpr int kCmdZolaFollower = 4113;
inline constexpr int kCmdZolaReference = 4114;
inline constexpr int kCmdProbe = 4116;
// The probe worker withdraws a boost this long after applying it (when no off event came first),
// and caps the duration of the probe action it starts with (a reloaded action is used as
// configured).
inline constexpr int kProbeBoostLifetimeMs = 256;
inline constexpr int kProbeDurationCapMs = 100;
// Start-up command carrying the default scheduling-group levels.
inline constexpr int kCmdDefaultSchedLevel = 5376;

inline constexpr int kSpecialSceneFirst = 4118;
inline constexpr int kSpecialSceneLast = 4352;
// A governor scene may be applied on its own while this scene is current.
inline constexpr int kGovHostScene = 4119;
inline constexpr int kGovSceneFirst = 4224;
// Configured scene priorities are read up to here; scene 4352 keeps whatever a lookup gave it.
inline constexpr int kScenePriorityReadLast = 4351;

// Priorities every server starts with; a valid configured priority replaces them.
struct BuiltInScenePriority {
    int cmdId;
    int priority;
};
inline constexpr BuiltInScenePriority kBuiltInScenePriorities[] = {
    {4118, 100},
    {kGovHostScene, 200},
    {4120, 20},
    {4121, 70},
};

inline constexpr int kOnOffFirst = 12288;
inline constexpr int kOnOffLast = 13568;

// Ids from here up are handled before any parse; the others are ignored.
inline constexpr int kCmdClientRestart = 20224;
inline constexpr int kCmdNotification = 20225;
inline constexpr int kCmdReload = 20230;
inline constexpr int kCmdMemLatencyRatio = 20480;
inline constexpr int kCmdMemLatency = 20481;

}  // namespace velmora
