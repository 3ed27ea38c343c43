#include "trace/ServerTrace.h"

#include <cstdio>

#include "config/Tags.h"

namespace velmora {

namespace {

// Room for the longest name below with its prefix.
constexpr size_t kMaxTrackName = 64;

struct TrackName {
    int id;
    const char* name;
};

constexpr TrackName kFreqNames[] = {
    {VELMORA_TAG_LITTLE_CPU_MIN_FREQ, "little_cpu_min"},
    {VELMORA_TAG_LITTLE_CPU_MAX_FREQ, "little_cpu_max"},
    {VELMORA_TAG_BIG_CPU_MIN_FREQ, "big_cpu_min"},
    {VELMORA_TAG_BIG_CPU_MAX_FREQ, "big_cpu_max"},
    {VELMORA_TAG_GPU_MIN_FREQ, "gpu_min"},
    {VELMORA_TAG_GPU_MAX_FREQ, "gpu_max"},
    {VELMORA_TAG_IPA_SWITCH_TEMP, "ipa_switch_temp"},
    {VELMORA_TAG_IPA_CONTROL_TEMP, "ipa_control_temp"},
    {VELMORA_TAG_IPA_SUSTAINABLE_POWER, "ipa_sustainable_power"},
    {VELMORA_TAG_FORK_ON_BIG_CLUSTER, "fork_on_big_cluster"},
};

constexpr TrackName kGroupNames[] = {
    {VELMORA_TAG_GROUP_HMP, "hmp"},
    {VELMORA_TAG_GROUP_BOOST, "boost"},
    {VELMORA_TAG_GROUP_VIP, "vip"},
    {VELMORA_TAG_GROUP_TOP_APP, "top_app"},
    {VELMORA_TAG_GROUP_ROOT, "root"},
    {VELMORA_TAG_GROUP_FOREGROUND, "foreground"},
    {VELMORA_TAG_GROUP_SYSTEM_BACKGROUND, "system_background"},
    {VELMORA_TAG_GROUP_KEY_BACKGROUND, "key_background"},
    {VELMORA_TAG_GROUP_BACKGROUND, "background"},
};

template <size_t N>
const char* trackName(const TrackName (&names)[N], const char* prefix, const char* unnamed, int id,
                      char* buf, size_t size) {
    for (const TrackName& entry : names) {
        if (entry.id == id) {
            snprintf(buf, size, "%s%s", prefix, entry.name);
            return buf;
        }
    }
    snprintf(buf, size, "%s%s%d", prefix, unnamed, id);
    return buf;
}

}  // namespace

const char* ServerTrace::freqTrack(int tag, char* buf, size_t size) {
    return trackName(kFreqNames, "velmora.freq.", "tag", tag, buf, size);
}

const char* ServerTrace::schedTrack(int group, char* buf, size_t size) {
    return trackName(kGroupNames, "velmora.sched.", "group", group, buf, size);
}

void ServerTrace::traceFreqLimits(int count, const int* tags, const int* values) {
    char name[kMaxTrackName];
    for (int i = 0; i < count; ++i) {
        Trace::counter(freqTrack(tags[i], name, sizeof(name)), values[i]);
    }
}

void ServerTrace::traceSchedLevels(int count, const int* groups, const int* levels) {
    char name[kMaxTrackName];
    for (int i = 0; i < count; ++i) {
        Trace::counter(schedTrack(groups[i], name, sizeof(name)), levels[i]);
    }
}

}  // namespace velmora
