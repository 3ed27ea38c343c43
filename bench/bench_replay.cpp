// velmora-replay --fast as a user runs it: the real program in a child process on a generated
// hour of device use (tools/tracegen, about 120,000 host calls), with 15 % probe events and with
// none (the floor: no hand-over to the library's probe worker). Each trace is replayed on an
// idle machine and with one CPU-bound process beside it, as a plain `--fast` replay writes it
// (the summary). On the idle machine also the probe hour with the timeline and the event log
// written ("probes+files": the server's trace tracks and per-call records, which cost a plain
// replay nothing), and the hour with a load line every 100 ms ("probes+load"), which the energy
// model reads. Measured per run: wall time from fork to exit, host calls per second, the child's
// CPU time (user + system, from wait4) per call and its largest resident set (ru_maxrss). Medians
// of the repetitions are printed and written as JSON for scripts/bench, which sets them against
// the targets.
//
//   velmora_bench_replay [--repetitions N] [--out FILE.json] [--replay PATH] [--seed N]
//
// Scratch files (traces, device root, timeline, event log) go to a directory on /dev/shm.
#include <signal.h>
#include <stdlib.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include "tools/tracegen/TraceGenerator.h"

namespace {

struct Run {
    double wallS = 0;
    double cpuS = 0;
    long maxRssKb = 0;
    long calls = 0;
};

struct Case {
    std::string load;   // "idle" or "loaded"
    std::string trace;  // "probes", "no-probes", "probes+files" or "probes+load"
    std::vector<Run> runs;
};

std::string gScratch;

double median(std::vector<double> values) {
    std::sort(values.begin(), values.end());
    const size_t n = values.size();
    return n == 0 ? 0 : n % 2 == 1 ? values[n / 2] : (values[n / 2 - 1] + values[n / 2]) / 2;
}

// The host calls the replay reports: "<N> host calls, ..." after the calls.
long hostCalls(const std::string& outPath) {
    std::ifstream out(outPath);
    for (std::string line; std::getline(out, line);) {
        const size_t at = line.find(" host calls, ");
        if (at != std::string::npos) {
            return atol(line.c_str());
        }
    }
    return -1;
}

bool replayOnce(const std::string& replay, const std::string& trace, bool files, Run* run) {
    const std::string out = gScratch + "/replay-stdout.txt";
    std::vector<std::string> args = {replay,
                                     "--fast",
                                     "--quiet",
                                     "--config-dir",
                                     std::string(VELMORA_SOURCE_DIR) + "/examples",
                                     "--root",
                                     gScratch + "/device"};
    if (files) {
        args.insert(args.end(), {"--timeline", gScratch + "/timeline.json", "--event-log",
                                 gScratch + "/events.log"});
    }
    args.push_back(trace);
    std::vector<char*> argv;
    for (const std::string& arg : args) {
        argv.push_back(const_cast<char*>(arg.c_str()));
    }
    argv.push_back(nullptr);
    fflush(stdout);  // or the child's freopen writes what is buffered a second time
    const auto start = std::chrono::steady_clock::now();
    const pid_t pid = fork();
    if (pid == 0) {
        // The server's log goes to stderr: dropped, as the per-call lines are (--quiet).
        if (freopen(out.c_str(), "w", stdout) == nullptr ||
            freopen("/dev/null", "w", stderr) == nullptr) {
            _exit(127);
        }
        execv(argv[0], argv.data());
        _exit(127);
    }
    int status = 0;
    struct rusage usage;
    if (pid < 0 || wait4(pid, &status, 0, &usage) != pid) {
        perror("velmora_bench_replay: fork/wait4");
        return false;
    }
    run->wallS = std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
    if (!WIFEXITED(status) || WEXITSTATUS(status) != 0) {
        fprintf(stderr, "velmora_bench_replay: %s %s failed (status %d)\n", replay.c_str(),
                trace.c_str(), status);
        return false;
    }
    run->cpuS = usage.ru_utime.tv_sec + usage.ru_utime.tv_usec / 1e6 + usage.ru_stime.tv_sec +
                usage.ru_stime.tv_usec / 1e6;
    run->maxRssKb = usage.ru_maxrss;
    run->calls = hostCalls(out);
    return run->calls > 0;
}

// One CPU-bound process beside the replay; killed by the caller.
pid_t startBusyLoop() {
    fflush(stdout);
    const pid_t pid = fork();
    if (pid == 0) {
        for (volatile uint64_t spin = 0;; spin = spin + 1) {
        }
    }
    return pid;
}

std::string writeTrace(const std::string& name, uint64_t seed, uint32_t probePpm,
                       int64_t loadEveryMs = 0) {
    const std::string path = gScratch + "/" + name + ".trace";
    velmora::TraceGenStats stats;
    velmora::TraceGenOptions options = velmora::TraceGenOptions::hour(seed, probePpm);
    options.loadEveryMs = loadEveryMs;
    std::ofstream(path) << velmora::TraceGenerator::generate(options, &stats);
    printf("%s: %lld host calls, %lld probe events, %lld load lines, %.0f s of trace time\n",
           path.c_str(), static_cast<long long>(stats.hostCalls),
           static_cast<long long>(stats.probeEvents), static_cast<long long>(stats.loadLines),
           stats.endMs / 1000.0);
    return path;
}

void writeJson(const std::string& path, const std::vector<Case>& cases) {
    FILE* out = fopen(path.c_str(), "w");
    if (out == nullptr) {
        perror(path.c_str());
        return;
    }
    fprintf(out, "{\"cases\": [\n");
    for (size_t i = 0; i < cases.size(); ++i) {
        const Case& c = cases[i];
        std::vector<double> rate, cpuUs, rssMb, wall;
        long calls = 0;
        for (const Run& run : c.runs) {
            rate.push_back(run.calls / run.wallS);
            cpuUs.push_back(run.cpuS * 1e6 / run.calls);
            rssMb.push_back(run.maxRssKb / 1024.0);
            wall.push_back(run.wallS);
            calls = run.calls;
        }
        fprintf(out,
                "  {\"load\": \"%s\", \"trace\": \"%s\", \"runs\": %zu, \"calls\": %ld, "
                "\"wall_s\": %.3f, \"calls_per_s\": %.0f, \"cpu_us_per_call\": %.2f, "
                "\"max_rss_mb\": %.1f}%s\n",
                c.load.c_str(), c.trace.c_str(), c.runs.size(), calls, median(wall), median(rate),
                median(cpuUs), median(rssMb), i + 1 < cases.size() ? "," : "");
    }
    fprintf(out, "]}\n");
    fclose(out);
}

}  // namespace

