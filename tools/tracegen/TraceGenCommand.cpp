#include "tools/tracegen/TraceGenCommand.h"

#include <cmath>
#include <cstdlib>
#include <fstream>

#include "tools/common/CommandLine.h"
#include "tools/tracegen/TraceGenerator.h"

namespace velmora {

namespace {

constexpr const char* kProgram = "velmora-gen-trace";

constexpr const char* kUsage =
    "usage: velmora-gen-trace [options]\n"
    "  --seed N              the seed (default 1)\n"
    "  --hour                an hour of device use, about 120,000 calls (the benchmark's)\n"
    "  --start-ms MS         time of the first call (default 100)\n"
    "  --duration-ms MS      no call starts later (default 3000)\n"
    "  --mean-gap-ms MS      mean time between two calls (default 40)\n"
    "  --probe-share F       share of calls that are probe events (default 0.15)\n"
    "  --no-probes           the same as --probe-share 0\n"
    "  --sleep-share F       share of lines that are sleeps (default 0.03)\n"
    "  --backwards-share F   share of calls stamped below the time reached (default 0.01)\n"
    "  --reload-share F      share of calls that are reloads (default 0.002)\n"
    "  --odd-share F         share of calls the server refuses (default 0.005)\n"
    "  --margin-ms MS        keep every call this far from the deadlines the generator\n"
    "                        foresees, and end past the last (default 0: no margin)\n"
    "  --load-every-ms MS    a load line for the clusters and the GPU this often, at the\n"
    "                        time reached (default 0: none)\n"
    "  -o FILE               write the trace there (default: standard output)\n"
    "  --help                print this help and exit\n"
    "  --version             print the version and exit\n"
    "An option's value follows it (--seed 4) or is joined by '=' (--seed=4). A summary goes\n"
    "to standard error. Exit status: 0 written, 1 the trace could not be written, 2 a usage\n"
    "error.\n";

bool number(const std::string& text, double* value) {
    char* end = nullptr;
    *value = strtod(text.c_str(), &end);
    return end != text.c_str() && *end == '\0' && std::isfinite(*value) && *value >= 0;
}

uint32_t ppm(double share) {
    return static_cast<uint32_t>(std::llround(std::min(share, 1.0) * 1e6));
}

int64_t ms(double value) {
    return static_cast<int64_t>(value);
}

// Where each numeric option lands in the generator's options.
struct NumberOption {
    const char* name;
    void (*set)(TraceGenOptions& options, double value, const std::string& text);
};

const NumberOption kNumbers[] = {
    {"--seed", [](TraceGenOptions& o, double,
                  const std::string& t) { o.seed = strtoull(t.c_str(), nullptr, 0); }},
    {"--start-ms", [](TraceGenOptions& o, double v, const std::string&) { o.startMs = ms(v); }},
    {"--duration-ms",
     [](TraceGenOptions& o, double v, const std::string&) { o.durationMs = ms(v); }},
    {"--mean-gap-ms",
     [](TraceGenOptions& o, double v, const std::string&) { o.meanGapMs = ms(v); }},
    {"--probe-share",
     [](TraceGenOptions& o, double v, const std::string&) { o.probePpm = ppm(v); }},
    {"--sleep-share",
     [](TraceGenOptions& o, double v, const std::string&) { o.sleepPpm = ppm(v); }},
    {"--backwards-share",
     [](TraceGenOptions& o, double v, const std::string&) { o.backwardsPpm = ppm(v); }},
    {"--reload-share",
     [](TraceGenOptions& o, double v, const std::string&) { o.reloadPpm = ppm(v); }},
    {"--odd-share", [](TraceGenOptions& o, double v, const std::string&) { o.oddPpm = ppm(v); }},
    {"--margin-ms", [](TraceGenOptions& o, double v, const std::string&) { o.marginMs = ms(v); }},
    {"--load-every-ms",
     [](TraceGenOptions& o, double v, const std::string&) { o.loadEveryMs = ms(v); }},
};

}  // namespace

int TraceGenCommand::run(const std::vector<std::string>& args, std::ostream& out,
                         std::ostream& err) {
    CommandLine line(kProgram, kUsage);
    line.flag("--hour").flag("--no-probes").value("-o");
    for (const NumberOption& option : kNumbers) {
        line.value(option.name);
    }
    line.excludes("--no-probes", "--probe-share");
    if (!line.parse(args, out, err)) {
        return line.status();
    }
    if (!line.operands().empty()) {
        err << line.problem("unexpected argument '" + line.operands().front() + "'");
        return kUsageError;
    }
    TraceGenOptions options;
    // --hour sets the defaults of the hour; the other options change them.
    if (line.has("--hour")) {
        options = TraceGenOptions::hour(options.seed, options.probePpm);
    }
    if (line.has("--no-probes")) {
        options.probePpm = 0;
    }
    for (const NumberOption& option : kNumbers) {
        if (!line.has(option.name)) {
            continue;
        }
        const std::string text = line.get(option.name);
        double v = 0;
        if (!number(text, &v)) {
            err << line.problem(std::string(option.name) + ": not a number: '" + text + "'");
            return kUsageError;
        }
        if (std::string(option.name) == "--mean-gap-ms" && v < 1) {
            err << line.problem("--mean-gap-ms is at least 1, not '" + text + "'");
            return kUsageError;
        }
        option.set(options, v, text);
    }
    TraceGenStats stats;
    const std::string trace = TraceGenerator::generate(options, &stats);
    const std::string outPath = line.get("-o");
    bool written = false;
    if (outPath.empty()) {
        written = static_cast<bool>(out.write(trace.data(), trace.size()).flush());
    } else {
        std::ofstream file(outPath, std::ios::trunc);
        file.write(trace.data(), trace.size());
        file.close();
        written = static_cast<bool>(file);
    }
    if (!written) {
        err << kProgram << ": cannot write " << (outPath.empty() ? "standard output" : outPath)
            << "\n";
        return kNotWritten;
    }
    err << kProgram << ": " << stats.hostCalls << " host calls (" << stats.probeEvents
        << " probe events), " << stats.sleeps << " sleeps, " << stats.backwards
        << " stamped in the past, " << stats.lines << " lines, ends at " << stats.endMs << " ms\n";
    return kOk;
}

}  // namespace velmora
