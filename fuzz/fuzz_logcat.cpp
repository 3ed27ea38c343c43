// velmora-import-logcat's importer over arbitrary log text from memory. When it writes a trace,
// that trace must be one velmora-replay reads without a bad line, with its time stamps going
// forward; and the format it detected must read the lines it was detected on.
#include <cstdint>
#include <string>

#include "tools/logcat/LogcatFormat.h"
#include "tools/logcat/LogcatImporter.h"
#include "tools/replay/TraceReader.h"

namespace {

// The format detected on the first line that has one must take that line apart again.
void checkDetection(const std::string& text) {
    const std::string first = text.substr(0, text.find('\n'));
    velmora::LogcatFormat format;
    if (!velmora::LogcatFormat::detect(first, &format)) {
        return;
    }
    velmora::LogcatRecord record;
    if (!format.parse(first, &record) || record.tag.empty() || format.name().empty()) {
        __builtin_trap();
    }
}

void checkTrace(const std::string& trace) {
    velmora::TraceReader reader(trace, "imported.trace");
    velmora::TraceCall call;
    std::string error;
    int64_t lastMs = 0;
    for (velmora::TraceReader::Step step;
         (step = reader.next(&call, &error)) != velmora::TraceReader::Step::End;) {
        if (step == velmora::TraceReader::Step::BadLine || call.atMs < lastMs) {
            __builtin_trap();
        }
        lastMs = call.atMs;
    }
    if (reader.calls() == 0) {
        __builtin_trap();
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const std::string text(reinterpret_cast<const char*>(data), size);
    checkDetection(text);
    velmora::LogcatImporter importer;
    std::string error;
    if (importer.importText(text, "fuzz.log", &error) != 0) {
        if (error.compare(0, 10, "fuzz.log: ") != 0 || error.find('\n') != std::string::npos) {
            __builtin_trap();
        }
        return 0;
    }
    checkTrace(importer.trace());
    return 0;
}
