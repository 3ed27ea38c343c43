#include "host/platform/HostPlatform.h"

#include "host/platform/HostEnvironment.h"
#include "platform/VelmoraLog.h"

namespace velmora {

namespace {
constexpr int kDeviceUnusable = 3;
}  // namespace

HostPlatform::HostPlatform() {
    HostEnvironment& env = HostEnvironment::get();
    mExecutor = new HostExecutor(env.nodeMap(), env.device(), env.clock(), env.timeline());
    mExecutorPtr = mExecutor;
}

HostPlatform::~HostPlatform() {
    mExecutorPtr = nullptr;
    delete mExecutor;
}

int HostPlatform::initialize() {
    HostEnvironment& env = HostEnvironment::get();
    if (env.prepareDevice() != 0) {
        VLOGE("host: device root %s is not usable", env.device().root().c_str());
        return kDeviceUnusable;
    }
    VLOGI("host: platform ready on %s", env.device().root().c_str());
    return 0;
}

}  // namespace velmora
