// A device profile: one device's nodes (path, kind, seed value) and what each accepts (the
// available frequencies of its cpufreq and devfreq domains, its governors, thermal ranges, the
// level range of the scheduler groups), read from a small XML file:
//
//     <device name="example">
//         <frequencies id="cpu.little" unit="kHz">300000 ... 1804800</frequencies>
//         <governors id="cpu">schedutil performance powersave</governors>
//         <levels min="-20" max="40"/>
//         <energy id="cpu.little" cpus="4"><opp freq="300000" mw="6"/> ...</energy>
//         <node key="cpu.little.min" kind="floor" allowed="frequencies:cpu.little"
//               seed="300000" path="sys/devices/system/cpu/cpufreq/policy0/scaling_min_freq"/>
//     </device>
//
// The example device's profile (examples/device/example-device.xml) is compiled in and is the
// default of the host layer and of velmora-lint. Format: docs/device-profile.md.
// Not thread safe: load it before anything reads it, then only read it.
#pragma once

#include <string>
#include <vector>

#include "host/device/NodeKind.h"
#include "host/device/profile/EnergyTable.h"

namespace velmora {

class DeviceProfile {
public:
    // Where the built-in profile comes from, as its diagnostics name it.
    static constexpr const char* kBuiltInOrigin = "examples/device/example-device.xml";

    // The example device's profile.
    static const DeviceProfile& builtIn();

    // Reads a whole profile from `text`; `origin` names the source in `error` ("file:line:
    // message"). Returns 0, or -1 at the first problem (the profile is then left empty).
    int parse(const std::string& text, const std::string& origin, std::string* error);
    // parse() on the contents of the file at `path`.
    int load(const std::string& path, std::string* error);

    const std::string& name() const { return mName; }
    const std::string& origin() const { return mOrigin; }
    const std::vector<NodeSpec>& nodes() const { return mNodes; }
    // Null when `key` is not a node of the device.
    const NodeSpec* find(const std::string& key) const;
    // The ids of the <frequencies> tables (the cpufreq and devfreq domains), in profile order.
    const std::vector<std::string>& frequencyDomains() const { return mDomains; }
    // The energy tables, in profile order; a domain need not have one.
    const std::vector<EnergyTable>& energyTables() const { return mEnergy; }
    // Null when domain `id` has no energy table.
    const EnergyTable* energyTable(const std::string& id) const;
    long long lowestLevel() const { return mLevelMin; }
    long long highestLevel() const { return mLevelMax; }

private:
    std::string mName;
    std::string mOrigin;
    std::vector<NodeSpec> mNodes;
    std::vector<std::string> mDomains;
    std::vector<EnergyTable> mEnergy;
    long long mLevelMin = 0;
    long long mLevelMax = 0;
};

}  // namespace velmora
