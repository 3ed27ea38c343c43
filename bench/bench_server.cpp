// Server benchmarks on the no-op benchmark platform:
//  - dispatch of a configured timed action against its floor (read lock, map lookup, copy of
//    the record, unlock, one virtual call), on 1 and 2 host threads;
//  - the other common host calls, in ns per call;
//  - the probe worker: boost latency beyond the configured delay, and its CPU time while idle
//    and while a boost is held.
// Log output is dropped (no-op logger); lines are still formatted, as on a device.
#include <android/log.h>
#include <benchmark/benchmark.h>
#include <pthread.h>
#include <stdlib.h>
#include <time.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <condition_variable>
#include <cstdio>
#include <fstream>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "bench/BenchPlatform.h"
#include "config/Action.h"
#include "config/VelmoraLoadXml.h"
#include "config/VelmoraParser.h"
#include "server/VelmoraServer.h"

namespace {

constexpr int kTimedCmd = 4100;
constexpr int kSchedCmd = 4114;
constexpr int kOnOffCmd = 12288;
constexpr int kSceneCmd = 4118;
constexpr int kProbeCmd = 4116;
constexpr int kProbeDelayMs = 8;
// Filler commands so that the map has the size of a real configuration.
constexpr int kFillerCommands = 120;

std::string configXml() {
    std::string xml = "<?xml version=\"1.0\" encoding=\"utf-8\"?>\n<policy>\n";
    xml += "<cmd id=\"5376\" name=\"default_sched\"><act><duration>0</duration><t51>10</t51>"
           "<t52>10</t52><t53>10</t53><t54>0</t54><t55>0</t55><t56>-10</t56><t57>0</t57>"
           "<t58>-20</t58></act></cmd>\n";
    xml += "<cmd id=\"4116\" name=\"probe\"><act><duration>100</duration><t1>1209600</t1>"
           "<t4>1497600</t4></act></cmd>\n";
    xml += "<cmd id=\"4100\" name=\"app_launch\"><act><duration>1500</duration>"
           "<t1>1804800</t1><t4>2419200</t4><t7>500000000</t7><t20>1</t20></act></cmd>\n";
    xml += "<cmd id=\"4114\" name=\"scroll_level\"><act><duration>0</duration><t53>20</t53>"
           "<t51>20</t51></act></cmd>\n";
    xml += "<cmd id=\"12288\" name=\"video\"><act><duration>0</duration><t2>1497600</t2>"
           "<t5>2016000</t5></act></cmd>\n";
    xml += "<cmd id=\"4118\" name=\"game\"><act><duration>0</duration><t101>100</t101>"
           "<t1>1401600</t1><t4>1804800</t4></act></cmd>\n";
    for (int i = 0; i < kFillerCommands; ++i) {
        xml += "<cmd id=\"" + std::to_string(6000 + i) + "\" name=\"filler\"><act><duration>" +
               std::to_string(100 + i) + "</duration><t1>1000000</t1></act></cmd>\n";
    }
    xml += "</policy>\n";
    return xml;
}

void dropLine(const struct __android_logger_data*, const char*) {}

VelmoraServer* gServer = nullptr;
std::string gConfigPath;

// The floor of a dispatch: what any dispatch of a parsed command must do at least.
struct DispatchFloor {
    pthread_rwlock_t lock;
    ActionMap* map = nullptr;
    PerfExecutor* executor = nullptr;

