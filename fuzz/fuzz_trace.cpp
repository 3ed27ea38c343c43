// The trace reader of velmora-replay over arbitrary trace text, read from memory the way a
// replay reads its file: one call at a time, then the whole text at once (parseText) and the
// first pass a replay makes (TraceSurvey). Both reads must agree, and every call must be one a
// replay can make.
#include <cstdint>
#include <string>
#include <vector>

#include "tools/replay/TraceParser.h"
#include "tools/replay/TraceReader.h"
#include "tools/replay/TraceSurvey.h"

namespace {

// What the replay relies on when it turns a call into a host call.
bool wellFormed(const velmora::TraceCall& call, int previousLine) {
    using Kind = velmora::TraceCall::Kind;
    if (call.line <= previousLine || call.atMs < -1 || call.sleepMs < 0) {
        return false;
    }
    switch (call.kind) {
        case Kind::Event:
            return call.payload.size() < 64 && (call.hasMsg || call.text.empty());
        case Kind::SetConfig:
            return !call.tags.empty() && call.tags.size() == call.values.size();
        case Kind::GetConfig:
            return !call.tags.empty() && call.values.empty();
        case Kind::Stamp:
            return call.atMs >= 0;
        case Kind::Load:
            // Named domains with shares in [0, 1], none twice (checked against a device later).
            if (call.loads.empty() || call.loads.size() > velmora::TraceParser::kMaxLoads)
                return false;
            for (size_t i = 0; i < call.loads.size(); ++i) {
                const velmora::LoadShare& share = call.loads[i];
                if (share.domain.empty() || !(share.u >= 0 && share.u <= 1))
                    return false;
                for (size_t j = 0; j < i; ++j) {
                    if (call.loads[j].domain == share.domain)
                        return false;
                }
            }
            return true;
        case Kind::Sleep:
        case Kind::Reload:
        case Kind::Dump:
        case Kind::Policy:
            return true;
    }
    return false;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const std::string text(reinterpret_cast<const char*>(data), size);
    velmora::TraceReader reader(text, "fuzz.trace");
    velmora::TraceSurvey survey;
    velmora::TraceCall call;
    std::string error;
    size_t calls = 0;
    size_t badLines = 0;
    int line = 0;
    for (velmora::TraceReader::Step step;
         (step = reader.next(&call, &error)) != velmora::TraceReader::Step::End;) {
        if (step == velmora::TraceReader::Step::BadLine) {
            // Every message names the trace and the line.
            if (error.compare(0, 11, "fuzz.trace:") != 0) {
                __builtin_trap();
            }
            ++badLines;
            continue;
        }
        if (!wellFormed(call, line)) {
            __builtin_trap();
        }
        line = call.line;
        survey.add(call);
        ++calls;
    }
    if (reader.calls() != calls) {
        __builtin_trap();
    }

    std::vector<velmora::TraceCall> all;
    std::string errors;
    const int status = velmora::TraceParser::parseText(text, "fuzz.trace", &all, &errors);
    if (all.size() != calls || (status != 0) != (badLines > 0)) {
        __builtin_trap();
    }
    return 0;
}
