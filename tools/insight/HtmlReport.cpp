#include "tools/insight/HtmlReport.h"

#include <cstdio>
#include <sstream>

#include "host/text/TextFile.h"
#include "tools/insight/InsightSummary.h"
#include "tools/insight/ReportScripts.h"

namespace velmora {

namespace {

std::string esc(const std::string& in) {
    std::string out;
    for (char c : in) {
        switch (c) {
            case '&':
                out += "&amp;";
                break;
            case '<':
                out += "&lt;";
                break;
            case '>':
                out += "&gt;";
                break;
            case '"':
                out += "&quot;";
                break;
            default:
                out += c;
        }
    }
    return out;
}

// A JavaScript string literal that is safe inside a <script> element.
std::string jsString(const std::string& in) {
    std::string out = "\"";
    for (unsigned char c : in) {
        if (c == '"' || c == '\\') {
            out += '\\';
            out += static_cast<char>(c);
        } else if (c < 0x20 || c == '<' || c == '>' || c == '&') {
            char buf[8];
            snprintf(buf, sizeof(buf), "\\u%04x", c);
            out += buf;
        } else {
            out += static_cast<char>(c);
        }
    }
    return out + "\"";
}

std::string num(double v) {
    char buf[32];
    snprintf(buf, sizeof(buf), "%.1f", v);
    return buf;
}

std::string exact(double v) {
    char buf[32];
    snprintf(buf, sizeof(buf), "%.10g", v);
    return buf;
}

std::string spanFill(const std::string& category) {
    if (category == "scene")
        return "rgba(134,46,156,0.13)";
    if (category == "onoff")
        return "rgba(230,119,0,0.13)";
    return "rgba(11,114,133,0.10)";  // timed actions
}

// The shaded spans, for the page's script: [begin s, end s, fill, name].
void spans(std::ostream& out, const InsightResult& result) {
    out << "<script>velmoraReport.spans=[";
    bool first = true;
    for (const auto& span : result.spans) {
        if (span.category == "probe" || span.category == "memlat")
            continue;  // too many and too short to shade; the probe plot shows them
        out << (first ? "" : ",") << "[" << exact(span.beginUs / 1e6) << ","
            << exact(span.endUs / 1e6) << "," << jsString(spanFill(span.category)) << ","
            << jsString(span.name) << "]";
        first = false;
    }
    out << "];</script>\n";
}

// One plot: its title, the box the script draws into, its legend line, and its data.
void plot(std::ostream& out, size_t index, const ReportPlot& plot, const InsightResult& result) {
    const std::string id = std::to_string(index);
    out << "<h3>" + esc(plot.title()) + " (" + esc(plot.unit()) +
               ")</h3>\n<div class=\"plot\" id=\"plot" + id + "\" data-series=\"" +
               std::to_string(plot.series().size()) + "\"></div><div class=\"legend\" id=\"legend" +
               id + "\"></div>\n";
    out << "<script>velmoraReport.plot(" + id + ",{unit:" + jsString(plot.unit()) + ",labels:[";
    for (size_t i = 0; i < plot.series().size(); ++i) {
        out << (i ? "," : "") << jsString(plot.series()[i].name);
    }
    out << "],colors:[";
    for (size_t i = 0; i < plot.series().size(); ++i) {
        out << (i ? "," : "") << jsString(ReportPlot::colour(i));
    }
    const auto range = plot.valueRange();
    out << "],range:[" << exact(range.first) << "," << exact(range.second) << "]},";
    plot.writeRows(out, result.endUs);
    out << ");</script>\n";
}

std::string residencyBars(const InsightResult& result) {
    std::string out = "<table class=\"residency\">\n";
    for (const auto& node : result.nodes) {
        if (!node.numeric || node.residencyUs.size() < 2)
            continue;  // a node that never moved says nothing here
        out += "<tr><th>" + esc(node.key) + "</th><td>";
        for (size_t i = 0; i < node.residencyUs.size() && i < 6; ++i) {
            const double share =
                result.endUs > 0 ? 100.0 * node.residencyUs[i].second / result.endUs : 0;
            out += "<div class=\"bar\"><span style=\"width:" + num(share * 3) + "px\"></span>" +
                   esc(node.residencyUs[i].first) + " " + num(share) + "%</div>";
        }
        out += "</td></tr>\n";
    }
    return out + "</table>\n";
}

const char* kStyle =
    "body{font:13px sans-serif;margin:16px;color:#222;background:#fff}"
    "h1{font-size:20px}h2{font-size:16px;margin-top:24px}h3{font-size:13px;margin:14px 0 2px}"
    ".plot{width:980px;height:190px}.legend{min-height:16px;margin:2px 0 0 70px;font-size:12px}"
    ".legend span{margin-right:6px}.dygraph-axis-label{font-size:11px;color:#555}"
    ".dygraph-label{font-size:11px;color:#333}table{border-collapse:collapse}"
    "td,th{border-bottom:1px solid #eee;padding:2px 8px;text-align:left;vertical-align:top}"
    ".bar{white-space:nowrap}.bar span{display:inline-block;height:9px;background:#1f77b4;"
    "margin-right:6px}.warn{color:#b00}";

}  // namespace

const std::vector<HtmlReport::Group>& HtmlReport::groups() {
    static const std::vector<Group> kGroups = {
        // The device writes CPU frequencies in kHz, GPU and DDR ones in Hz, temperatures in
        // millidegrees.
        {"CPU little cluster", "MHz", 1e3, {"cpu.little.min", "cpu.little.max"}},
        {"CPU big cluster", "MHz", 1e3, {"cpu.big.min", "cpu.big.max"}},
        {"GPU", "MHz", 1e6, {"gpu.min", "gpu.max"}},
        {"DDR floor", "MHz", 1e6, {"ddr.min"}},
        {"Thermal trip points", "\u00b0C", 1e3, {"ipa.switch_temp", "ipa.control_temp"}},
        {"Thermal sustainable power", "mW", 1, {"ipa.sustainable_power"}},
        {"Scheduler groups",
         "level",
         1,
         {"sched.group.hmp", "sched.group.boost", "sched.group.vip", "sched.group.top_app",
          "sched.group.root", "sched.group.foreground", "sched.group.system_background",
          "sched.group.key_background", "sched.group.background"}},
        {"Probe", "boosted threads", 1, {"probe.threads"}},
    };
    return kGroups;
}

std::vector<ReportPlot> HtmlReport::plots(const InsightResult& result) {
    std::vector<ReportPlot> out;
    for (const auto& group : groups()) {
        ReportPlot plot =
            ReportPlot::fromNodes(group.title, group.unit, group.divisor, group.keys, result);
        if (!plot.empty())
            out.push_back(std::move(plot));
    }
    return out;
}

std::string HtmlReport::html(const InsightResult& result) {
    std::ostringstream out;
    write(result, out);
    return out.str();
}

void HtmlReport::write(const InsightResult& result, std::ostream& out) {
    write(result, plots(result), out);
}

void HtmlReport::write(const InsightResult& result, const std::vector<ReportPlot>& plots,
                       std::ostream& out) {
    out << "<!DOCTYPE html>\n<html><head><meta charset=\"utf-8\"><title>velmora replay "
           "report</title>\n<style>"
        << ReportScripts::plottingStyle() << kStyle << "</style>\n<script>"
        << ReportScripts::plotting() << "</script>\n<script>" << ReportScripts::page()
        << "</script>\n</head>\n<body>\n<h1>Replay report</h1>\n<p>" + num(result.endUs / 1000.0) +
               " ms of trace, " + std::to_string(result.callCount) +
               " calls. Shaded: <span style=\"background:" + spanFill("scene") +
               "\">scenes</span> <span style=\"background:" + spanFill("onoff") +
               "\">on/off commands</span> <span style=\"background:" + spanFill("action") +
               "\">timed actions</span>. Drag across a plot to zoom into a stretch of the trace "
               "(every "
               "plot follows), double-click to zoom out; the line under a plot shows the values "
               "under the pointer.</p>\n<h2>Left applied</h2>\n<ul>\n";
    for (const auto& warning : result.warnings) {
        out << "<li class=\"warn\">" + esc(warning.message) + "</li>\n";
    }
    if (result.warnings.empty())
        out << "<li>nothing</li>\n";
    out << "</ul>\n<h2>Nodes over time</h2>\n";
    spans(out, result);
    for (size_t i = 0; i < plots.size(); ++i) {
        plot(out, i, plots[i], result);
    }
    out << "<h2>Final values and who holds them</h2>\n<table class=\"held\">\n"
           "<tr><th>node</th><th>final</th><th>held by</th><th>time at value</th></tr>\n";
    for (const auto& node : result.nodes) {
        out << "<tr><td>" + esc(node.key) + "</td><td>" + esc(node.final) + "</td><td>" +
                   esc(node.heldBy) + "</td><td>" +
                   esc(InsightSummary::topResidency(node, result.endUs, 3)) + "</td></tr>\n";
    }
    out << "</table>\n<h2>Time at each value</h2>\n" + residencyBars(result);
    out << "</body></html>\n";
}

bool HtmlReport::write(const InsightResult& result, const std::string& path, std::string* error) {
    return write(result, plots(result), path, error);
}

bool HtmlReport::write(const InsightResult& result, const std::vector<ReportPlot>& plots,
                       const std::string& path, std::string* error) {
    return TextFile::write(
        path, [&](std::ostream& file) { write(result, plots, file); }, error);
}

}  // namespace velmora
