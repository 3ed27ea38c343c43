#include "tools/replay/TraceSurvey.h"

#include "config/CommandIds.h"
#include "tools/energy/LoadDomains.h"
#include "tools/replay/TraceReader.h"

namespace velmora {

int TraceSurvey::read(const std::string& path, const ErrorSink& onError) {
    TraceReader reader(path);
    if (!reader.isOpen()) {
        onError(path + ": cannot open trace");
        return 1;
    }
    int errors = 0;
    TraceCall call;
    std::string error;
    for (TraceReader::Step step; (step = reader.next(&call, &error)) != TraceReader::Step::End;) {
        if (step == TraceReader::Step::BadLine ||
            (mLoadDomains != nullptr && !mLoadDomains->check(call, &error))) {
            onError(error);
            ++errors;
        } else {
            add(call);
        }
    }
    return errors;
}

void TraceSurvey::add(const TraceCall& call) {
    const bool event = call.kind == TraceCall::Kind::Event;
    if (!event && call.kind != TraceCall::Kind::Policy)
        return;
    if (event && (call.id == kCmdProbe || call.id == kCmdMemLatencyRatio) && call.hasMsg &&
        call.text == kPlaceholderMsg) {
        if (mPlaceholders.size() < kKeptPlaceholders)
            mPlaceholders.push_back({call.file + ":" + std::to_string(call.line), call.id});
        ++mPlaceholderCount;
    }
    const size_t fresh = mUses.size();
    const size_t index = event ? mEvents.emplace(call.id, fresh).first->second
                               : mPolicies.emplace(call.text, fresh).first->second;
    if (index == fresh) {
        Use use;
        use.kind = call.kind;
        use.cmdId = event ? call.id : 0;
        use.policy = event ? "" : call.text;
        use.where = call.file + ":" + std::to_string(call.line);
        mUses.push_back(use);
    }
    ++mUses[index].calls;
}

}  // namespace velmora
