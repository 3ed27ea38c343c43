#include "host/NodeMap.h"

#include <fstream>
#include <sstream>

namespace velmora {

namespace {

constexpr const char* kCpuFreq = "sys/devices/system/cpu/cpufreq/";
constexpr const char* kGpuFreq = "sys/class/devfreq/gpufreq/";
constexpr const char* kDdrFreq = "sys/class/devfreq/ddrfreq/";
constexpr const char* kThermal = "sys/class/thermal/thermal_zone0/";
constexpr const char* kStune = "dev/stune/";

struct GroupNode {
    int tag;
    const char* key;
    const char* dir;  // schedtune directory; "" is the root group
};

// Tags 51..58 are the EAS groups; tag 50, the single hmp group, is a kernel tunable.
const GroupNode kGroups[] = {
    {51, "sched.group.boost", "boost/"},
    {52, "sched.group.vip", "vip/"},
    {53, "sched.group.top_app", "top-app/"},
    {54, "sched.group.root", ""},
    {55, "sched.group.foreground", "foreground/"},
    {56, "sched.group.system_background", "system-background/"},
    {57, "sched.group.key_background", "key-background/"},
    {58, "sched.group.background", "background/"},
};

}  // namespace

NodeMap::NodeMap() {
    const std::string cpu = kCpuFreq;
    // Frequencies in kHz for the CPU clusters (cpufreq) and in Hz for the GPU and DDR (devfreq).
    add("cpu.little.min", cpu + "policy0/scaling_min_freq", NodeKind::Floor, "300000");
    add("cpu.little.max", cpu + "policy0/scaling_max_freq", NodeKind::Cap, "1804800");
    add("cpu.little.top", cpu + "policy0/cpuinfo_max_freq", NodeKind::Value, "1804800");
    add("cpu.little.governor", cpu + "policy0/scaling_governor", NodeKind::Text, "schedutil");
    add("cpu.big.min", cpu + "policy4/scaling_min_freq", NodeKind::Floor, "710400");
    add("cpu.big.max", cpu + "policy4/scaling_max_freq", NodeKind::Cap, "2841600");
    add("cpu.big.top", cpu + "policy4/cpuinfo_max_freq", NodeKind::Value, "2841600");
    add("cpu.big.governor", cpu + "policy4/scaling_governor", NodeKind::Text, "schedutil");
    add("gpu.min", std::string(kGpuFreq) + "min_freq", NodeKind::Floor, "257000000");
    add("gpu.max", std::string(kGpuFreq) + "max_freq", NodeKind::Cap, "900000000");
    add("gpu.top", std::string(kGpuFreq) + "max_freq_limit", NodeKind::Value, "900000000");
    add("gpu.governor", std::string(kGpuFreq) + "governor", NodeKind::Text, "simple_ondemand");
    add("ddr.min", std::string(kDdrFreq) + "min_freq", NodeKind::Floor, "200000000");
    // IPA: trip point 0 switches the governor on, trip point 1 is the control temperature.
    add("ipa.switch_temp", std::string(kThermal) + "trip_point_0_temp", NodeKind::Value, "65000");
    add("ipa.control_temp", std::string(kThermal) + "trip_point_1_temp", NodeKind::Value, "85000");
    add("ipa.sustainable_power", std::string(kThermal) + "sustainable_power", NodeKind::Value,
        "3500");
    add("sched.fork_on_big", "proc/sys/kernel/sched_fork_on_big_cluster", NodeKind::Value, "0");
    add("sched.group.hmp", "proc/sys/kernel/sched_hmp_boost", NodeKind::Value, "0");
    for (const auto& group : kGroups) {
        add(group.key, std::string(kStune) + group.dir + "schedtune.boost", NodeKind::Value, "0");
        mTagKeys[group.tag] = group.key;
    }
    // Per-thread probe boosts: the boosted threads go into the probe group's task list.
    add("probe.tid", std::string(kStune) + "probe/tasks", NodeKind::Value, "0");
    add("probe.threads", std::string(kStune) + "probe/boosted_count", NodeKind::Value, "0");
    add("memlat.ratio_b", "sys/class/devfreq/memlat-big/ratio", NodeKind::Value, "1");
    add("memlat.ratio_l", "sys/class/devfreq/memlat-little/ratio", NodeKind::Value, "1");

    mTagKeys[1] = "cpu.little.min";
    mTagKeys[2] = "cpu.little.max";
    mTagKeys[4] = "cpu.big.min";
    mTagKeys[5] = "cpu.big.max";
    mTagKeys[7] = "gpu.min";
    mTagKeys[8] = "gpu.max";
    mTagKeys[10] = "ddr.min";
    mTagKeys[17] = "ipa.switch_temp";
    mTagKeys[18] = "ipa.control_temp";
    mTagKeys[19] = "ipa.sustainable_power";
    mTagKeys[20] = "sched.fork_on_big";
    mTagKeys[22] = "cpu.little.top";
    mTagKeys[24] = "cpu.big.top";
    mTagKeys[26] = "gpu.top";
    mTagKeys[50] = "sched.group.hmp";
}

void NodeMap::add(const std::string& key, const std::string& path, NodeKind kind,
                  const std::string& seed) {
    mNodes.push_back({key, path, kind, seed});
}

const NodeSpec* NodeMap::find(const std::string& key) const {
    for (const auto& node : mNodes) {
        if (node.key == key) {
            return &node;
        }
    }
    return nullptr;
}

std::string NodeMap::keyForTag(int tag) const {
    auto it = mTagKeys.find(tag);
    return it == mTagKeys.end() ? std::string() : it->second;
}

int NodeMap::parse(const std::string& text, const std::string& origin, std::string* error) {
    std::istringstream in(text);
    std::string line;
    int lineNo = 0;
    while (std::getline(in, line)) {
        ++lineNo;
        const size_t hash = line.find('#');
        if (hash != std::string::npos) {
            line.erase(hash);
        }
        std::istringstream words(line);
        std::string key, path, seed, extra;
        if (!(words >> key)) {
            continue;
        }
        const std::string where = origin + ":" + std::to_string(lineNo) + ": ";
        if (!(words >> path)) {
            if (error != nullptr)
                *error = where + "missing path for node '" + key + "'";
            return -1;
        }
        words >> seed;
        if (words >> extra) {
            if (error != nullptr)
                *error = where + "unexpected text '" + extra + "'";
            return -1;
        }
        if (!path.empty() && path[0] == '/') {
            path.erase(0, path.find_first_not_of('/'));
        }
        if (path.empty() || path.find("..") != std::string::npos) {
            if (error != nullptr)
                *error = where + "bad path for node '" + key + "'";
            return -1;
        }
        auto it = mNodes.begin();
        while (it != mNodes.end() && it->key != key) {
            ++it;
        }
        if (it == mNodes.end()) {
            if (error != nullptr)
                *error = where + "unknown node '" + key + "'";
            return -1;
        }
        it->path = path;
        if (!seed.empty()) {
            it->seed = seed;
        }
    }
    return 0;
}

int NodeMap::load(const std::string& path, std::string* error) {
    std::ifstream file(path);
    if (!file) {
        if (error != nullptr)
            *error = path + ": cannot open node map";
        return -1;
    }
    std::stringstream content;
    content << file.rdbuf();
    return parse(content.str(), path, error);
}

}  // namespace velmora
