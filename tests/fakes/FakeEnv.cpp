#include "tests/fakes/FakeEnv.h"

#include <cstdarg>
#include <cstdio>
#include <cstring>

#include "config/VelmoraLoadXml.h"
#include "config/VelmoraParser.h"
#include "platform/OnDemandBoostServer.h"
#include "platform/PlatformImports.h"
#include "tests/fakes/FakeLoadXml.h"

namespace velmora {
namespace fake {

FakeEnv& FakeEnv::get() {
    static FakeEnv env;
    return env;
}

void FakeEnv::reset() {
    failGetPlat = false;
    failLoader = false;
    initializeResult = 0;
    incremental.clear();
    custConfigPath.clear();
    executor.reset();
    lastPlat = nullptr;
    platformsDeleted = 0;
    initializeCalls = 0;
    std::lock_guard<std::mutex> lock(mLock);
    mPolicies.clear();
    mPolicyQueries = 0;
    mJankLines.clear();
}

void FakeEnv::setPolicy(const std::string& name, int duration) {
    std::lock_guard<std::mutex> lock(mLock);
    mPolicies[name] = duration;
}

int FakeEnv::policy(const char* name) {
    std::lock_guard<std::mutex> lock(mLock);
    ++mPolicyQueries;
    auto it = mPolicies.find(name != nullptr ? name : "");
    return it == mPolicies.end() ? -1 : it->second;
}

int FakeEnv::policyQueries() const {
    std::lock_guard<std::mutex> lock(mLock);
    return mPolicyQueries;
}

void FakeEnv::addJankLine(const std::string& line) {
    std::lock_guard<std::mutex> lock(mLock);
    mJankLines.push_back(line);
}

std::vector<std::string> FakeEnv::jankLines() const {
    std::lock_guard<std::mutex> lock(mLock);
    return mJankLines;
}

int FakePlatform::initialize() {
    FakeEnv& env = FakeEnv::get();
    ++env.initializeCalls;
    return env.initializeResult;
}

FakePlatform::~FakePlatform() {
    FakeEnv& env = FakeEnv::get();
    ++env.platformsDeleted;
    if (env.lastPlat == this) {
        env.lastPlat = nullptr;
    }
}

}  // namespace fake
}  // namespace velmora

using velmora::fake::FakeEnv;

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
    FakeEnv& env = FakeEnv::get();
    if (env.failGetPlat) {
        return nullptr;
    }
    auto* plat = new velmora::fake::FakePlatform();
    plat->mExecutorPtr = &env.executor;
    env.lastPlat = plat;
    return plat;
}

VelmoraLoadXml* createVelmoraLoadXml() {
    if (FakeEnv::get().failLoader) {
        return nullptr;
    }
    return new velmora::fake::FakeLoadXml();
}

OnDemandBoostServer* OnDemandBoostServer::getInstance() {
    static OnDemandBoostServer instance;
    return &instance;
}

int OnDemandBoostServer::getPolicy(const char* name) {
    return FakeEnv::get().policy(name);
}

extern "C" int property_get(const char* key, char* value, const char* defaultValue) {
    const std::string& incremental = FakeEnv::get().incremental;
    const char* answer = defaultValue != nullptr ? defaultValue : "";
    if (key != nullptr && strcmp(key, "ro.build.version.incremental") == 0 &&
        !incremental.empty()) {
        answer = incremental.c_str();
    }
    snprintf(value, VELMORA_PROPERTY_VALUE_MAX, "%s", answer);
    return static_cast<int>(strlen(value));
}

extern "C" char* get_one_cfg_file(const char* pathSuffix, int type, char* buf) {
    (void)pathSuffix;
    (void)type;
    const std::string& path = FakeEnv::get().custConfigPath;
    if (path.empty()) {
        return nullptr;
    }
    snprintf(buf, 128, "%s", path.c_str());
    return buf;
}

extern "C" int __zklog_jank_print(int prio, int tag, const char* fmt, ...) {
    char line[1024];
    va_list args;
    va_start(args, fmt);
    vsnprintf(line, sizeof(line), fmt, args);
    va_end(args);
    FakeEnv::get().addJankLine(std::to_string(prio) + ":" + std::to_string(tag) + ":" + line);
    return 0;
}
