// The host layer's own cost, each next to its floor in the same run:
// - an event that writes 4 device nodes (4099 cold_launch on, then off again: little_min,
//   big_min, gpu_min, fork_on_big) on a tmpfs device root, against 4 pwrite calls to
//   descriptors opened once on the same nodes; per-call latency p50 and p99;
// - velmora-replay --fast on a generated hour of device use (about 120,000 calls), in calls per
//   second, against parsing the same trace.
// Log output is dropped.
#include <android/log.h>
#include <benchmark/benchmark.h>
#include <fcntl.h>
#include <stdlib.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <fstream>
#include <string>
#include <vector>

#include "host/platform/HostEnvironment.h"
#include "server/VelmoraServer.h"
#include "tools/replay/ReplaySession.h"
#include "tools/replay/TraceParser.h"
#include "tools/tracegen/TraceGenerator.h"

namespace {

using Clock = std::chrono::steady_clock;

const std::string kConfigDir = std::string(VELMORA_SOURCE_DIR) + "/examples";
std::string gScratch;  // on tmpfs

void dropLine(const struct __android_logger_data*, const char*) {}

void setUp() {
    __android_log_set_logger(dropLine);
    char dir[] = "/dev/shm/velmora-bench-host-XXXXXX";
    if (mkdtemp(dir) == nullptr) {
        perror("mkdtemp");
        exit(1);
    }
    gScratch = dir;
}

void reportLatency(benchmark::State& state, std::vector<int64_t>& ns) {
    if (ns.empty()) {
        return;
    }
    std::sort(ns.begin(), ns.end());
    state.counters["p50_ns"] = static_cast<double>(ns[ns.size() / 2]);
    state.counters["p99_ns"] = static_cast<double>(ns[ns.size() * 99 / 100]);
}

void BM_HostEventFourNodes(benchmark::State& state) {
    velmora::HostEnvironment& env = velmora::HostEnvironment::get();
    env.reset();
    env.clock().setVirtual();
    env.properties().setConfigDirs({kConfigDir});
    if (env.useDeviceRoot(gScratch + "/event", true) != 0) {
        state.SkipWithError("no device root");
        return;
    }
    VelmoraServer server;
    if (server.init() != 0) {
        state.SkipWithError("init failed");
        return;
    }
    const int on = 0;
    const int off = -1;
    std::vector<int64_t> ns;
    ns.reserve(1 << 20);
    size_t i = 0;
    for (auto _ : state) {
        const auto start = Clock::now();
        const int status = server.velmoraEvent(4099, nullptr, 1, (i++ & 1) != 0 ? &off : &on);
        ns.push_back((Clock::now() - start).count());
        benchmark::DoNotOptimize(status);
    }
    reportLatency(state, ns);
}
BENCHMARK(BM_HostEventFourNodes);

void BM_FourPwritesFloor(benchmark::State& state) {
    velmora::HostEnvironment& env = velmora::HostEnvironment::get();
    env.reset();
    if (env.useDeviceRoot(gScratch + "/floor", true) != 0) {
        state.SkipWithError("no device root");
        return;
    }
    const char* const keys[] = {"cpu.little.min", "cpu.big.min", "gpu.min", "sched.fork_on_big"};
    const std::string values[2][4] = {{"1804800\n", "2419200\n", "500000000\n", "1\n"},
                                      {"300000\n", "710400\n", "257000000\n", "0\n"}};
    int fds[4];
    for (int n = 0; n < 4; ++n) {
        fds[n] = open(env.device().pathOf(keys[n]).c_str(), O_WRONLY | O_CLOEXEC);
        if (fds[n] < 0) {
            state.SkipWithError("cannot open node");
            return;
        }
    }
    std::vector<int64_t> ns;
    ns.reserve(1 << 20);
    size_t i = 0;
    for (auto _ : state) {
        const std::string* v = values[i++ & 1];
        const auto start = Clock::now();
        for (int n = 0; n < 4; ++n) {
            benchmark::DoNotOptimize(pwrite(fds[n], v[n].data(), v[n].size(), 0));
        }
        ns.push_back((Clock::now() - start).count());
    }
    for (int fd : fds) {
        close(fd);
    }
    reportLatency(state, ns);
}
BENCHMARK(BM_FourPwritesFloor);

// The generated hour of device use that velmora_bench_replay also replays (tools/tracegen):
// about 120,000 calls, 15 % of them probe events.
std::string hourTrace() {
    const std::string path = gScratch + "/hour.trace";
    std::ofstream(path) << velmora::TraceGenerator::generate(
        velmora::TraceGenOptions::hour(1, 150000));
    return path;
}

void BM_FastReplayHour(benchmark::State& state) {
    const std::string trace = hourTrace();
    FILE* sink = fopen("/dev/null", "w");
    for (auto _ : state) {
        velmora::ReplayOptions options;
        options.tracePath = trace;
        options.configDirs = {kConfigDir};
        options.fast = true;
        options.quiet = true;
        options.deviceRoot = gScratch + "/replay";
        options.timelinePath = gScratch + "/timeline.json";
        options.eventLogPath = gScratch + "/events.log";
        // Argument 1: with the replay's analysis (holders, residency, spans), as velmora-replay
        // runs; 0: without it, the floor the analysis is measured against.
        options.insight = state.range(0) != 0;
        velmora::ReplaySession session(options, sink, sink);
        const auto start = Clock::now();
        if (session.run() != velmora::ReplaySession::kOk) {
            state.SkipWithError("replay failed");
            break;
        }
        const double seconds = std::chrono::duration<double>(Clock::now() - start).count();
        state.SetIterationTime(seconds);
        state.counters["calls"] = session.calls();
        state.counters["calls_per_s"] = session.calls() / seconds;
    }
    fclose(sink);
}
BENCHMARK(BM_FastReplayHour)
    ->Arg(0)
    ->Arg(1)
    ->Iterations(1)
    ->UseManualTime()
    ->Unit(benchmark::kMillisecond);

void BM_ParseHourFloor(benchmark::State& state) {
    const std::string trace = hourTrace();
    for (auto _ : state) {
        std::vector<velmora::TraceCall> calls;
        std::string error;
        velmora::TraceParser::parseFile(trace, &calls, &error);
        state.counters["calls"] = static_cast<double>(calls.size());
    }
}
BENCHMARK(BM_ParseHourFloor)->Iterations(1)->Unit(benchmark::kMillisecond);

}  // namespace

int main(int argc, char** argv) {
    setUp();
    benchmark::Initialize(&argc, argv);
    benchmark::RunSpecifiedBenchmarks();
    benchmark::Shutdown();
    const std::string cleanup = "rm -rf '" + gScratch + "'";
    return system(cleanup.c_str()) == 0 ? 0 : 1;
}
