// velmora-synth: writes seeded, plausible sessions of the example device (SessionSynth.h) for
// fleet runs, benchmarks and the demo.
#include <sys/stat.h>

#include <cerrno>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

#include "tools/synth/SessionSynth.h"

namespace {

void usage(FILE* to) {
    fputs(
        "usage: velmora-synth [options] -o DIR\n"
        "  --seed N              seed of the first session; session i has seed N+i (default 1)\n"
        "  --count N             number of sessions (default 1)\n"
        "  --duration-ms MS      length of each session (default 600000, ten minutes)\n"
        "  --load-period-ms MS   time between two load lines (default 1000)\n"
        "  --no-load             without load lines (how busy each frequency domain is)\n"
        "  -o DIR                write DIR/session-0001.trace, ... (made if missing)\n"
        "  --version             print the version\n",
        to);
}

bool count(const char* text, long long* value) {
    char* end = nullptr;
    errno = 0;
    *value = strtoll(text, &end, 0);
    return end != text && *end == '\0' && errno == 0 && *value >= 0;
}

int usageError(const std::string& message) {
    fprintf(stderr, "velmora-synth: %s\n", message.c_str());
    usage(stderr);
    return 2;
}

}  // namespace

int main(int argc, char** argv) {
    velmora::SessionOptions options;
    long long sessions = 1;
    std::string outDir;
    for (int i = 1; i < argc; ++i) {
        const std::string arg = argv[i];
        if (arg == "--help" || arg == "-h") {
            usage(stdout);
            return 0;
        }
        if (arg == "--version") {
            printf("velmora-synth %s\n", VELMORA_VERSION);
            return 0;
        }
        if (arg == "--no-load") {
            options.load = false;
            continue;
        }
        if (i + 1 >= argc) {
            return usageError(arg + " needs a value (or is unknown)");
        }
        const char* text = argv[++i];
        if (arg == "-o") {
            outDir = text;
            continue;
        }
        if (arg != "--seed" && arg != "--count" && arg != "--duration-ms" &&
            arg != "--load-period-ms") {
            return usageError("unknown option " + arg);
        }
        long long v = 0;
        if (!count(text, &v)) {
            return usageError(arg + ": not a count: '" + text + "'");
        }
        if (arg == "--seed") {
            options.seed = static_cast<uint64_t>(v);
        } else if (arg == "--count") {
            sessions = v;
        } else if (arg == "--duration-ms") {
            options.durationMs = v;
        } else if (arg == "--load-period-ms" && v > 0) {
            options.loadPeriodMs = v;
        } else {
            return usageError(arg + ": must be positive");
        }
    }
    if (outDir.empty()) {
        return usageError("no output directory (-o DIR)");
    }
    if (mkdir(outDir.c_str(), 0777) != 0 && errno != EEXIST) {
        fprintf(stderr, "velmora-synth: cannot make %s: %s\n", outDir.c_str(), strerror(errno));
        return 2;
    }
    const uint64_t first = options.seed;
    long long calls = 0;
    for (long long i = 0; i < sessions; ++i) {
        options.seed = first + static_cast<uint64_t>(i);
        velmora::SessionStats stats;
        const std::string text = velmora::SessionSynth::generate(options, &stats);
        char name[48];
        snprintf(name, sizeof(name), "/session-%04lld.trace", i + 1);
        const std::string path = outDir + name;
        FILE* out = fopen(path.c_str(), "w");
        if (out == nullptr || fwrite(text.data(), 1, text.size(), out) != text.size() ||
            fclose(out) != 0) {
            fprintf(stderr, "velmora-synth: cannot write %s\n", path.c_str());
            return 2;
        }
        calls += stats.hostCalls;
    }
    fprintf(stderr, "velmora-synth: %lld sessions of %lld ms in %s, %lld host calls\n", sessions,
            static_cast<long long>(options.durationMs), outDir.c_str(), calls);
    return 0;
}
