// System properties and customisation-file lookup of the host: what property_get and
// get_one_cfg_file answer.
//
// Properties start with ro.build.version.incremental = "host"; the configuration directories
// start as /odm/etc, /vendor/etc, /system/etc (the device's search order) and a host program
// usually replaces them with its own. Thread safe.
#pragma once

#include <map>
#include <mutex>
#include <string>
#include <vector>

namespace velmora {

class HostProperties {
public:
    HostProperties();
    // Back to the defaults above.
    void reset();

    void set(const std::string& key, const std::string& value);
    void unset(const std::string& key);
    // False when `key` is not set.
    bool get(const std::string& key, std::string* value) const;

    void setConfigDirs(const std::vector<std::string>& dirs);
    std::vector<std::string> configDirs() const;
    // Path of the first configuration directory's `suffix` that exists as a regular file,
    // or "" when none does.
    std::string findConfigFile(const std::string& suffix) const;

private:
    mutable std::mutex mLock;  // guards both members
    std::map<std::string, std::string> mProperties;
    std::vector<std::string> mConfigDirs;
};

}  // namespace velmora
