#include "host/vocabulary/ParamVocabulary.h"

#include <cerrno>
#include <climits>
#include <cstdlib>

#include "config/CommandIds.h"
#include "config/CommandKind.h"
#include "config/Tags.h"
#include "platform/VelmoraLog.h"

namespace velmora {

namespace {

struct Term {
    const char* name;
    int tag;
};

const Term kTerms[] = {
    {"little_min", VELMORA_TAG_LITTLE_CPU_MIN_FREQ},
    {"little_max", VELMORA_TAG_LITTLE_CPU_MAX_FREQ},
    {"big_min", VELMORA_TAG_BIG_CPU_MIN_FREQ},
    {"big_max", VELMORA_TAG_BIG_CPU_MAX_FREQ},
    {"gpu_min", VELMORA_TAG_GPU_MIN_FREQ},
    {"gpu_max", VELMORA_TAG_GPU_MAX_FREQ},
    {"ddr_min", kTagDdrMinFreq},
    {"ipa_switch_temp", VELMORA_TAG_IPA_SWITCH_TEMP},
    {"ipa_control_temp", VELMORA_TAG_IPA_CONTROL_TEMP},
    {"ipa_sustainable_power", VELMORA_TAG_IPA_SUSTAINABLE_POWER},
    {"fork_on_big", VELMORA_TAG_FORK_ON_BIG_CLUSTER},
    {"group_hmp", VELMORA_TAG_GROUP_HMP},
    {"group_boost", VELMORA_TAG_GROUP_BOOST},
    {"group_vip", VELMORA_TAG_GROUP_VIP},
    {"group_top_app", VELMORA_TAG_GROUP_TOP_APP},
    {"group_root", VELMORA_TAG_GROUP_ROOT},
    {"group_foreground", VELMORA_TAG_GROUP_FOREGROUND},
    {"group_system_background", VELMORA_TAG_GROUP_SYSTEM_BACKGROUND},
    {"group_key_background", VELMORA_TAG_GROUP_KEY_BACKGROUND},
    {"group_background", VELMORA_TAG_GROUP_BACKGROUND},
    {kScenePriorityKey, kTagScenePriority},
};

struct TextTerm {
    const char* name;
    const char* node;
};

const TextTerm kTextTerms[] = {
    {"little_governor", "cpu.little.governor"}, {"big_governor", "cpu.big.governor"},
    {"gpu_governor", "gpu.governor"},           {"mem_latency_ratio_b", "memlat.ratio_b"},
    {"mem_latency_ratio_l", "memlat.ratio_l"},
};

constexpr const char* kGenericPrefix = "tag_";
constexpr const char* kDuration = "duration";

}  // namespace

bool ParamVocabulary::parseInt(const std::string& text, int* value) {
    const char* begin = text.c_str();
    while (*begin == ' ' || *begin == '\t' || *begin == '\n' || *begin == '\r') {
        ++begin;
    }
    if (*begin == '\0') {
        return false;
    }
    errno = 0;
    char* end = nullptr;
    const long v = strtol(begin, &end, 10);
    while (*end == ' ' || *end == '\t' || *end == '\n' || *end == '\r') {
        ++end;
    }
    if (*end != '\0' || errno == ERANGE || v < INT_MIN || v > INT_MAX) {
        return false;
    }
    *value = static_cast<int>(v);
    return true;
}

int ParamVocabulary::tagForName(const std::string& name) {
    for (const auto& term : kTerms) {
        if (name == term.name) {
            return term.tag;
        }
    }
    const std::string prefix = kGenericPrefix;
    int tag = -1;
    if (name.compare(0, prefix.size(), prefix) == 0 && name.size() > prefix.size() &&
        name[prefix.size()] != '-' && name[prefix.size()] != '+' &&
        parseInt(name.substr(prefix.size()), &tag)) {
        return tag;
    }
    return -1;
}

std::string ParamVocabulary::textNodeForName(const std::string& name) {
    for (const auto& term : kTextTerms) {
        if (name == term.name) {
            return term.node;
        }
    }
    return std::string();
}

std::vector<std::string> ParamVocabulary::names(bool stringPairs) {
    std::vector<std::string> out = {kDuration};
    for (const auto& term : kTerms) {
        out.push_back(term.name);
    }
    if (stringPairs) {
        for (const auto& term : kTextTerms) {
            out.push_back(term.name);
        }
    }
    return out;
}

bool ParamVocabulary::usesStringPairs(int cmdId) {
    return isGovernorSceneId(cmdId) || isMemLatencyId(cmdId);
}

Action* ParamVocabulary::toAction(const RawXmlData& record) {
    auto* action = new Action();
    action->mCmdId = record.cmdId;
    action->mName = record.name;
    action->mDuration = 0;
    const bool stringPairs = usesStringPairs(record.cmdId);
    const size_t count = std::min(record.names.size(), record.values.size());
    for (size_t i = 0; i < count; ++i) {
        const std::string& name = record.names[i];
        const std::string& text = record.values[i];
        int value = 0;
        if (name == kDuration) {
            if (parseInt(text, &value)) {
                action->mDuration = value;
            } else {
                VLOGE("config: cmdId=%d (%s): duration '%s' is not an integer, ignored",
                      record.cmdId, record.name.c_str(), text.c_str());
            }
            continue;
        }
        if (action->mParamNum >= kMaxPairs) {
            VLOGE("config: cmdId=%d (%s): more than %d parameters, <%s> and later ignored",
                  record.cmdId, record.name.c_str(), kMaxPairs, name.c_str());
            break;
        }
        if (stringPairs) {
            if (tagForName(name) < 0 && textNodeForName(name).empty()) {
                VLOGE("config: cmdId=%d (%s): unknown parameter <%s>, ignored", record.cmdId,
                      record.name.c_str(), name.c_str());
                continue;
            }
            action->mParams.push_back(name);
            action->mParams.push_back(text);
            ++action->mParamNum;
            continue;
        }
        const int tag = tagForName(name);
        if (tag < 0) {
            VLOGE("config: cmdId=%d (%s): unknown parameter <%s>, ignored", record.cmdId,
                  record.name.c_str(), name.c_str());
            continue;
        }
        if (!parseInt(text, &value)) {
            VLOGE("config: cmdId=%d (%s): <%s> value '%s' is not an integer, ignored", record.cmdId,
                  record.name.c_str(), name.c_str(), text.c_str());
            continue;
        }
        action->mTagValues.push_back(tag);
        action->mTagValues.push_back(value);
        ++action->mParamNum;
    }
    return action;
}

}  // namespace velmora
