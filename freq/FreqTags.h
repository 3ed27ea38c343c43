// Tag vocabulary shared by the frequency-client manager, its callers and the statistics
// reporter. The values are the platform's tag ids; they travel in (tag, value) arrays.
#pragma once

#include <cstdint>

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

// Bit of the feature-switch word (tag 10000, client id 0) that turns on statistics upload.
constexpr int32_t FREQ_INFO_UPLOAD_BIT = 0x10000;
// Most (tag, value) pairs one event request may carry; the server builds its arrays this size.
constexpr int MAX_EVENT_TAGS = 43;

// Client ids of doPerfSetConfig. Ids of 4 and above are events (command ids).
constexpr int VELMORA_CLIENT_FEATURE_SWITCH = 0;
constexpr int VELMORA_CLIENT_KX = 1;
constexpr int VELMORA_CLIENT_JN = 2;
constexpr int VELMORA_CLIENT_ZOLA = 3;
