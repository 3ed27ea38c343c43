// The device profile loader over arbitrary XML text from memory (DeviceProfile::parse, what
// --device and the host layer read), then what the simulated device does with the profile: the
// node map built from it and the kernel's judgement of each node's seed and of values around
// its bounds. A rounded value must be one of the node's steps, an accepted one within its rule.
#include <cstdint>
#include <string>

#include "host/device/NodeMap.h"
#include "host/device/profile/DeviceProfile.h"
#include "host/device/profile/KernelRules.h"

namespace {

bool isStep(const velmora::ValueRule& rule, const std::string& value) {
    for (long long step : rule.steps) {
        if (std::to_string(step) == value) {
            return true;
        }
    }
    return false;
}

void judge(const velmora::NodeSpec& node, const std::string& value) {
    using velmora::KernelRules;
    const KernelRules::Outcome out = KernelRules::take(node, value);
    switch (out.verdict) {
        case KernelRules::Verdict::kRefused:
            if (out.reason.empty() || !out.effective.empty()) {
                __builtin_trap();
            }
            break;
        case KernelRules::Verdict::kRounded:
            if (node.rule.type != velmora::ValueRule::Type::kSteps ||
                !isStep(node.rule, out.effective)) {
                __builtin_trap();
            }
            break;
        case KernelRules::Verdict::kAccepted:
            if (out.effective != value) {
                __builtin_trap();
            }
            break;
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const std::string text(reinterpret_cast<const char*>(data), size);
    velmora::DeviceProfile profile;
    std::string error;
    if (profile.parse(text, "fuzz.xml", &error) != 0) {
        // A refused profile keeps no node and says where: "fuzz.xml:LINE: ...".
        if (!profile.nodes().empty() || error.compare(0, 9, "fuzz.xml:") != 0) {
            __builtin_trap();
        }
        return 0;
    }
    if (profile.nodes().empty() || profile.lowestLevel() > profile.highestLevel()) {
        __builtin_trap();
    }
    // Every energy table belongs to a domain and lists its OPPs by increasing frequency, with a
    // power that is not negative and does not fall.
    for (const velmora::EnergyTable& table : profile.energyTables()) {
        bool known = false;
        for (const auto& id : profile.frequencyDomains())
            known = known || id == table.id;
        if (!known || table.cpus < 1 || table.opps.empty() || table.opps[0].mw < 0) {
            __builtin_trap();
        }
        for (size_t i = 1; i < table.opps.size(); ++i) {
            if (table.opps[i].freq <= table.opps[i - 1].freq ||
                table.opps[i].mw < table.opps[i - 1].mw) {
                __builtin_trap();
            }
        }
    }
    const velmora::NodeMap map(profile);
    for (const velmora::NodeSpec& node : map.nodes()) {
        if (profile.find(node.key) == nullptr) {
            __builtin_trap();
        }
        const velmora::ValueRule& rule = node.rule;
        judge(node, node.seed);
        judge(node, std::to_string(rule.min));
        judge(node, std::to_string(rule.max));
        long long v = 0;
        if (!__builtin_sub_overflow(rule.min, 1, &v)) {
            judge(node, std::to_string(v));
        }
        if (!__builtin_add_overflow(rule.max, 1, &v)) {
            judge(node, std::to_string(v));
        }
        judge(node, std::to_string(rule.min / 2 + rule.max / 2));
    }
    return 0;
}
