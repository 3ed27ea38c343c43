// velmora-gen-trace: writes a seeded random trace for velmora-replay (TraceGenerator.h), to
// reproduce a property-test seed or to make a long trace for the benchmarks. Not installed.
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

#include "tools/tracegen/TraceGenerator.h"

namespace {

void usage(FILE* to) {
    fputs(
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
        "  --version             print the version and exit\n"
        "A summary goes to standard error. Exit status: 0 written, 1 the trace could not be\n"
        "written, 2 a usage error.\n",
        to);
}

bool number(const char* text, double* value) {
    char* end = nullptr;
    *value = strtod(text, &end);
    return end != text && *end == '\0' && std::isfinite(*value) && *value >= 0;
}

// Exit status of a command line that cannot be run (the same for every velmora tool).
constexpr int kUsageError = 2;

uint32_t ppm(double share) {
    return static_cast<uint32_t>(std::llround(std::min(share, 1.0) * 1e6));
}

}  // namespace

int main(int argc, char** argv) {
    velmora::TraceGenOptions options;
    // --hour sets the defaults of the hour; options given after it change them.
    for (int i = 1; i < argc; ++i) {
        if (strcmp(argv[i], "--hour") == 0) {
            options = velmora::TraceGenOptions::hour(options.seed, options.probePpm);
        }
    }
    std::string outPath;
    for (int i = 1; i < argc; ++i) {
        const std::string arg = argv[i];
        if (arg == "--help" || arg == "-h") {
            usage(stdout);
            return 0;
        }
        if (arg == "--version") {
            printf("velmora-gen-trace %s\n", VELMORA_VERSION);
            return 0;
        }
        if (arg == "--hour") {
            continue;
        }
        if (arg == "--no-probes") {
            options.probePpm = 0;
            continue;
        }
        if (i + 1 >= argc) {
            fprintf(stderr, "velmora-gen-trace: %s needs a value (or is unknown)\n", arg.c_str());
            usage(stderr);
            return kUsageError;
        }
        const char* text = argv[++i];
        if (arg == "-o") {
            outPath = text;
            continue;
        }
        double v = 0;
        if (!number(text, &v)) {
            fprintf(stderr, "velmora-gen-trace: %s: not a number: '%s'\n", arg.c_str(), text);
            return kUsageError;
        }
        if (arg == "--seed") {
            options.seed = strtoull(text, nullptr, 0);
        } else if (arg == "--start-ms") {
            options.startMs = static_cast<int64_t>(v);
        } else if (arg == "--duration-ms") {
            options.durationMs = static_cast<int64_t>(v);
        } else if (arg == "--mean-gap-ms") {
            if (v < 1) {
                fprintf(stderr, "velmora-gen-trace: --mean-gap-ms is at least 1, not '%s'\n", text);
                return kUsageError;
            }
            options.meanGapMs = static_cast<int64_t>(v);
        } else if (arg == "--probe-share") {
            options.probePpm = ppm(v);
        } else if (arg == "--sleep-share") {
            options.sleepPpm = ppm(v);
        } else if (arg == "--backwards-share") {
            options.backwardsPpm = ppm(v);
        } else if (arg == "--reload-share") {
            options.reloadPpm = ppm(v);
        } else if (arg == "--odd-share") {
            options.oddPpm = ppm(v);
        } else if (arg == "--margin-ms") {
            options.marginMs = static_cast<int64_t>(v);
        } else if (arg == "--load-every-ms") {
            options.loadEveryMs = static_cast<int64_t>(v);
        } else {
            fprintf(stderr, "velmora-gen-trace: unknown option %s\n", arg.c_str());
            usage(stderr);
            return kUsageError;
        }
    }
    velmora::TraceGenStats stats;
    const std::string trace = velmora::TraceGenerator::generate(options, &stats);
    FILE* out = outPath.empty() ? stdout : fopen(outPath.c_str(), "w");
    if (out == nullptr || fwrite(trace.data(), 1, trace.size(), out) != trace.size() ||
        (out != stdout && fclose(out) != 0)) {
        fprintf(stderr, "velmora-gen-trace: cannot write %s\n", outPath.c_str());
        return 1;
    }
    fprintf(stderr,
            "velmora-gen-trace: %lld host calls (%lld probe events), %lld sleeps, %lld stamped "
            "in the past, %lld lines, ends at %lld ms\n",
            static_cast<long long>(stats.hostCalls), static_cast<long long>(stats.probeEvents),
            static_cast<long long>(stats.sleeps), static_cast<long long>(stats.backwards),
            static_cast<long long>(stats.lines), static_cast<long long>(stats.endMs));
    return 0;
}
