// Machine-readable forms of an insight result and of a comparison of two runs (the files of
// velmora-replay --summary-json). The schema is documented in docs/replay-insight.md.
#pragma once

#include <string>

#include <nlohmann/json.hpp>

#include "tools/insight/InsightResult.h"
#include "tools/insight/ReplayComparison.h"

namespace velmora {

class InsightJson {
public:
    static nlohmann::json summary(const InsightResult& result);
    static nlohmann::json comparison(const ReplayComparison& comparison);
    // Writes `json` to `path`. False with `error` set when the file cannot be written.
    static bool write(const nlohmann::json& json, const std::string& path, std::string* error);
};

}  // namespace velmora
