#include "host/platform/HostProperties.h"

#include <sys/stat.h>

#include <cstdio>
#include <cstring>

#include "platform/VelmoraLog.h"

namespace velmora {

HostProperties::HostProperties() {
    reset();
}

void HostProperties::reset() {
    std::lock_guard<std::mutex> lock(mLock);
    mProperties.clear();
    mProperties["ro.build.version.incremental"] = "host";
    mConfigDirs = {"/odm/etc", "/vendor/etc", "/system/etc"};
}

void HostProperties::set(const std::string& key, const std::string& value) {
    std::lock_guard<std::mutex> lock(mLock);
    mProperties[key] = value;
}

void HostProperties::unset(const std::string& key) {
    std::lock_guard<std::mutex> lock(mLock);
    mProperties.erase(key);
}

bool HostProperties::get(const std::string& key, std::string* value) const {
    std::lock_guard<std::mutex> lock(mLock);
    auto it = mProperties.find(key);
    if (it == mProperties.end()) {
        return false;
    }
    *value = it->second;
    return true;
}

void HostProperties::setConfigDirs(const std::vector<std::string>& dirs) {
    std::lock_guard<std::mutex> lock(mLock);
    mConfigDirs = dirs;
}

std::vector<std::string> HostProperties::configDirs() const {
    std::lock_guard<std::mutex> lock(mLock);
    return mConfigDirs;
}

std::string HostProperties::findConfigFile(const std::string& suffix) const {
    for (const auto& dir : configDirs()) {
        const std::string path =
            dir.empty() || dir.back() == '/' ? dir + suffix : dir + "/" + suffix;
        struct stat st;
        if (stat(path.c_str(), &st) == 0 && S_ISREG(st.st_mode)) {
            return path;
        }
    }
    return std::string();
}

}  // namespace velmora
