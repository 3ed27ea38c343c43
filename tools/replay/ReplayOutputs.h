// What a replay writes when it ends: the per-node table (the analysis's, or the timeline's own
// when no analysis ran), and the files its options name (timeline, summary JSON, HTML report
// with the node plots and then the energy model's), each named on stdout once written.
#pragma once

#include <cstdio>
#include <string>

#include "tools/insight/InsightResult.h"

namespace velmora {

struct ReplayOptions;

class ReplayOutputs {
public:
    // Message and false when `path` cannot be written (the file is left as it was).
    static bool checkWritable(const std::string& path, std::string* error);
    static std::string summaryText(const InsightResult& result);
    // Writes the files `options` names. ReplaySession::kOk, or kSetupFailed with a line on `err`.
    static int write(const ReplayOptions& options, const InsightResult& result, FILE* out,
                     FILE* err);

private:
    static bool writeReport(const InsightResult& result, const std::string& path,
                            std::string* error);
};

}  // namespace velmora
