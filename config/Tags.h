// The tag vocabulary: the integer tags that travel in (tag, value) pairs of actions, client
// requests and platform calls. The values are the platform's tag ids, so the server, the host
// layer and the configuration checker take them from here and nowhere else.
#pragma once

#include <cstdint>

// Frequency and thermal tags (frequency-client manager, statistics reporter, platform).
enum : int32_t {
    VELMORA_TAG_LITTLE_CPU_MIN_FREQ = 1,
    VELMORA_TAG_LITTLE_CPU_MAX_FREQ = 2,
    VELMORA_TAG_BIG_CPU_MIN_FREQ = 4,
    VELMORA_TAG_BIG_CPU_MAX_FREQ = 5,
    VELMORA_TAG_GPU_MIN_FREQ = 7,
    VELMORA_TAG_GPU_MAX_FREQ = 8,
    VELMORA_TAG_IPA_SWITCH_TEMP = 17,
    VELMORA_TAG_IPA_CONTROL_TEMP = 18,
    VELMORA_TAG_IPA_SUSTAINABLE_POWER = 19,
    VELMORA_TAG_FORK_ON_BIG_CLUSTER = 20,
    VELMORA_TAG_LITTLE_CPU_TOP_FREQ = 22,
    VELMORA_TAG_BIG_CPU_TOP_FREQ = 24,
    VELMORA_TAG_GPU_TOP_FREQ = 26,
    VELMORA_TAG_FEATURE_SWITCH = 10000,
};

// Scheduler-group tags: group index + 50. 50 is the single hmp group, 51..58 the EAS groups.
constexpr int VELMORA_TAG_GROUP_HMP = 50;
constexpr int VELMORA_TAG_GROUP_BOOST = 51;
constexpr int VELMORA_TAG_GROUP_VIP = 52;
constexpr int VELMORA_TAG_GROUP_TOP_APP = 53;
constexpr int VELMORA_TAG_GROUP_ROOT = 54;
constexpr int VELMORA_TAG_GROUP_FOREGROUND = 55;
constexpr int VELMORA_TAG_GROUP_SYSTEM_BACKGROUND = 56;
constexpr int VELMORA_TAG_GROUP_KEY_BACKGROUND = 57;
constexpr int VELMORA_TAG_GROUP_BACKGROUND = 58;

// Client request tags. Step config: 0 back to defaults, 1 one step down, 2 one step up.
// Set config: group index in bits 31..16, level + 20 in bits 15..0.
constexpr int VELMORA_TAG_SCHED_LEVEL_STEP = 40;
constexpr int VELMORA_TAG_SET_SCHED_LEVEL = 42;

// Event level of a group that no duration-0 event has named yet.
constexpr int ZOLA_SCHED_LEVEL_NONE = -100;

namespace velmora {

// Most (tag, value) pairs one action or event request may carry: the loader's conversion stops
// there, and the server and the frequency manager size their arrays by it.
inline constexpr int kMaxEventPairs = 43;

// DDR floor: on/off actions may carry it, the server leaves it to the platform.
inline constexpr int kTagDdrMinFreq = 10;
// A special scene's priority in its integer pairs (governor scenes use the "priority" string).
inline constexpr int kTagScenePriority = 101;
inline constexpr const char* kScenePriorityKey = "priority";
inline constexpr int kScenePriorityMin = 1;
inline constexpr int kScenePriorityMax = 500;

// The level scale of the scheduler groups, lowest to highest, in steps of kSchedLevelStep.
inline constexpr int kSchedLevelLowest = -20;
inline constexpr int kSchedLevelHighest = 40;
inline constexpr int kSchedLevelStep = 10;
inline constexpr int kEasGroupCount = 8;

inline constexpr bool isGroupTag(int tag) {
    return tag >= VELMORA_TAG_GROUP_HMP && tag <= VELMORA_TAG_GROUP_BACKGROUND;
}
inline constexpr bool isFreqFloorTag(int tag) {
    return tag == VELMORA_TAG_LITTLE_CPU_MIN_FREQ || tag == VELMORA_TAG_BIG_CPU_MIN_FREQ ||
           tag == VELMORA_TAG_GPU_MIN_FREQ;
}
inline constexpr bool isFreqCapTag(int tag) {
    return tag == VELMORA_TAG_LITTLE_CPU_MAX_FREQ || tag == VELMORA_TAG_BIG_CPU_MAX_FREQ ||
           tag == VELMORA_TAG_GPU_MAX_FREQ;
}
inline constexpr bool isTopFreqTag(int tag) {
    return tag == VELMORA_TAG_LITTLE_CPU_TOP_FREQ || tag == VELMORA_TAG_BIG_CPU_TOP_FREQ ||
           tag == VELMORA_TAG_GPU_TOP_FREQ;
}

}  // namespace velmora
