// The node map: which file under the device root stands for which logical node, how requests
// for the node combine, which values the node accepts and which value a fresh simulated device
// starts with.
//
// Built from the device profile (DeviceProfile: the example device's profile unless the host
// program loads another one); a small text file can override paths and seed values:
//
//     # key                 path (relative to the device root)                  [seed]
//     cpu.big.max           sys/devices/system/cpu/cpufreq/policy6/scaling_max_freq
//
// Also maps the integer tags of actions and requests to nodes. Not thread safe: configure it
// before the platform is created, then only read it.
#pragma once

#include <map>
#include <string>
#include <unordered_map>
#include <vector>

#include "host/device/NodeKind.h"

namespace velmora {

class DeviceProfile;

class NodeMap {
public:
    NodeMap();  // the nodes of the built-in (example) device profile
    explicit NodeMap(const DeviceProfile& profile);

    // Takes the nodes of `profile`, dropping any override applied so far.
    void useProfile(const DeviceProfile& profile);

    const std::vector<NodeSpec>& nodes() const { return mNodes; }
    // Null when `key` is not a node.
    const NodeSpec* find(const std::string& key) const;
    // Node of an integer tag (1 little min ... 58 background group), or "" when the tag has none.
    const std::string& keyForTag(int tag) const;

    // Applies override lines from `text`; `origin` names the source in `error` ("file:line:
    // message"). Returns 0, or -1 at the first bad line (earlier lines stay applied).
    int parse(const std::string& text, const std::string& origin, std::string* error);
    // parse() on the contents of the file at `path`.
    int load(const std::string& path, std::string* error);

private:
    void initTagKeys();

    std::vector<NodeSpec> mNodes;
    std::unordered_map<std::string, size_t> mIndex;  // key -> position in mNodes
    std::map<int, std::string> mTagKeys;
};

}  // namespace velmora
