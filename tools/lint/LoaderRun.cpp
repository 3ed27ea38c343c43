#include "tools/lint/LoaderRun.h"

#include <android/log.h>
#include <sys/mman.h>
#include <unistd.h>

#include <memory>
#include <mutex>

#include "config/VelmoraLoadXml.h"
#include "config/VelmoraParser.h"

namespace velmora {

namespace {

std::mutex gSinkLock;                       // guards gSink
std::vector<std::string>* gSink = nullptr;  // where captureLogger appends; null: dropped

void captureLogger(const struct __android_logger_data* /*data*/, const char* message) {
    std::lock_guard<std::mutex> lock(gSinkLock);
    if (gSink != nullptr && message != nullptr) {
        gSink->emplace_back(message);
    }
}

// Sends liblog lines to `sink` while in scope; afterwards liblog prints to stderr again, which
// is its default on a host.
class ScopedLogCapture {
public:
    explicit ScopedLogCapture(std::vector<std::string>* sink) {
        {
            std::lock_guard<std::mutex> lock(gSinkLock);
            gSink = sink;
        }
        __android_log_set_logger(captureLogger);
    }
    ~ScopedLogCapture() {
        __android_log_set_logger(__android_log_stderr_logger);
        std::lock_guard<std::mutex> lock(gSinkLock);
        gSink = nullptr;
    }
};

}  // namespace

LoaderRun::~LoaderRun() {
    VelmoraLoadXml::freeRawXmlDataMap(&mRawMap);
    VelmoraParser::deleteActionMap(mActionMap);
}

int LoaderRun::run(const std::string& path) {
    ScopedLogCapture capture(&mLog);
    std::unique_ptr<VelmoraLoadXml> loader(createVelmoraLoadXml());
    if (loader == nullptr) {
        mStatus = -1;
        return mStatus;
    }
    mStatus = loader->innerLoad(path.c_str(), &mRawMap);
    if (mStatus == 0 && !mRawMap.empty()) {
        mActionMap = loader->createActionMap(mRawMap);
    }
    return mStatus;
}

int LoaderRun::runText(const std::string& text) {
    const int fd = memfd_create("velmora-lint-config", MFD_CLOEXEC);
    if (fd < 0) {
        mStatus = -1;
        return mStatus;
    }
    size_t written = 0;
    while (written < text.size()) {
        const ssize_t n = write(fd, text.data() + written, text.size() - written);
        if (n <= 0) {
            close(fd);
            mStatus = -1;
            return mStatus;
        }
        written += static_cast<size_t>(n);
    }
    const int status = run("/proc/self/fd/" + std::to_string(fd));
    close(fd);
    return status;
}

const Action* LoaderRun::chainOf(int cmdId) const {
    if (mActionMap == nullptr) {
        return nullptr;
    }
    auto it = mActionMap->find(cmdId);
    return it != mActionMap->end() ? it->second : nullptr;
}

}  // namespace velmora
