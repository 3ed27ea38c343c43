#include "tools/insight/InsightJson.h"

#include <fstream>

namespace velmora {

namespace {

double ms(int64_t us) {
    return static_cast<double>(us) / 1000.0;
}

nlohmann::json callJson(const CallRef& call) {
    if (call.index < 0)
        return nullptr;
    return {{"index", call.index}, {"where", call.where}, {"text", call.text}, {"ms", ms(call.us)}};
}

}  // namespace

nlohmann::json InsightJson::summary(const InsightResult& result) {
    nlohmann::json nodes = nlohmann::json::array();
    for (const auto& node : result.nodes) {
        nlohmann::json residency = nlohmann::json::array();
        for (const auto& entry : node.residencyUs) {
            residency.push_back(
                {{"value", entry.first},
                 {"ms", ms(entry.second)},
                 {"share",
                  result.endUs > 0 ? static_cast<double>(entry.second) / result.endUs : 0.0}});
        }
        nlohmann::json holders = nlohmann::json::array();
        for (const auto& segment : node.segments) {
            holders.push_back({{"from_ms", ms(segment.fromUs)},
                               {"value", segment.value},
                               {"held_by", segment.heldBy}});
        }
        nodes.push_back({{"key", node.key},
                         {"initial", node.initial},
                         {"final", node.final},
                         {"held_by", node.heldBy},
                         {"changes", node.changes},
                         {"numeric", node.numeric},
                         {"residency", residency},
                         {"holders", holders}});
    }
    nlohmann::json spans = nlohmann::json::array();
    for (const auto& span : result.spans) {
        spans.push_back({{"track", span.track},
                         {"category", span.category},
                         {"name", span.name},
                         {"begin_ms", ms(span.beginUs)},
                         {"end_ms", ms(span.endUs)},
                         {"open", span.open}});
    }
    nlohmann::json warnings = nlohmann::json::array();
    for (const auto& warning : result.warnings) {
        warnings.push_back({{"kind", warning.kind},
                            {"message", warning.message},
                            {"call", callJson(warning.call)}});
    }
    return {{"trace_ms", ms(result.endUs)},
            {"calls", result.callCount},
            {"nodes", nodes},
            {"spans", spans},
            {"warnings", warnings}};
}

nlohmann::json InsightJson::comparison(const ReplayComparison& comparison) {
    nlohmann::json nodes = nlohmann::json::array();
    for (const auto& diff : comparison.nodes()) {
        nlohmann::json residency = nlohmann::json::array();
        for (const auto& value : diff.residency) {
            residency.push_back({{"value", value.value},
                                 {"a_ms", ms(value.aUs)},
                                 {"b_ms", ms(value.bUs)},
                                 {"delta_ms", ms(value.bUs - value.aUs)}});
        }
        nodes.push_back({{"key", diff.key},
                         {"final_a", diff.finalA},
                         {"final_b", diff.finalB},
                         {"held_by_a", diff.heldByA},
                         {"held_by_b", diff.heldByB},
                         {"residency", residency}});
    }
    nlohmann::json divergence = nullptr;
    if (comparison.diverges()) {
        divergence = {{"call", callJson(comparison.firstDivergentCall())},
                      {"a", comparison.divergenceA()},
                      {"b", comparison.divergenceB()}};
    }
    return {{"config_a", comparison.labelA()}, {"config_b", comparison.labelB()},
            {"first_divergence", divergence},  {"nodes", nodes},
            {"a", summary(comparison.a())},    {"b", summary(comparison.b())}};
}

bool InsightJson::write(const nlohmann::json& json, const std::string& path, std::string* error) {
    std::ofstream file(path, std::ios::trunc);
    if (!file) {
        *error = "cannot write " + path;
        return false;
    }
    file << json.dump(1) << "\n";
    file.close();
    if (!file) {
        *error = "write failed: " + path;
        return false;
    }
    return true;
}

}  // namespace velmora
