#include "tools/replay/CallWarnings.h"

#include <pthread.h>

#include <set>
#include <vector>

#include "config/CommandIds.h"
#include "config/VelmoraParser.h"
#include "platform/VelmoraPlat.h"
#include "server/VelmoraServer.h"
#include "tools/common/Spelling.h"
#include "tools/replay/TraceSurvey.h"

namespace velmora {

namespace {

constexpr const char* kColdPolicy = kColdPolicyName;
constexpr const char* kWinSwitchPolicy = kWinSwitchPolicyName;

}  // namespace

void CallWarnings::print(const TraceSurvey& survey, const VelmoraServer& server,
                         const std::string& tracePath, FILE* err) {
    placeholders(survey, tracePath, err);
    std::set<int> configured;
    VelmoraParser* parser = server.mPlatPtr != nullptr ? server.mPlatPtr->mParserPtr : nullptr;
    if (parser == nullptr) {
        return;
    }
    pthread_rwlock_rdlock(&parser->mRwLock);
    if (parser->mActionMap != nullptr) {
        for (const auto& entry : *parser->mActionMap) {
            configured.insert(entry.first);
        }
    }
    pthread_rwlock_unlock(&parser->mRwLock);
    const std::vector<std::string> policies = {kColdPolicy, kWinSwitchPolicy};
    for (const auto& use : survey.uses()) {
        // Said once, where first used: "(3 calls)" when more calls use it.
        const std::string calls = use.calls > 1 ? " (" + std::to_string(use.calls) + " calls)" : "";
        // Ids from 20224 up are taken apart before any parse, except memory latency 20481.
        const bool parsed = use.cmdId < kCmdClientRestart || use.cmdId == kCmdMemLatency;
        if (use.kind == TraceCall::Kind::Event && parsed && configured.count(use.cmdId) == 0) {
            fprintf(err,
                    "velmora-replay: %s: warning: command %d%s is not in the configuration: the "
                    "server answers 2\n",
                    use.where.c_str(), use.cmdId, calls.c_str());
        } else if (use.kind == TraceCall::Kind::Policy && use.policy != kColdPolicy &&
                   use.policy != kWinSwitchPolicy) {
            const std::string guess = Spelling::closest(use.policy, policies);
            fprintf(err,
                    "velmora-replay: %s: warning: policy '%s'%s is never asked for: the server "
                    "asks for \"cold\" (4099) and \"winswitch\" (4098)%s\n",
                    use.where.c_str(), use.policy.c_str(), calls.c_str(),
                    guess.empty() ? "" : ("; did you mean '" + guess + "'?").c_str());
        }
    }
}

void CallWarnings::placeholders(const TraceSurvey& survey, const std::string& tracePath,
                                FILE* err) {
    for (const auto& placeholder : survey.placeholders()) {
        const bool probe = placeholder.cmdId == kCmdProbe;
        fprintf(err,
                "velmora-replay: %s: warning: unedited placeholder from the import, msg=\"%s\": "
                "%s; fill in %s\n",
                placeholder.where.c_str(), TraceSurvey::kPlaceholderMsg,
                probe ? "the probe boosts no thread" : "the memory-latency event fails (status 3)",
                probe ? "the pid and tid of the thread to probe"
                      : "the pid and tid of the thread and its ratio_b= and ratio_l=");
    }
    const size_t more = survey.placeholderCount() - survey.placeholders().size();
    if (more > 0)
        fprintf(err, "velmora-replay: %s: warning: %zu more unedited placeholders\n",
                tracePath.c_str(), more);
}

}  // namespace velmora
