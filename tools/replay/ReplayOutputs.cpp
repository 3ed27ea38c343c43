#include "tools/replay/ReplayOutputs.h"

#include <unistd.h>

#include <vector>

#include "host/platform/HostEnvironment.h"
#include "tools/energy/EnergyPlots.h"
#include "tools/insight/HtmlReport.h"
#include "tools/insight/InsightJson.h"
#include "tools/insight/InsightSummary.h"
#include "tools/replay/ReplaySession.h"

namespace velmora {

bool ReplayOutputs::checkWritable(const std::string& path, std::string* error) {
    const bool existed = access(path.c_str(), F_OK) == 0;
    FILE* file = fopen(path.c_str(), "a");
    if (file == nullptr) {
        *error = "cannot write " + path;
        return false;
    }
    fclose(file);
    if (!existed)
        unlink(path.c_str());
    return true;
}

bool ReplayOutputs::writeReport(const InsightResult& result, const std::string& path,
                                std::string* error) {
    std::vector<ReportPlot> plots = HtmlReport::plots(result);
    for (auto& plot : EnergyPlots::plots(result.energy))
        plots.push_back(std::move(plot));
    return HtmlReport::write(result, plots, path, error);
}

int ReplayOutputs::write(const ReplayOptions& options, const InsightResult& result, FILE* out,
                         FILE* err) {
    HostEnvironment& env = HostEnvironment::get();
    std::string error;
    if ((!options.timelinePath.empty() &&
         !env.timeline().writeChromeJson(options.timelinePath, &error)) ||
        (!options.summaryJsonPath.empty() &&
         !InsightJson::writeSummary(result, options.summaryJsonPath, &error)) ||
        (!options.reportPath.empty() && !writeReport(result, options.reportPath, &error))) {
        fprintf(err, "velmora-replay: %s\n", error.c_str());
        return ReplaySession::kSetupFailed;
    }
    const bool any = !options.timelinePath.empty() || !options.eventLogPath.empty() ||
                     !options.summaryJsonPath.empty() || !options.reportPath.empty();
    if (any)
        fputc('\n', out);
    if (!options.timelinePath.empty())
        fprintf(out, "timeline: %s (open in https://ui.perfetto.dev)\n",
                options.timelinePath.c_str());
    if (!options.eventLogPath.empty())
        fprintf(out, "event log: %s\n", options.eventLogPath.c_str());
    if (!options.summaryJsonPath.empty())
        fprintf(out, "summary: %s\n", options.summaryJsonPath.c_str());
    if (!options.reportPath.empty())
        fprintf(out, "report: %s (open in any browser, works offline)\n",
                options.reportPath.c_str());
    return ReplaySession::kOk;
}

std::string ReplayOutputs::summaryText(const InsightResult& result) {
    if (!result.nodes.empty())
        return InsightSummary::table(result);
    std::string out;
    char line[512];
    snprintf(line, sizeof(line), "%-30s %14s %14s %8s %14s %14s\n", "node", "initial", "final",
             "changes", "min", "max");
    out += line;
    for (const auto& node : HostEnvironment::get().timeline().summary()) {
        snprintf(line, sizeof(line), "%-30s %14s %14s %8d %14s %14s\n", node.key.c_str(),
                 node.initial.c_str(), node.final.c_str(), node.changes,
                 node.numeric ? InsightSummary::number(node.min).c_str() : "-",
                 node.numeric ? InsightSummary::number(node.max).c_str() : "-");
        out += line;
    }
    // Where the device took a request other than asked: rounded to an available frequency, or
    // refused like a sysfs write.
    const auto deviceNotes = HostEnvironment::get().timeline().instants("device");
    if (!deviceNotes.empty()) {
        out += "\nrequested vs effective:\n";
        for (const auto& note : deviceNotes) {
            out += "  " + note.name + "\n";
        }
    }
    return out;
}

}  // namespace velmora
