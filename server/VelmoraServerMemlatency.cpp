// Memory-latency hints. 20481 is an ordinary configured command switched on or off; 20480
// carries its two ratios in the event text and never consults the configuration.
#include <string>
#include <vector>

#include "compat/BoundedString.h"
#include "config/Action.h"
#include "config/CommandIds.h"
#include "platform/PerfExecutor.h"
#include "platform/VelmoraLog.h"
#include "platform/VelmoraPlat.h"
#include "server/VelmoraServer.h"

using namespace velmora;

namespace {

// Each ratio keeps at most 510 characters: the buffer is 512 bytes but announced as 511.
constexpr size_t kRatioBufferSize = 512;
constexpr size_t kRatioBufferAnnounced = 511;

// The platform's executor as it is now; never kept across calls.
PerfExecutor* currentExecutor(const VelmoraPlat* plat) {
    return plat != nullptr ? plat->mExecutorPtr : nullptr;
}

}  // namespace

int VelmoraServer::doMemlatencyEvent(int cmdId, const char* msg, unsigned int payloadNum,
                                     const int* payload) {
    char ratioBig[kRatioBufferSize] = {0};
    char ratioLittle[kRatioBufferSize] = {0};
    if (!isParamValid(payloadNum, payload)) {
        VLOGE("payload is invalid! cmdId=%d", cmdId);
        return 3;
    }

    if (cmdId == kCmdMemLatency) {
        Action action;
        const int parseRet = parseCommand(cmdId, &action);
        if (parseRet != 0) {
            VLOGE("doParse failed! cmdId=%d, errno=%d", cmdId, parseRet);
            return 2;
        }
        // Read after the parse, not before: the platform may have replaced its executor.
        PerfExecutor* executor = currentExecutor(mPlatPtr);
        if (executor == nullptr || executor->doAction(&action, 1, payload) != 0) {
            VLOGE("doAction failed! cmdId=%d", cmdId);
            return 3;
        }
        return 0;
    }

    int pid = 0;
    int tid = 0;
    if (msg == nullptr ||
        sscanf_s(msg, "pid=%d|tid=%d|ratio_b=%s ratio_l=%s", &pid, &tid, ratioBig,
                 kRatioBufferAnnounced, ratioLittle, kRatioBufferAnnounced) != 4) {
        VLOGE("parser failed! cmdId=%d", kCmdMemLatencyRatio);
        return 3;
    }
    std::vector<std::string> params = {"mem_latency_ratio_b", ratioBig, "mem_latency_ratio_l",
                                       ratioLittle};
    Action action(kCmdMemLatencyRatio, "", 0, 2, params);
    PerfExecutor* executor = currentExecutor(mPlatPtr);
    if (executor == nullptr || executor->doAction(&action, 1, payload) != 0) {
        VLOGE("doAction failed! cmdId=%d", kCmdMemLatencyRatio);
        return 3;
    }
    return 0;
}
