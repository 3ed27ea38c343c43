// Many host threads on every entry point at once while the configuration is reloaded every few
// milliseconds and the probe worker's clock moves on: statuses stay the documented ones,
// nothing deadlocks (a watchdog names the thread that hangs), and once the threads are done the
// platform and the tables agree with what the host asked for last. The concurrent phase is
// bounded by a count of operations per thread and by a deadline.
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <map>
#include <mutex>
#include <random>
#include <set>
#include <string>
#include <thread>
#include <vector>

#include "sched/SchedLevelManager.h"
#include "tests/fakes/FakeProbeClock.h"
#include "tests/fakes/ServerTest.h"
#include "tests/stress/StressSupport.h"

namespace velmora {
namespace fake {
namespace {

class ServerStressTest : public ServerTest {
protected:
    void SetUp() override {
        FakeProbeClock::install();
        ServerTest::SetUp();
    }
    void TearDown() override {
        ServerTest::TearDown();
        FakeProbeClock::uninstall();
    }
};

TEST_F(ServerStressTest, EveryEntryPointUnderConcurrentReloads) {
    ASSERT_EQ(startServer(commands(0)), 0);
    env().setPolicy("cold", 80);
    env().setPolicy("winswitch", -1);
    executor().setConfigValue(22, 1800000);
    executor().setConfigValue(24, 2400000);
    executor().setConfigValue(26, 850000);

    // Prologue: the log toggles' replies, and launch policies and statistics upload switched on
    // before the concurrent phase starts.
    EXPECT_EQ(dump("--logon"), "velmora log is ON\n\n");
    EXPECT_EQ(dump("--logoff"), "velmora log is OFF\n\n");
    const int word = 0x40000 | 0x10000;
    EXPECT_EQ(mServer->velmoraEvent(kNotification, "", 1, &word), 0);
    executor().clear();
    LogCapture::clear();

    ClientModel clients[4];    // index = client id 1..3
    std::set<int> sceneModel;  // scenes switched on, kept by the scene thread
    std::mutex failLock;
    std::vector<std::string> failures;  // unexpected results
    auto check = [&](const std::string& what, int got, int want) {
        if (got != want) {
            std::lock_guard<std::mutex> lock(failLock);
            failures.push_back(what + " returned " + std::to_string(got));
        }
    };

    std::vector<Progress> progress(kMixedThreads + 2);  // the host threads, scenes, reloads
    for (int t = 0; t < kMixedThreads + 2; ++t) {
        progress[t].name = t < kMixedThreads    ? "host thread " + std::to_string(t)
                           : t == kMixedThreads ? "scene thread"
                                                : "reloader";
    }
    const auto deadline = Clock::now() + kPhaseDeadline;
    std::atomic<int> reloads{0};
    // The host threads go on past their count until enough reloads have raced with them: on
    // a loaded machine the counts alone can finish before the reloader got going.
    auto keepGoing = [&](int i, int count) {
        return (i < count || reloads.load() < kMinReloads) && Clock::now() < deadline;
    };
    std::atomic<int> mixedRunning{kMixedThreads + 1};
    std::atomic<int> totalOps{0};

    {
        Watchdog watchdog(progress);
        std::vector<std::thread> workers;
        for (int t = 0; t < kMixedThreads; ++t) {
            workers.emplace_back([&, t] {
                Progress& p = progress[t];
                std::mt19937 rng(4242 + t);
                for (int i = 0; keepGoing(i, kOpsPerThread); ++i, ++p.ops, ++totalOps) {
                    const int pick = static_cast<int>(rng() % 100);
                    if (pick < 40) {
                        // Timed actions (always on: the launch policy check below relies on
                        // it), on/off limits, sched events and memory latency; the text is read
                        // by 20480 alone.
                        p.current = "event";
                        const int id = kEvents[rng() % kEvents.size()];
                        const int value = id >= 12288 && rng() % 2 ? kOff : kOn;
                        check("event " + std::to_string(id),
                              mServer->velmoraEvent(id, "pid=1|tid=2|ratio_b=0.5 ratio_l=0.75", 1,
                                                    &value),
                              0);
                    } else if (pick < 55) {
                        p.current = "client frequency request";
                        const int client = 1 + static_cast<int>(rng() % 3);
                        const int tag = kFreqTags[rng() % kFreqTags.size()];
                        // One request in ten is refused (negative config) and must not count.
                        const bool bad = rng() % 10 == 0;
                        const int value = bad ? -5 : static_cast<int>(rng() % 4) * 500000;
                        std::lock_guard<std::mutex> lock(clients[client].lock);
                        const int ret = mServer->velmoraSetConfig(client, 1, &tag, &value);
                        check("frequency request", ret, bad ? 3 : 0);
                        if (ret == 0) {
                            clients[client].freq[tag] = value;
                        }
                    } else if (pick < 65) {
                        p.current = "client sched request";
                        const int client = 1 + static_cast<int>(rng() % 3);
                        std::lock_guard<std::mutex> lock(clients[client].lock);
                        // Tag 40 resets the client's levels; tag 42 sets one group's level,
                        // -20..40 valid, one in eight asks for 50 and is refused.
                        const bool reset = rng() % 8 == 0;
                        const int group = 1 + static_cast<int>(rng() % 8);
                        const bool bad = !reset && rng() % 8 == 0;
                        const int level = bad ? 50 : -20 + 10 * static_cast<int>(rng() % 7);
                        const int tag = reset ? 40 : 42;
                        const int config = reset ? 0 : (group << 16) | (level + 20);
                        const int ret = mServer->velmoraSetConfig(client, 1, &tag, &config);
                        check("sched request", ret, bad ? -1 : 0);
                        if (reset) {
                            clients[client].sched.clear();
                        } else if (ret == 0) {
                            clients[client].sched[50 + group] = level;
                        }
                    } else if (pick < 80) {
                        p.current = "probe";
                        // Thread ids from 1 up (0 is never a user thread); every eighth is the
                        // process's main thread, so that the immediate-boost path runs too.
                        const int pid = 300 + t * 50 + static_cast<int>(rng() % 6);
                        const int tid = rng() % 8 == 0 ? pid : 5000 + t * 100 + (rng() % 40);
                        const std::string msg =
                            "pid=" + std::to_string(pid) + "|tid=" + std::to_string(tid);
                        const int state = rng() % 3 == 0 ? kOff : kOn;
                        check("probe", mServer->velmoraEvent(kProbe, msg.c_str(), 1, &state), 0);
                    } else if (pick < 92) {
                        p.current = "query";
                        const int tags[3] = {22, 24, 26};
                        int values[3] = {-1, -1, -1};
                        check("query", mServer->velmoraGetConfig(3, tags, values), 0);
                        check("query values",
                              values[0] == 1800000 && values[1] == 2400000 && values[2] == 850000,
                              1);
                    } else if (pick < 98) {
                        // Dumps and log toggles race with everything else: the dumps print
                        // the managers' published copies, whole and never torn.
                        p.current = "dump / toggle";
                        const auto& option = kDumps[rng() % kDumps.size()];
                        check(option.first, lineCount(dump(option.first)), option.second);
                    } else {
                        // Always with the policy bit: the cold-start check below relies on it.
                        p.current = "notification";
                        check("notification", mServer->velmoraEvent(kNotification, "", 1, &word),
                              0);
                    }
                    p.current = "between operations";
                }
                --mixedRunning;
            });
        }

        // Scene switches come from one thread. The server updates the scene state under its
        // mutex but calls the platform after releasing it, so switches from two threads may
        // reach the platform in the other order; only a single switching thread makes the
        // platform's last word per scene comparable with the final state.
        workers.emplace_back([&] {
            Progress& p = progress[kMixedThreads];
            std::mt19937 rng(77);
            std::vector<int> all = kScenes;
            all.insert(all.end(), kGovScenes.begin(), kGovScenes.end());
            for (int i = 0; keepGoing(i, kSceneSwitches); ++i, ++p.ops) {
                if (i % 97 == 96) {
                    p.current = "client restart";
                    check("client restart", mServer->velmoraEvent(kClientRestart, "", 0, nullptr),
                          0);
                    sceneModel.clear();
                    continue;
                }
                p.current = "scene switch";
                const int id = all[rng() % all.size()];
                const int value = rng() % 2 ? kOn : kOff;
                check("scene", mServer->velmoraEvent(id, "", 1, &value), 0);
                if (value == kOn) {
                    sceneModel.insert(id);
                } else {
                    sceneModel.erase(id);
                }
            }
            --mixedRunning;
        });

        // Reloads alternate between two variants of the configuration, rewritten before each.
        workers.emplace_back([&] {
            Progress& p = progress[kMixedThreads + 1];
            for (int i = 0; i < kMaxReloads && mixedRunning.load() > 0; ++i, ++p.ops) {
                p.current = "reload";
                writeCustConfig(policyXml(kStartupCommands + commands(i % 2)));
                check("reload", mServer->velmoraEvent(kReload, "", 0, nullptr), 0);
                ++reloads;
                p.current = "moving the probe clock";
                FakeProbeClock::last().advance(3);
                p.current = "sleeping";
                usleep(2000 + (i % 3) * 1000);
            }
        });
        for (auto& w : workers) {
            w.join();
        }
    }

    EXPECT_TRUE(failures.empty()) << failures.size() << " unexpected results, the first: "
                                  << (failures.empty() ? "" : failures[0]);
    EXPECT_GE(reloads.load(), kMinReloads);
    EXPECT_GT(totalOps.load(), 400);
    // A reload swaps the whole table under the write lock: no command ever goes missing.
    EXPECT_EQ(LogCapture::countContaining("doParse failed"), 0);

    // Timed actions carry one of the two configured variants, intact.
    std::map<int, int> lastWord;  // scene -> payload of its last platform call
    for (const ExecutorCall& c : executor().calls(Op::DoAction)) {
        if (c.id == kTimedAction) {
            EXPECT_EQ(c.name, "winswitch");
            EXPECT_EQ(c.duration, 500);
            EXPECT_TRUE(c.tagValues == (std::vector<int>{1, 1000000}) ||
                        c.tagValues == (std::vector<int>{1, 1000001}));
        } else if (c.id == kColdStart) {
            EXPECT_EQ(c.duration, 80) << "the launch policy replaces the configured duration";
        } else if (kPriorities.count(c.id) != 0 && c.payload.size() == 1) {
            lastWord[c.id] = c.payload[0];
        }
    }

    // Scenes: the current one is the best switched on and the platform last applied it; every
    // other ordinary scene was last withdrawn (or never reached the platform). Governor scenes
    // applied on their own under 4119 are not withdrawn when they switch off.
    const SceneState scenes = snapshot(mServer.get());
    const int cur = scenes.cur;
    const std::set<int32_t>& on = scenes.on;
    EXPECT_EQ(on, std::set<int32_t>(sceneModel.begin(), sceneModel.end()));
    int best = -1;  // priority of the best scene switched on
    for (int id : on) {
        best = std::max(best, kPriorities.at(id));
    }
    EXPECT_EQ(cur == 0, on.empty()) << "current scene " << cur;
    EXPECT_EQ(on.count(cur) != 0 ? kPriorities.at(cur) : -1, best) << "current scene " << cur;
    if (cur != 0) {
        EXPECT_EQ(lastWord.count(cur) ? lastWord[cur] : 99, kOn) << "scene " << cur;
    }
    for (int id : kScenes) {
        if (id != cur && lastWord.count(id) != 0) {
            EXPECT_EQ(lastWord[id], kOff) << "scene " << id << " is still applied";
        }
    }

    // Client frequency tables hold the last accepted values, in the dump as in the manager.
    EXPECT_EQ(dump("--freqlist"), freqBlock("KX", clients[1].freq) +
                                      freqBlock("JN", clients[2].freq) +
                                      freqBlock("ZOLA", clients[3].freq) + "\n");

    // Scheduling levels: KX and JN hold their last accepted levels (ZOLA's table also follows
    // the events), and the platform's last word is the manager's current table.
    SchedLevelManager* sched = mServer->mSchedLevelPtr;
    std::vector<int> currentLevels;
    {
        android::Mutex::Autolock lock(sched->mLock);
        for (int g = 51; g <= 58; ++g) {
            EXPECT_EQ(sched->mKxLevelMap[g], clients[1].sched[g]) << "KX group " << g;
            EXPECT_EQ(sched->mJnLevelMap[g], clients[2].sched[g]) << "JN group " << g;
            currentLevels.push_back(sched->mCurrentLevelMap[g]);
        }
    }
    const auto schedCalls = executor().calls(Op::SchedLevel);
    ASSERT_FALSE(schedCalls.empty());
    EXPECT_EQ(schedCalls.back().tags, (std::vector<int>{51, 52, 53, 54, 55, 56, 57, 58}));
    EXPECT_EQ(schedCalls.back().values, currentLevels);

    // Every thread that was boosted is withdrawn again, by the host or by the worker once the
    // boost's lifetime is over.
    FakeProbeClock::last().advance(kProbeSettleMs);
    std::map<unsigned int, int> lastState;  // tid -> last state that reached the platform
    for (const ExecutorCall& c : executor().calls(Op::ProbeTid)) {
        lastState[c.tid] = c.state;
    }
    EXPECT_FALSE(lastState.empty()) << "no probe boost reached the platform";
    for (const auto& e : lastState) {
        EXPECT_NE(e.second, kOn) << "tid " << e.first << " is still boosted";
    }
}

}  // namespace
}  // namespace fake
}  // namespace velmora
