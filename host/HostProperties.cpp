#include "host/HostProperties.h"

#include <sys/stat.h>

#include <cstdio>
#include <cstring>

#include "host/HostEnvironment.h"
#include "platform/PlatformImports.h"
#include "platform/VelmoraLog.h"

namespace velmora {

namespace {
// Size of the buffer get_one_cfg_file writes to.
constexpr size_t kCfgPathSize = 128;
}  // namespace

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

extern "C" int property_get(const char* key, char* value, const char* defaultValue) {
    if (value == nullptr) {
        return 0;
    }
    std::string answer;
    if (key == nullptr || !velmora::HostEnvironment::get().properties().get(key, &answer)) {
        answer = defaultValue != nullptr ? defaultValue : "";
    }
    snprintf(value, VELMORA_PROPERTY_VALUE_MAX, "%s", answer.c_str());
    return static_cast<int>(strlen(value));
}

extern "C" char* get_one_cfg_file(const char* pathSuffix, int type, char* buf) {
    (void)type;  // one kind of customisation file on the host
    if (pathSuffix == nullptr || buf == nullptr) {
        return nullptr;
    }
    const std::string path =
        velmora::HostEnvironment::get().properties().findConfigFile(pathSuffix);
    if (path.empty()) {
        return nullptr;
    }
    if (path.size() >= velmora::kCfgPathSize) {
        VLOGE("host: configuration path too long for the lookup buffer: %s", path.c_str());
        return nullptr;
    }
    snprintf(buf, velmora::kCfgPathSize, "%s", path.c_str());
    return buf;
}