int main(int argc, char** argv) {
    int repetitions = 3;
    uint64_t seed = 1;
    std::string outPath = "replay.json";
    std::string replay = VELMORA_REPLAY_PATH;
    for (int i = 1; i + 1 < argc; i += 2) {
        const std::string arg = argv[i];
        if (arg == "--repetitions") {
            repetitions = std::max(1, atoi(argv[i + 1]));
        } else if (arg == "--out") {
            outPath = argv[i + 1];
        } else if (arg == "--replay") {
            replay = argv[i + 1];
        } else if (arg == "--seed") {
            seed = strtoull(argv[i + 1], nullptr, 0);
        } else {
            fprintf(stderr,
                    "usage: velmora_bench_replay [--repetitions N] [--out FILE.json] "
                    "[--replay PATH] [--seed N]\n");
            return 2;
        }
    }
    char dir[] = "/dev/shm/velmora-bench-replay-XXXXXX";
    if (mkdtemp(dir) == nullptr) {
        perror("mkdtemp");
        return 2;
    }
    gScratch = dir;
    const std::string probes = writeTrace("hour-probes", seed, 150000);
    const std::string none = writeTrace("hour-no-probes", seed, 0);
    const std::string withLoad = writeTrace("hour-probes-load", seed, 150000, 100);
    auto traceOf = [&](const std::string& trace) {
        return trace == "no-probes" ? none : trace == "probes+load" ? withLoad : probes;
    };

    std::vector<Case> cases = {{"idle", "probes", {}},
                               {"idle", "no-probes", {}},
                               {"idle", "probes+files", {}},
                               {"idle", "probes+load", {}},
                               {"loaded", "probes", {}},
                               {"loaded", "no-probes", {}}};
    const size_t blockStart[] = {0, 4, 6};
    bool ok = true;
    for (size_t block = 0; block < 2 && ok; ++block) {
        const pid_t busy = block == 1 ? startBusyLoop() : -1;
        // Alternately, so that a change of machine load meets every case of the block.
        for (int rep = 0; rep < repetitions && ok; ++rep) {
            for (size_t c = blockStart[block]; c < blockStart[block + 1] && ok; ++c) {
                Run run;
                ok = replayOnce(replay, traceOf(cases[c].trace), cases[c].trace == "probes+files",
                                &run);
                cases[c].runs.push_back(run);
                printf(
                    "%-6s %-12s %7ld calls in %6.3f s: %8.0f calls/s, %6.2f us CPU per call, "
                    "%6.1f MB resident\n",
                    cases[c].load.c_str(), cases[c].trace.c_str(), run.calls, run.wallS,
                    run.calls / run.wallS, run.cpuS * 1e6 / std::max(1L, run.calls),
                    run.maxRssKb / 1024.0);
                fflush(stdout);
            }
        }
        if (busy > 0) {
            kill(busy, SIGKILL);
            waitpid(busy, nullptr, 0);
        }
    }
    if (ok) {
        writeJson(outPath, cases);
    }
    const std::string cleanup = "rm -rf '" + gScratch + "'";
    if (system(cleanup.c_str()) != 0) {
        fprintf(stderr, "velmora_bench_replay: could not remove %s\n", gScratch.c_str());
    }
    return ok ? 0 : 1;
}
