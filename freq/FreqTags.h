// What the frequency-client manager, its callers and the statistics reporter share beyond the
// tags themselves (config/Tags.h).
#pragma once

#include <cstdint>

#include "config/Tags.h"

// Bit of the feature-switch word (tag 10000, client id 0) that turns on statistics upload.
constexpr int32_t FREQ_INFO_UPLOAD_BIT = 0x10000;
// Most (tag, value) pairs one event request may carry; the server builds its arrays this size.
constexpr int MAX_EVENT_TAGS = velmora::kMaxEventPairs;

// Client ids of doPerfSetConfig. Ids of 4 and above are events (command ids).
constexpr int VELMORA_CLIENT_FEATURE_SWITCH = 0;
constexpr int VELMORA_CLIENT_KX = 1;
constexpr int VELMORA_CLIENT_JN = 2;
constexpr int VELMORA_CLIENT_ZOLA = 3;
