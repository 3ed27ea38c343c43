#include "host/platform/HostEnvironment.h"

#include <errno.h>
#include <ftw.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdlib>
#include <cstring>

#include "platform/VelmoraLog.h"
#include "probe/ProbeClock.h"
#include "trace/Trace.h"

namespace velmora {

namespace {

constexpr const char* kSimulatedMarker = "/.velmora-simulated";

int removeEntry(const char* path, const struct stat*, int, struct FTW*) {
    return remove(path) == 0 ? 0 : -1;
}

bool makeDirs(const std::string& dir) {
    for (size_t pos = dir.find('/', 1);; pos = dir.find('/', pos + 1)) {
        const std::string part = dir.substr(0, pos);
        if (mkdir(part.c_str(), 0755) != 0 && errno != EEXIST) {
            return false;
        }
        if (pos == std::string::npos) {
            return true;
        }
    }
}

}  // namespace

HostEnvironment& HostEnvironment::get() {
    static HostEnvironment env;
    return env;
}

HostEnvironment::HostEnvironment()
    : mTimeline(mClock),
      mTraceSink(mClock, mTimeline),
      mDevice(mNodeMap, mTimeline),
      mEventLog(mClock, mTimeline) {
    mDevice.setRoot(defaultSimulatedRoot());
    // The probe workers of servers built from now on read time and wait through mClock.
    ProbeClock::setFactory(&HostEnvironment::createProbeClock);
    Trace::setSink(&mTraceSink);
}

HostEnvironment::~HostEnvironment() {
    Trace::setSink(nullptr);
}

std::string HostEnvironment::defaultSimulatedRoot() {
    const char* tmp = getenv("TMPDIR");
    std::string dir = tmp != nullptr && tmp[0] == '/' ? tmp : "/tmp";
    while (dir.size() > 1 && dir.back() == '/') {
        dir.pop_back();
    }
    return (dir == "/" ? "" : dir) + "/velmora-sim-" + std::to_string(getpid());
}

void HostEnvironment::setServerTracing(bool on) {
    Trace::setSink(on ? &mTraceSink : nullptr);
}

void HostEnvironment::reset() {
    setServerTracing(true);
    mClock.setVirtual();
    mTimeline.clear();
    mNodeMap = NodeMap();
    mProperties.reset();
    mPolicies.clear();
    mEventLog.setPath("");
    mEventLog.clear();
    mDevice.setRoot(defaultSimulatedRoot());
    std::lock_guard<std::mutex> lock(mLock);
    mPrepared = false;
}

int HostEnvironment::useDeviceRoot(const std::string& root, bool fresh) {
    if (root.empty()) {
        VLOGE("host: empty device root");
        return -1;
    }
    mDevice.setRoot(root);
    std::lock_guard<std::mutex> lock(mLock);
    mPrepared = false;
    if (root == "/") {
        mPrepared = true;
        return 0;
    }
    if (!makeDirs(root)) {
        VLOGE("host: cannot create device root %s: %s", root.c_str(), strerror(errno));
        return -1;
    }
    const std::string marker = root + kSimulatedMarker;
    struct stat st;
    if (fresh || stat(marker.c_str(), &st) != 0) {
        if (mDevice.seed() != 0) {
            return -1;
        }
        FILE* file = fopen(marker.c_str(), "w");
        if (file != nullptr) {
            fclose(file);
        }
    }
    mPrepared = true;
    return 0;
}

int HostEnvironment::prepareDevice() {
    {
        std::lock_guard<std::mutex> lock(mLock);
        if (mPrepared) {
            return 0;
        }
    }
    return useDeviceRoot(mDevice.root(), false);
}

bool HostEnvironment::removeSimulatedRoot(const std::string& root, std::string* error) {
    struct stat st;
    if (root.empty() || root == "/" || stat((root + kSimulatedMarker).c_str(), &st) != 0) {
        *error = "not removing " + root + ": not a simulated device";
        return false;
    }
    mDevice.setRoot(defaultSimulatedRoot());  // closes the nodes it has open
    {
        std::lock_guard<std::mutex> lock(mLock);
        mPrepared = false;
    }
    if (nftw(root.c_str(), removeEntry, 16, FTW_DEPTH | FTW_PHYS) != 0) {
        *error = "cannot remove the simulated device " + root + ": " + strerror(errno);
        return false;
    }
    return true;
}

}  // namespace velmora
