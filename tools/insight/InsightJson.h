// Machine-readable forms of an insight result and of a comparison of two runs (the files of
// velmora-replay --summary-json). The schema is documented in docs/replay-insight.md. Written
// as they are produced (JsonStreamWriter): the holders of every change are never one document
// in memory.
#pragma once

#include <string>

#include "tools/insight/InsightResult.h"
#include "tools/insight/JsonStreamWriter.h"
#include "tools/insight/ReplayComparison.h"

namespace velmora {

class InsightJson {
public:
    static void summary(const InsightResult& result, JsonStreamWriter& out);
    static void comparison(const ReplayComparison& comparison, JsonStreamWriter& out);
    // Write them to `path`. False with `error` set when the file cannot be written.
    static bool writeSummary(const InsightResult& result, const std::string& path,
                             std::string* error);
    static bool writeComparison(const ReplayComparison& comparison, const std::string& path,
                                std::string* error);
};

}  // namespace velmora
