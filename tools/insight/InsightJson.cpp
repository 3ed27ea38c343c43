#include "tools/insight/InsightJson.h"

#include <ostream>

#include "host/text/TextFile.h"

#include "tools/energy/EnergyComparison.h"

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

// A node without its holders, which are streamed.
nlohmann::json nodeJson(const NodeInsight& node, int64_t endUs) {
    nlohmann::json residency = nlohmann::json::array();
    for (const auto& entry : node.residencyUs) {
        residency.push_back(
            {{"value", entry.first},
             {"ms", ms(entry.second)},
             {"share", endUs > 0 ? static_cast<double>(entry.second) / endUs : 0.0}});
    }
    return {{"key", node.key},        {"initial", node.initial}, {"final", node.final},
            {"held_by", node.heldBy}, {"changes", node.changes}, {"numeric", node.numeric},
            {"residency", residency}};
}

bool writeFile(const std::string& path, std::string* error,
               const std::function<void(JsonStreamWriter&)>& write) {
    return TextFile::write(
        path,
        [&write](std::ostream& file) {
            JsonStreamWriter out(file);
            write(out);
            file << "\n";
        },
        error);
}

// "energy": {"<id>": {"mJ", "saturated_ms", "limits_mJ", "limits_saturated_ms", "residency":
// {"<freq>": ms}, "floor_holders": {"<holder>": mJ}}}
nlohmann::json energyJson(const std::vector<DomainEnergy>& energy) {
    nlohmann::json out = nlohmann::json::object();
    for (const auto& domain : energy) {
        nlohmann::json residency = nlohmann::json::object();
        for (const auto& entry : domain.residencyUs)
            residency[std::to_string(entry.first)] = ms(entry.second);
        nlohmann::json holders = nlohmann::json::object();
        for (const auto& entry : domain.floorHoldersMJ)
            holders[entry.first] = entry.second;
        out[domain.id] = {{"mJ", domain.mJ},
                          {"saturated_ms", ms(domain.saturatedUs)},
                          {"limits_mJ", domain.limitsMJ},
                          {"limits_saturated_ms", ms(domain.limitsSaturatedUs)},
                          {"residency", residency},
                          {"floor_holders", holders}};
    }
    return out;
}

}  // namespace

void InsightJson::summary(const InsightResult& result, JsonStreamWriter& out) {
    nlohmann::json warnings = nlohmann::json::array();
    for (const auto& warning : result.warnings) {
        warnings.push_back({{"kind", warning.kind},
                            {"message", warning.message},
                            {"call", callJson(warning.call)}});
    }
    nlohmann::json members = {
        {"trace_ms", ms(result.endUs)}, {"calls", result.callCount}, {"warnings", warnings}};
    if (!result.energy.empty())
        members["energy"] = energyJson(result.energy);
    auto holders = [&](const NodeInsight& node) {
        out.beginArray();
        for (const auto& segment : node.segments) {
            out.value({{"from_ms", ms(segment.fromUs)},
                       {"value", segment.value},
                       {"held_by", segment.heldBy}});
        }
        out.endArray();
    };
    auto nodes = [&] {
        out.beginArray();
        for (const auto& node : result.nodes)
            out.object(nodeJson(node, result.endUs), {{"holders", [&] { holders(node); }}});
        out.endArray();
    };
    auto spans = [&] {
        out.beginArray();
        for (const auto& span : result.spans) {
            out.value({{"track", span.track},
                       {"category", span.category},
                       {"name", span.name},
                       {"begin_ms", ms(span.beginUs)},
                       {"end_ms", ms(span.endUs)},
                       {"open", span.open}});
        }
        out.endArray();
    };
    out.object(members, {{"nodes", nodes}, {"spans", spans}});
}

void InsightJson::comparison(const ReplayComparison& comparison, JsonStreamWriter& out) {
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
        divergence = {{"ms", ms(comparison.divergenceUs())},
                      {"cause", comparison.timedFirst() ? "timed" : "call"},
                      {"node", comparison.timedFirst() ? comparison.timedDivergence().node() : ""},
                      {"call", callJson(comparison.firstDivergentCall())},
                      {"a", comparison.divergenceA()},
                      {"b", comparison.divergenceB()}};
    }
    nlohmann::json members = {{"config_a", comparison.labelA()},
                              {"config_b", comparison.labelB()},
                              {"first_divergence", divergence},
                              {"overridden_by", comparison.overrides()},
                              {"nodes", nodes}};
    // Per domain, what B costs against A; both runs replay one trace, so one has a domain when
    // the other has.
    if (!comparison.a().energy.empty()) {
        nlohmann::json energy = nlohmann::json::object();
        for (const auto& d :
             EnergyComparison::deltas(comparison.a().energy, comparison.b().energy)) {
            energy[d.id] = {{"a_mJ", d.aMJ},
                            {"b_mJ", d.bMJ},
                            {"delta_mJ", d.bMJ - d.aMJ},
                            {"a_saturated_ms", ms(d.aSaturatedUs)},
                            {"b_saturated_ms", ms(d.bSaturatedUs)},
                            {"delta_saturated_ms", ms(d.bSaturatedUs - d.aSaturatedUs)}};
        }
        members["energy"] = energy;
    }
    out.object(members, {{"a", [&] { summary(comparison.a(), out); }},
                         {"b", [&] { summary(comparison.b(), out); }}});
}

bool InsightJson::writeSummary(const InsightResult& result, const std::string& path,
                               std::string* error) {
    return writeFile(path, error, [&](JsonStreamWriter& out) { summary(result, out); });
}

bool InsightJson::writeComparison(const ReplayComparison& comparison, const std::string& path,
                                  std::string* error) {
    return writeFile(path, error,
                     [&](JsonStreamWriter& out) { InsightJson::comparison(comparison, out); });
}

}  // namespace velmora
