#include "bench/BenchPlatform.h"

#include <cstdio>
#include <cstring>
#include <atomic>

#include "config/Action.h"
#include "config/VelmoraLoadXml.h"
#include "config/VelmoraParser.h"
#include "platform/OnDemandBoostServer.h"
#include "platform/PlatformImports.h"
#include "tests/fakes/FakeLoadXml.h"

namespace velmora {
namespace bench {

namespace {

constexpr int kProbeCmdId = 4116;

std::string gConfigPath;
std::atomic<ProbeBoostHook> gProbeHook{nullptr};
// Thread chosen by the last setProbeTid(tid, 0); the worker calls doAction right after it,
// under its own lock, so no other boost comes in between.
std::atomic<unsigned int> gProbeTid{0};

class BenchPlatform : public VelmoraPlat {
public:
    BenchPlatform() { mExecutorPtr = &executor(); }
};

}  // namespace

int NoopExecutor::doAction(const Action* action, unsigned int payloadNum, const int* payload) {
    if (action != nullptr && action->mCmdId == kProbeCmdId && payloadNum == 1 &&
        payload != nullptr && payload[0] == 0) {
        const ProbeBoostHook hook = gProbeHook.load(std::memory_order_acquire);
        if (hook != nullptr) {
            hook(gProbeTid.load(std::memory_order_relaxed), pthread_self());
        }
    }
    return 0;
}

int NoopExecutor::doPerfSetConfig(int, int, const int*, const int*) {
    return 0;
}

int NoopExecutor::doPerfGetConfig(int, const int*, int*) {
    return 0;
}

int NoopExecutor::doSchedLevelAction(int, const int*, const int*) {
    return 0;
}

int NoopExecutor::setProbeTid(unsigned int tid, int state) {
    if (state == 0) {
        gProbeTid.store(tid, std::memory_order_relaxed);
    }
    return 0;
}

void setConfigPath(const std::string& path) {
    gConfigPath = path;
}

void setProbeBoostHook(ProbeBoostHook hook) {
    gProbeHook.store(hook, std::memory_order_release);
}

NoopExecutor& executor() {
    static NoopExecutor instance;
    return instance;
}

}  // namespace bench
}  // namespace velmora

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
    return new velmora::bench::BenchPlatform();
}

VelmoraLoadXml* createVelmoraLoadXml() {
    return new velmora::fake::FakeLoadXml();
}

OnDemandBoostServer* OnDemandBoostServer::getInstance() {
    static OnDemandBoostServer instance;
    return &instance;
}

int OnDemandBoostServer::getPolicy(const char*) {
    return -1;
}

extern "C" int property_get(const char*, char* value, const char* defaultValue) {
    snprintf(value, VELMORA_PROPERTY_VALUE_MAX, "%s", defaultValue != nullptr ? defaultValue : "");
    return static_cast<int>(strlen(value));
}

extern "C" char* get_one_cfg_file(const char*, int, char* buf) {
    if (velmora::bench::gConfigPath.empty()) {
        return nullptr;
    }
    snprintf(buf, 128, "%s", velmora::bench::gConfigPath.c_str());
    return buf;
}

extern "C" int __zklog_jank_print(int, int, const char*, ...) {
    return 0;
}
