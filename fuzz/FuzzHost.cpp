#include "fuzz/FuzzHost.h"

#include <android/log.h>
#include <sys/stat.h>

#include <cstdio>
#include <cstdlib>

#include "host/platform/HostEnvironment.h"
#include "server/VelmoraServer.h"

namespace velmora {
namespace fuzz {

namespace {

void dropLine(const struct __android_logger_data* /*data*/, const char* /*message*/) {}

VelmoraServer* gServer = nullptr;

// At exit: release the components (the probe worker is stopped before the platform goes, and
// the platform's destructor stops the host layer's timer thread). The server object itself
// stays, as a host's would.
void stopServer() {
    if (gServer == nullptr) {
        return;
    }
    gServer->deleteObject();
}

void mkdirs(const std::string& dir) {
    for (size_t pos = 1; pos != std::string::npos;) {
        pos = dir.find('/', pos + 1);
        mkdir(dir.substr(0, pos).c_str(), 0755);
    }
}

}  // namespace

void silenceLog() {
    __android_log_set_logger(dropLine);
}

std::string workDir(const char* name) {
    const std::string dir = std::string(VELMORA_FUZZ_WORK_DIR) + "/" + name;
    mkdirs(dir);
    return dir;
}

void prepareHost(const char* name) {
    static bool prepared = false;
    if (prepared) {
        return;
    }
    prepared = true;
    silenceLog();
    HostEnvironment& env = HostEnvironment::get();
    env.properties().unset("ro.build.version.incremental");
    env.properties().setConfigDirs({VELMORA_FUZZ_CONFIG_DIR});
    if (env.useDeviceRoot(workDir(name) + "/device", /*fresh=*/true) != 0) {
        fprintf(stderr, "fuzz: cannot create the simulated device under %s\n",
                workDir(name).c_str());
        abort();
    }
}

VelmoraServer& server(const char* name) {
    static VelmoraServer* instance = [name] {
        prepareHost(name);
        auto* s = new VelmoraServer();
        const int ret = s->init();
        if (ret != 0) {
            fprintf(stderr, "fuzz: server init failed with %d\n", ret);
            abort();
        }
        gServer = s;
        // Registered after the host environment exists, so it runs before the environment's
        // destructor: the probe worker and the host layer's timer thread must be gone by then.
        atexit(stopServer);
        return s;
    }();
    return *instance;
}

void trimHostRecords(unsigned every) {
    static unsigned calls = 0;
    if (++calls % every != 0) {
        return;
    }
    HostEnvironment& env = HostEnvironment::get();
    env.timeline().clear();
    env.eventLog().clear();
}

}  // namespace fuzz
}  // namespace velmora
