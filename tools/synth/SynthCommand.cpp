#include "tools/synth/SynthCommand.h"

#include <sys/stat.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>

#include "tools/common/CommandLine.h"
#include "tools/synth/SessionSynth.h"

namespace velmora {

namespace {

constexpr const char* kProgram = "velmora-synth";

constexpr const char* kUsage =
    "usage: velmora-synth [options] -o DIR\n"
    "  --seed N              seed of the first session; session i has seed N+i (default 1)\n"
    "  --count N             number of sessions (default 1)\n"
    "  --duration-ms MS      length of each session (default 600000, ten minutes)\n"
    "  --load-period-ms MS   time between two load lines (default 1000)\n"
    "  --no-load             without load lines (how busy each frequency domain is)\n"
    "  -o DIR                write DIR/session-0001.trace, ... (made if missing)\n"
    "  --help                print this help and exit\n"
    "  --version             print the version and exit\n"
    "An option's value follows it (--count 8) or is joined by '=' (--count=8).\n"
    "Exit status: 0 written, 2 a usage error or a session that cannot be written.\n";

bool count(const std::string& text, long long* value) {
    char* end = nullptr;
    errno = 0;
    *value = strtoll(text.c_str(), &end, 0);
    return end != text.c_str() && *end == '\0' && errno == 0 && *value >= 0;
}

// Say a usage error with the whole usage, as the missing -o DIR does.
int refuse(std::ostream& err, const std::string& message) {
    err << kProgram << ": " << message << "\n" << kUsage;
    return SynthCommand::kUsageError;
}

}  // namespace

int SynthCommand::run(const std::vector<std::string>& args, std::ostream& out, std::ostream& err) {
    CommandLine line(kProgram, kUsage);
    line.value("--seed")
        .value("--count")
        .value("--duration-ms")
        .value("--load-period-ms")
        .flag("--no-load")
        .value("-o")
        .excludes("--no-load", "--load-period-ms");
    if (!line.parse(args, out, err)) {
        return line.status();
    }
    if (!line.operands().empty()) {
        err << line.problem("unexpected argument '" + line.operands().front() + "'");
        return kUsageError;
    }
    SessionOptions options;
    options.load = !line.has("--no-load");
    long long sessions = 1;
    for (const char* name : {"--seed", "--count", "--duration-ms", "--load-period-ms"}) {
        if (!line.has(name)) {
            continue;
        }
        const std::string text = line.get(name);
        long long v = 0;
        if (!count(text, &v)) {
            err << line.problem(std::string(name) + ": not a count: '" + text + "'");
            return kUsageError;
        }
        const std::string option = name;
        if (option == "--seed") {
            options.seed = static_cast<uint64_t>(v);
        } else if (option == "--count") {
            sessions = v;
        } else if (option == "--duration-ms") {
            options.durationMs = v;
        } else if (v > 0) {
            options.loadPeriodMs = v;
        } else {
            err << line.problem(option + ": must be positive");
            return kUsageError;
        }
    }
    const std::string outDir = line.get("-o");
    if (outDir.empty()) {
        return refuse(err, "no output directory (-o DIR)");
    }
    if (mkdir(outDir.c_str(), 0777) != 0 && errno != EEXIST) {
        err << kProgram << ": cannot make " << outDir << ": " << strerror(errno) << "\n";
        return kNotWritten;
    }
    const uint64_t first = options.seed;
    long long calls = 0;
    for (long long i = 0; i < sessions; ++i) {
        options.seed = first + static_cast<uint64_t>(i);
        SessionStats stats;
        const std::string text = SessionSynth::generate(options, &stats);
        char name[48];
        snprintf(name, sizeof(name), "/session-%04lld.trace", i + 1);
        const std::string path = outDir + name;
        std::ofstream file(path, std::ios::trunc);
        file.write(text.data(), text.size());
        file.close();
        if (!file) {
            err << kProgram << ": cannot write " << path << "\n";
            return kNotWritten;
        }
        calls += stats.hostCalls;
    }
    err << kProgram << ": " << sessions << " sessions of " << options.durationMs << " ms in "
        << outDir << ", " << calls << " host calls\n";
    return kOk;
}

}  // namespace velmora