    int dispatch(int cmdId, unsigned int payloadNum, const int* payload) {
        Action action;
        pthread_rwlock_rdlock(&lock);
        auto it = map->find(cmdId);
        if (it == map->end() || it->second->mNext == nullptr) {
            pthread_rwlock_unlock(&lock);
            return 1;
        }
        const Action* source = it->second->mNext;
        action.mCmdId = source->mCmdId;
        action.mName = source->mName;
        action.mDuration = source->mDuration;
        action.mParamNum = source->mParamNum;
        action.mTagValues = source->mTagValues;
        action.mParams = source->mParams;
        action.mNext = source->mNext;
        pthread_rwlock_unlock(&lock);
        return executor->doAction(&action, payloadNum, payload);
    }
};
DispatchFloor gFloor;

void setUp() {
    __android_log_set_logger(dropLine);
    char dir[] = "/tmp/velmora-bench-XXXXXX";
    if (mkdtemp(dir) == nullptr) {
        perror("mkdtemp");
        exit(2);
    }
    gConfigPath = std::string(dir) + "/velmora_config_cust.xml";
    std::ofstream(gConfigPath) << configXml();
    velmora::bench::setConfigPath(gConfigPath);

    gServer = new VelmoraServer();  // never deleted: the probe worker runs until exit
    const int ret = gServer->init();
    if (ret != 0) {
        fprintf(stderr, "bench: server init failed: %d\n", ret);
        exit(2);
    }
    // The floor works on its own copy of the same configuration.
    pthread_rwlock_init(&gFloor.lock, nullptr);
    VelmoraLoadXml* loader = createVelmoraLoadXml();
    gFloor.map = loader->loadXmlMap();
    delete loader;
    gFloor.executor = &velmora::bench::executor();
    benchmark::DoNotOptimize(gFloor.executor);
}

void BM_DispatchFloor(benchmark::State& state) {
    const int payload[1] = {0};
    for (auto _ : state) {
        benchmark::DoNotOptimize(gFloor.dispatch(kTimedCmd, 1, payload));
    }
}
BENCHMARK(BM_DispatchFloor)->Threads(1)->Threads(2)->UseRealTime();

void BM_DispatchTimedAction(benchmark::State& state) {
    const int payload[1] = {0};
    for (auto _ : state) {
        if (gServer->velmoraEvent(kTimedCmd, nullptr, 1, payload) != 0) {
            state.SkipWithError("dispatch failed");
            break;
        }
    }
}
BENCHMARK(BM_DispatchTimedAction)->Threads(1)->Threads(2)->UseRealTime();

void BM_ClientFreqRequest(benchmark::State& state) {
    const int tags[3] = {2, 5, 8};
    const int values[2][3] = {{1497600, 2016000, 700000000}, {1804800, 2419200, 800000000}};
    int i = 0;
    for (auto _ : state) {
        if (gServer->velmoraSetConfig(1, 3, tags, values[i]) != 0) {
            state.SkipWithError("request failed");
            break;
        }
        i ^= 1;
    }
}
BENCHMARK(BM_ClientFreqRequest);

void BM_OnOffEvent(benchmark::State& state) {
    const int payloads[2] = {0, -1};
    int i = 0;
    for (auto _ : state) {
        if (gServer->velmoraEvent(kOnOffCmd, nullptr, 1, &payloads[i]) != 0) {
            state.SkipWithError("on/off failed");
            break;
        }
        i ^= 1;
    }
}
BENCHMARK(BM_OnOffEvent);

void BM_SchedLevelEvent(benchmark::State& state) {
    const int payload[1] = {0};
    for (auto _ : state) {
        if (gServer->velmoraEvent(kSchedCmd, nullptr, 1, payload) != 0) {
            state.SkipWithError("sched event failed");
            break;
        }
    }
}
BENCHMARK(BM_SchedLevelEvent);

void BM_SpecialSceneSwitch(benchmark::State& state) {
    const int payloads[2] = {0, -1};
    int i = 0;
    for (auto _ : state) {
        if (gServer->velmoraEvent(kSceneCmd, nullptr, 1, &payloads[i]) != 0) {
            state.SkipWithError("scene switch failed");
            break;
        }
        i ^= 1;
    }
}
BENCHMARK(BM_SpecialSceneSwitch);

// Probe: boost arrival times, filled by the executor hook on the worker thread.
std::mutex gProbeLock;
std::condition_variable gProbeCond;
unsigned int gBoostedTid = 0;
std::chrono::steady_clock::time_point gBoostedAt;
pthread_t gWorker;
bool gWorkerKnown = false;

void onProbeBoost(unsigned int tid, pthread_t thread) {
    const auto now = std::chrono::steady_clock::now();
    std::lock_guard<std::mutex> lock(gProbeLock);
    gBoostedTid = tid;
    gBoostedAt = now;
    gWorker = thread;
    gWorkerKnown = true;
    gProbeCond.notify_all();
}

int64_t workerCpuNs() {
    clockid_t clock;
    timespec ts{};
    if (!gWorkerKnown || pthread_getcpuclockid(gWorker, &clock) != 0 ||
        clock_gettime(clock, &ts) != 0) {
        return -1;
    }
    return static_cast<int64_t>(ts.tv_sec) * 1000000000 + ts.tv_nsec;
}

std::string probeMsg(unsigned int tid) {
    return "pid=" + std::to_string(tid) + "|tid=" + std::to_string(tid);
}

// Sends a state-0 probe for `tid` and waits for its boost; the latency in microseconds beyond
// the boost delay, or a negative value when the boost did not come within a second.
double boostOnce(unsigned int tid) {
    const int boost[1] = {0};
    const std::string msg = probeMsg(tid);
    const auto sent = std::chrono::steady_clock::now();
    gServer->velmoraEvent(kProbeCmd, msg.c_str(), 1, boost);
    std::unique_lock<std::mutex> lock(gProbeLock);
    if (!gProbeCond.wait_for(lock, std::chrono::seconds(1), [&] { return gBoostedTid == tid; })) {
        return -1;
    }
    const auto late = gBoostedAt - sent - std::chrono::milliseconds(kProbeDelayMs);
    return std::chrono::duration<double, std::micro>(late).count();
}

void unboost(unsigned int tid) {
    const int withdraw[1] = {-1};
    const std::string msg = probeMsg(tid);
    gServer->velmoraEvent(kProbeCmd, msg.c_str(), 1, withdraw);
}

double percentile(std::vector<double> v, double p) {
    std::sort(v.begin(), v.end());
    const size_t index = static_cast<size_t>(p * static_cast<double>(v.size() - 1) + 0.5);
    return v[std::min(index, v.size() - 1)];
}

void BM_ProbeBoost(benchmark::State& state) {
    const int items = static_cast<int>(state.range(0));
    velmora::bench::setProbeBoostHook(onProbeBoost);
    std::vector<double> late;
    double idleCpuUsPerS = -1;
    double boostedCpuPct = -1;
    for (auto _ : state) {
        late.clear();
        for (int i = 0; i < items; ++i) {
            const unsigned int tid = 100000 + static_cast<unsigned int>(i);
            const double us = boostOnce(tid);
            if (us < 0) {
                state.SkipWithError("a probe boost never arrived");
                velmora::bench::setProbeBoostHook(nullptr);
                return;
            }
            late.push_back(us);
            unboost(tid);
            // Leave the worker time to drop the withdrawn entry and go back to waiting.
            std::this_thread::sleep_for(std::chrono::milliseconds(2));
        }
        // Both queues empty: the worker should be waiting on its condition.
        std::this_thread::sleep_for(std::chrono::milliseconds(100));
        const int64_t idle0 = workerCpuNs();
        std::this_thread::sleep_for(std::chrono::seconds(1));
        const int64_t idle1 = workerCpuNs();
        idleCpuUsPerS = idle0 < 0 ? -1 : static_cast<double>(idle1 - idle0) / 1000.0;

        // One boost held for 200 ms (within its 256 ms lifetime).
        const unsigned int tid = 99999;
        boostOnce(tid);
        const int64_t held0 = workerCpuNs();
        std::this_thread::sleep_for(std::chrono::milliseconds(200));
        const int64_t held1 = workerCpuNs();
        unboost(tid);
        boostedCpuPct = static_cast<double>(held1 - held0) / 2e6;
    }
    velmora::bench::setProbeBoostHook(nullptr);
    state.counters["p50_us"] = percentile(late, 0.50);
    state.counters["p99_us"] = percentile(late, 0.99);
    state.counters["max_us"] = percentile(late, 1.0);
    state.counters["idle_cpu_us_per_s"] = idleCpuUsPerS;
    state.counters["held_cpu_pct"] = boostedCpuPct;
}
BENCHMARK(BM_ProbeBoost)->Arg(300)->Iterations(1)->Repetitions(1)->Unit(benchmark::kMillisecond);

}  // namespace

int main(int argc, char** argv) {
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv)) {
        return 1;
    }
    setUp();
    benchmark::RunSpecifiedBenchmarks();
    benchmark::Shutdown();
    return 0;
}
