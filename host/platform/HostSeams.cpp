// Every symbol libvelmora.so imports from the device's closed components, defined here for the
// host: the platform object, the XML loader, the launch-policy server, system properties, the
// customisation-file lookup, the device event log and the probe worker's clock. Each answers
// from the process-wide HostEnvironment, which is the only place that builds the host's parts.
#include <cstdarg>
#include <cstdio>
#include <cstring>

#include "config/VelmoraParser.h"
#include "host/platform/HostEnvironment.h"
#include "host/platform/HostPlatform.h"
#include "host/time/HostProbeClock.h"
#include "host/vocabulary/HostLoadXml.h"
#include "platform/OnDemandBoostServer.h"
#include "platform/PlatformImports.h"
#include "platform/VelmoraLog.h"

namespace {

// Size of the buffer get_one_cfg_file writes to.
constexpr size_t kCfgPathSize = 128;
// Longest device event log line; longer ones are cut.
constexpr size_t kMaxLogLine = 1024;

}  // namespace

// VelmoraPlat belongs to the platform layer: libvelmora.so only declares it, so each platform
// layer defines its members. The destructor deletes the parser that init stored in mParserPtr.
VelmoraPlat::~VelmoraPlat() {
    delete mParserPtr;
    mParserPtr = nullptr;
}

int VelmoraPlat::initialize() {
    return 0;
}

VelmoraPlat* getPlat() {
    return new velmora::HostPlatform();
}

VelmoraLoadXml* createVelmoraLoadXml() {
    return new velmora::HostLoadXml();
}

OnDemandBoostServer* OnDemandBoostServer::getInstance() {
    static OnDemandBoostServer instance;
    return &instance;
}

int OnDemandBoostServer::getPolicy(const char* name) {
    return velmora::HostEnvironment::get().launchPolicies().get(name != nullptr ? name : "");
}

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
    if (path.size() >= kCfgPathSize) {
        VLOGE("host: configuration path too long for the lookup buffer: %s", path.c_str());
        return nullptr;
    }
    snprintf(buf, kCfgPathSize, "%s", path.c_str());
    return buf;
}

extern "C" int __zklog_jank_print(int prio, int tag, const char* fmt, ...) {
    if (fmt == nullptr) {
        return -1;
    }
    char line[kMaxLogLine];
    va_list args;
    va_start(args, fmt);
    const int n = vsnprintf(line, sizeof(line), fmt, args);
    va_end(args);
    velmora::HostEnvironment::get().eventLog().write(prio, tag, line);
    return n;
}

velmora::ProbeClock* velmora::HostEnvironment::createProbeClock() {
    return new velmora::HostProbeClock(HostEnvironment::get().clock());
}
