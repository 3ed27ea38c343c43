// Pieces of the stress test: the configuration under load, the operation mix's constants, the
// watchdog that names a hanging thread and the model of what each client asked for last.
#pragma once

#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <cstdio>
#include <map>
#include <mutex>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "tests/server/SceneTestSupport.h"

namespace velmora {
namespace fake {

using Clock = std::chrono::steady_clock;
using std::chrono::milliseconds;

inline constexpr int kTimedAction = 4098;
inline constexpr int kColdStart = 4099;

inline constexpr int kMixedThreads = 4;
// Under a sanitizer the deadline below ends the phase before these counts are reached.
inline constexpr int kOpsPerThread = 2000;
inline constexpr int kSceneSwitches = 1500;
inline constexpr int kMaxReloads = 300;
// Reloads that must have raced with the host threads before the concurrent phase may end.
inline constexpr int kMinReloads = 12;
// The concurrent phase ends at this deadline even when the counts are not reached.
inline constexpr milliseconds kPhaseDeadline{1500};
// Virtual time after the concurrent phase in which every boost falls due (8 ms) and is
// withdrawn at the end of its lifetime (256 ms).
inline constexpr int kProbeSettleMs = 300;
// No progress of any thread for this long is taken as a deadlock.
inline constexpr milliseconds kWatchdogStall{20000};

inline const std::vector<int> kScenes = {4118, 4119, 4120, 4121, 4122};
inline const std::vector<int> kGovScenes = {4230, 4240, 4260};
// Built-ins 4118 (100), 4119 (200), 4120 (20), 4121 (70); configured ones below.
inline const std::map<int, int> kPriorities = {{4118, 100}, {4119, 200}, {4120, 20}, {4121, 70},
                                               {4122, 150}, {4230, 50},  {4240, 50}, {4260, 300}};
inline const std::vector<int> kEvents = {kTimedAction, kColdStart, 12288, 12289, 12290,
                                         4113,         4114,       4115,  20480, 20481};
inline const std::vector<int> kFreqTags = {2, 5, 8};
// Dump options and the lines of their replies (the tables' headings included, plus the reply's
// closing blank line).
inline const std::vector<std::pair<const char*, int>> kDumps = {{"--freqlist", 3 + 3 * 7 + 1},
                                                                {"--easgrouplist", 5 + 5 * 8 + 1},
                                                                {"--help", 6},
                                                                {"--logon", 2},
                                                                {"--logoff", 2}};

inline int lineCount(const std::string& text) {
    return static_cast<int>(std::count(text.begin(), text.end(), '\n'));
}

inline std::string cmd(int id, const std::string& name, const std::string& body) {
    return "<cmd id=\"" + std::to_string(id) + "\" name=\"" + name + "\"><act>" + body +
           "</act></cmd>";
}

// The configuration under load; the two reload variants differ in the timed actions' values.
inline std::string commands(int variant) {
    const std::string v = std::to_string(1000000 + variant);
    return cmd(kTimedAction, "winswitch", "<duration>500</duration><t1>" + v + "</t1>") +
           cmd(kColdStart, "cold", "<duration>1000</duration><t4>" + v + "</t4>") +
           cmd(4114, "zola_ref", "<duration>0</duration><t51>10</t51><t53>-10</t53>") +
           cmd(4113, "zola_follow", "<duration>0</duration><t51>20</t51><t53>0</t53>") +
           cmd(4115, "zola_other", "<duration>0</duration><t52>30</t52>") +
           cmd(12288, "little_cap", "<duration>0</duration><t2>1500000</t2>") +
           cmd(12289, "big_cap_platform", "<duration>0</duration><t10>1</t10><t5>1900000</t5>") +
           cmd(12290, "little_floor", "<duration>0</duration><t1>800000</t1>") +
           cmd(20481, "memlat", "<duration>0</duration><t30>1</t30>") +
           scene(4118, "<t1>1500</t1>") + scene(4119, "<t2>2000</t2>") + scene(4120, "<t1>1</t1>") +
           scene(4121, "<t1>2</t1>") + scene(4122, "<t101>150</t101>") + govScene(4230, 50) +
           govScene(4240, 50) + govScene(4260, 300);
}

// Per-thread progress for the watchdog: an operation counter and the operation in flight.
struct Progress {
    std::string name;
    std::atomic<long> ops{0};
    std::atomic<const char*> current{"idle"};
};

// Ends the process with a report naming every thread and its operation in flight when none of
// them made progress for kWatchdogStall, so that CI gets a report instead of a timeout.
class Watchdog {
public:
    explicit Watchdog(const std::vector<Progress>& progress)
        : mThread([this, &progress] { run(progress); }) {}
    ~Watchdog() {
        mDone = true;
        mThread.join();
    }

private:
    void run(const std::vector<Progress>& progress) {
        long last = -1;
        auto lastChange = Clock::now();
        while (!mDone.load()) {
            std::this_thread::sleep_for(milliseconds(100));
            long total = 0;
            for (const Progress& p : progress) {
                total += p.ops.load();
            }
            if (total != last) {
                last = total;
                lastChange = Clock::now();
            } else if (Clock::now() - lastChange > kWatchdogStall) {
                fprintf(stderr, "ServerStress watchdog: no progress, probably a deadlock:\n");
                for (const Progress& p : progress) {
                    fprintf(stderr, "  %s: %ld ops, in %s\n", p.name.c_str(), p.ops.load(),
                            p.current.load());
                }
                _exit(3);
            }
        }
    }

    std::atomic<bool> mDone{false};
    std::thread mThread;
};

// What the host asked for last, per client: the test serialises each client's requests with
// its own lock so that "last" is well defined while the clients still race each other and
// everything else.
struct ClientModel {
    std::mutex lock;
    std::map<int, int> freq;   // tag -> last accepted value (-1 never set)
    std::map<int, int> sched;  // group tag -> last accepted level (absent: the default 0)
};

}  // namespace fake
}  // namespace velmora
