#include "tools/insight/HtmlReport.h"

#include <algorithm>
#include <cstdio>
#include <sstream>

#include "host/record/Timeline.h"
#include "host/text/TextFile.h"
#include "tools/insight/InsightSummary.h"

namespace velmora {

namespace {

constexpr double kPlotWidth = 960;
constexpr double kPlotHeight = 150;
constexpr double kLeft = 90;  // room for the value labels
constexpr double kTop = 8;
constexpr const char* kColours[] = {"#1f6fb4", "#d9480f", "#2b8a3e", "#862e9c",
                                    "#e67700", "#0b7285", "#c2255c", "#5c940d"};

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

std::string num(double v) {
    char buf[32];
    snprintf(buf, sizeof(buf), "%.1f", v);
    return buf;
}

std::string label(double v) {
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

// One group's step plot: a path per node, spans shaded behind, the value range on the left.
void plot(std::ostream& out, const HtmlReport::Group& group, const InsightResult& result) {
    std::vector<const NodeInsight*> nodes;
    double lo = 0, hi = 0;
    bool first = true;
    for (const auto& key : group.keys) {
        const NodeInsight* node = result.node(key);
        if (node == nullptr || !node->numeric)
            continue;
        nodes.push_back(node);
        for (const auto& segment : node->segments) {
            double v = 0;
            parseNodeNumber(segment.value, &v);
            lo = first || v < lo ? v : lo;
            hi = first || v > hi ? v : hi;
            first = false;
        }
    }
    if (nodes.empty())
        return;
    if (hi == lo) {
        hi += 1;
        lo -= 1;
    }
    const double end = std::max<double>(1.0, static_cast<double>(result.endUs));
    auto x = [&](int64_t us) { return kLeft + (kPlotWidth - kLeft - 10) * (us / end); };
    auto y = [&](double v) { return kTop + (kPlotHeight - 2 * kTop) * (1 - (v - lo) / (hi - lo)); };
    out << "<h3>" + esc(group.title) + "</h3>\n<svg class=\"plot\" width=\"" + num(kPlotWidth) +
               "\" height=\"" + num(kPlotHeight) + "\" data-series=\"" +
               std::to_string(nodes.size()) + "\">\n";
    out << "<rect class=\"frame\" x=\"" + num(kLeft) + "\" y=\"" + num(kTop) + "\" width=\"" +
               num(kPlotWidth - kLeft - 10) + "\" height=\"" + num(kPlotHeight - 2 * kTop) +
               "\"/>\n";
    for (const auto& span : result.spans) {
        if (span.category == "probe" || span.category == "memlat")
            continue;  // too many and too short to shade; the probe plot shows them
        out << "<rect x=\"" + num(x(span.beginUs)) + "\" y=\"" + num(kTop) + "\" width=\"" +
                   num(std::max(1.0, x(span.endUs) - x(span.beginUs))) + "\" height=\"" +
                   num(kPlotHeight - 2 * kTop) + "\" fill=\"" + spanFill(span.category) +
                   "\"><title>" + esc(span.name) + "</title></rect>\n";
    }
    out << "<text x=\"4\" y=\"" + num(y(hi) + 4) + "\">" + label(hi) + "</text><text x=\"4\" y=\"" +
               num(y(lo)) + "\">" + label(lo) + "</text><text x=\"" + num(kPlotWidth - 60) +
               "\" y=\"" + num(kPlotHeight) + "\">" + label(result.endUs / 1e6) + " s</text>\n";
    for (size_t i = 0; i < nodes.size(); ++i) {
        // One step per change: written as it goes, a long replay's path is never one string.
        out << "<path class=\"series\" stroke=\"" << kColours[i % 8] << "\" d=\"";
        const auto& segments = nodes[i]->segments;
        for (size_t s = 0; s < segments.size(); ++s) {
            double v = 0;
            parseNodeNumber(segments[s].value, &v);
            const double from = x(std::min(segments[s].fromUs, result.endUs));
            const double to = x(s + 1 < segments.size() ? segments[s + 1].fromUs : result.endUs);
            out << (s == 0 ? "M" : "L") << num(from) << " " << num(y(v)) << "H" << num(to);
        }
        out << "\"><title>" + esc(nodes[i]->key) + "</title></path>\n";
    }
    out << "</svg>\n<p class=\"legend\">";
    for (size_t i = 0; i < nodes.size(); ++i) {
        out << "<span style=\"color:" + std::string(kColours[i % 8]) + "\">&#9632; " +
                   esc(nodes[i]->key) + "</span> ";
    }
    out << "</p>\n";
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
    "h1{font-size:20px}h2{font-size:16px;margin-top:24px}h3{font-size:13px;margin:10px 0 2px}"
    "svg.plot{display:block;background:#fff}svg .frame{fill:none;stroke:#bbb}"
    "svg .series{fill:none;stroke-width:2}svg text{font-size:11px;fill:#555}"
    ".legend{margin:2px 0 0 90px}table{border-collapse:collapse}"
    "td,th{border-bottom:1px solid #eee;padding:2px 8px;text-align:left;vertical-align:top}"
    ".bar{white-space:nowrap}.bar span{display:inline-block;height:9px;background:#1f6fb4;"
    "margin-right:6px}.warn{color:#b00}";

// Measures the plots once laid out, for the browser check: count, size, drawn length.
const char* kSelfCheck =
    "window.addEventListener('load',function(){var out=[];"
    "document.querySelectorAll('svg.plot').forEach(function(s){var r=s.getBoundingClientRect();"
    "var len=0;s.querySelectorAll('path.series').forEach(function(p){len+=p.getTotalLength();});"
    "out.push({x:r.left+window.scrollX,y:r.top+window.scrollY,w:r.width,h:r.height,"
    "series:s.querySelectorAll('path.series').length,length:len});});"
    "document.body.setAttribute('data-plots',JSON.stringify(out));});";

}  // namespace

const std::vector<HtmlReport::Group>& HtmlReport::groups() {
    static const std::vector<Group> kGroups = {
        {"CPU little cluster (kHz)", {"cpu.little.min", "cpu.little.max"}},
        {"CPU big cluster (kHz)", {"cpu.big.min", "cpu.big.max"}},
        {"GPU (Hz)", {"gpu.min", "gpu.max"}},
        {"DDR floor (Hz)", {"ddr.min"}},
        {"Thermal trip points (m\u00b0C)", {"ipa.switch_temp", "ipa.control_temp"}},
        {"Thermal sustainable power (mW)", {"ipa.sustainable_power"}},
        {"Scheduler groups (level)",
         {"sched.group.hmp", "sched.group.boost", "sched.group.vip", "sched.group.top_app",
          "sched.group.root", "sched.group.foreground", "sched.group.system_background",
          "sched.group.key_background", "sched.group.background"}},
        {"Probe (boosted threads)", {"probe.threads"}},
    };
    return kGroups;
}

std::string HtmlReport::html(const InsightResult& result) {
    std::ostringstream out;
    write(result, out);
    return out.str();
}

void HtmlReport::write(const InsightResult& result, std::ostream& out) {
    out << "<!DOCTYPE html>\n<html><head><meta charset=\"utf-8\"><title>velmora replay "
           "report</title>\n<style>" +
               std::string(kStyle) + "</style></head>\n<body>\n<h1>Replay report</h1>\n<p>" +
               num(result.endUs / 1000.0) + " ms of trace, " + std::to_string(result.callCount) +
               " calls. Shaded: <span style=\"background:" + spanFill("scene") +
               "\">scenes</span> <span style=\"background:" + spanFill("onoff") +
               "\">on/off commands</span> <span style=\"background:" + spanFill("action") +
               "\">timed actions</span>.</p>\n<h2>Left applied</h2>\n<ul>\n";
    for (const auto& warning : result.warnings) {
        out << "<li class=\"warn\">" + esc(warning.message) + "</li>\n";
    }
    if (result.warnings.empty())
        out << "<li>nothing</li>\n";
    out << "</ul>\n<h2>Nodes over time</h2>\n";
    for (const auto& group : groups()) {
        plot(out, group, result);
    }
    out << "<h2>Final values and who holds them</h2>\n<table class=\"held\">\n"
           "<tr><th>node</th><th>final</th><th>held by</th><th>time at value</th></tr>\n";
    for (const auto& node : result.nodes) {
        out << "<tr><td>" + esc(node.key) + "</td><td>" + esc(node.final) + "</td><td>" +
                   esc(node.heldBy) + "</td><td>" +
                   esc(InsightSummary::topResidency(node, result.endUs, 3)) + "</td></tr>\n";
    }
    out << "</table>\n<h2>Time at each value</h2>\n" + residencyBars(result);
    out << "<script>" + std::string(kSelfCheck) + "</script>\n</body></html>\n";
}

bool HtmlReport::write(const InsightResult& result, const std::string& path, std::string* error) {
    return TextFile::write(
        path, [&](std::ostream& file) { write(result, file); }, error);
}

}  // namespace velmora
