// Shared pieces of the scheduler-group tests: building duration-0 actions, packing client
// values and spelling out the expected dump text.
#pragma once

#include <map>
#include <string>
#include <vector>

#include "config/Action.h"

namespace velmora {
namespace fake {

// A duration-0 action carrying `pairs` (tag, level, tag, level, ...).
inline Action schedEvent(int cmdId, const std::vector<int>& pairs) {
    Action action;
    action.mCmdId = cmdId;
    action.mDuration = 0;
    action.mTagValues = pairs;
    action.mParamNum = static_cast<int>(pairs.size() / 2);
    return action;
}

// Pairs for the eight EAS groups 51..58, all at `level`.
inline std::vector<int> easPairs(int level) {
    std::vector<int> pairs;
    for (int tag = 51; tag <= 58; ++tag) {
        pairs.push_back(tag);
        pairs.push_back(level);
    }
    return pairs;
}

// Client value of tag 42: group index in the upper half, level + 20 in the lower half.
inline int packLevel(int groupIndex, int level) {
    return groupIndex * 65536 + level + 20;
}

// Expected dump block of an EAS-mode table; `levels` holds tags 51..58, missing ones are 0.
inline std::string easBlock(const std::string& heading, std::map<int, int> levels) {
    return heading + "group=boost,             value=" + std::to_string(levels[51]) + "\n" +
           "group=vip,               value=" + std::to_string(levels[52]) + "\n" +
           "group=top-app,           value=" + std::to_string(levels[53]) + "\n" +
           "group=root,              value=" + std::to_string(levels[54]) + "\n" +
           "group=foreground,        value=" + std::to_string(levels[55]) + "\n" +
           "group=key-background,    value=" + std::to_string(levels[57]) + "\n" +
           "group=system-background, value=" + std::to_string(levels[56]) + "\n" +
           "group=background,        value=" + std::to_string(levels[58]) + "\n";
}

// Every level of the eight EAS groups set to `level`, with `overrides` on top.
inline std::map<int, int> easLevels(int level, const std::map<int, int>& overrides = {}) {
    std::map<int, int> levels;
    for (int tag = 51; tag <= 58; ++tag) {
        levels[tag] = level;
    }
    for (const auto& entry : overrides) {
        levels[entry.first] = entry.second;
    }
    return levels;
}

// The five blocks of the dump, in order.
inline std::string easDump(const std::map<int, int>& defaults, const std::map<int, int>& current,
                           const std::map<int, int>& kx, const std::map<int, int>& jn,
                           const std::map<int, int>& zola) {
    return easBlock("default eas group value is:\n", defaults) +
           easBlock("current eas group value is:\n", current) +
           easBlock("KX set eas group value is:\n", kx) +
           easBlock("JN set eas group value is:\n", jn) +
           easBlock("ZOLA set eas group value is:\n", zola);
}

}  // namespace fake
}  // namespace velmora
