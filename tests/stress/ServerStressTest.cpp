// Many host threads on every entry point at once while the configuration is reloaded every few
// milliseconds: statuses stay the documented ones, nothing deadlocks, and once the threads are
// done the platform and the tables agree with what the host asked for last.
//
// The concurrent phase is bounded by a count of operations per thread and by a deadline; a
// watchdog ends the process with a message naming the thread and operation that hangs, so CI
// gets a report instead of a timeout.
#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <map>
#include <mutex>
#include <random>
#include <set>
#include <string>
#include <thread>
#include <vector>

#include "sched/SchedLevelManager.h"
#include "tests/fakes/ServerTest.h"
#include "tests/stress/StressSupport.h"

namespace velmora {
namespace fake {
namespace {

class ServerStressTest : public ServerTest {
protected:
    void SetUp() override {
        ServerTest::SetUp();
        mVariantB = mTmpDir + "/variant_b.xml";
    }
    void TearDown() override {
        unlink(mVariantB.c_str());
        ServerTest::TearDown();
    }


    std::string mVariantB;
};

TEST_F(ServerStressTest, EveryEntryPointUnderConcurrentReloads) {
    const std::string variantA = policyXml(std::string(kStartupCommands) + commands(0));
    const std::string variantB = policyXml(std::string(kStartupCommands) + commands(1));
    ASSERT_EQ(startServer(commands(0)), 0);
    {
        FILE* f = fopen(mVariantB.c_str(), "w");
        ASSERT_NE(f, nullptr);
        fputs(variantB.c_str(), f);
        fclose(f);
    }
    const std::string pathA = env().custConfigPath;
    env().setPolicy("cold", 80);
    env().setPolicy("winswitch", -1);
    executor().setConfigValue(22, 1800000);
    executor().setConfigValue(24, 2400000);
    executor().setConfigValue(26, 850000);

    // Prologue: a dump of every kind, and launch policies and statistics upload switched on
    // before the concurrent phase starts.
    EXPECT_NE(dump("--help").find("--freqlist"), std::string::npos);
    EXPECT_EQ(dump("--logon"), "velmora log is ON\n\n");
    EXPECT_EQ(dump("--logoff"), "velmora log is OFF\n\n");
    const int word = 0x40000 | 0x10000;
    EXPECT_EQ(mServer->velmoraEvent(kNotification, "", 1, &word), 0);
    executor().clear();
    LogCapture::clear();

    ClientModel clients[4];  // index = client id 1..3
    for (int c = 1; c <= 3; ++c) {
        for (int g = 51; g <= 58; ++g) {
            clients[c].sched[g] = 0;  // the configured defaults
        }
    }
    std::set<int> sceneModel;  // scenes switched on, kept by the scene thread
    std::atomic<int> unexpected{0};
    std::mutex failLock;
    std::vector<std::string> failures;  // first few unexpected results, for the report
    auto expectStatus = [&](const char* what, int got, std::initializer_list<int> allowed) {
        for (int a : allowed) {
            if (got == a) {
                return;
            }
        }
        ++unexpected;
        std::lock_guard<std::mutex> lock(failLock);
        if (failures.size() < 10) {
            failures.push_back(std::string(what) + " returned " + std::to_string(got));
        }
    };

    const int threads = kMixedThreads + 2;
    std::vector<Progress> progress(threads);
    std::vector<std::string> names;
    for (int t = 0; t < kMixedThreads; ++t) {
        names.push_back("host thread " + std::to_string(t));
    }
    names.push_back("scene thread");
    names.push_back("reloader");
    const auto deadline = Clock::now() + kPhaseDeadline;
    std::atomic<int> reloads{0};
    // The host threads go on past their count until enough reloads have raced with them: on
    // a loaded machine the counts alone can finish before the reloader got going.
    auto keepGoing = [&](int i, int count) {
        return (i < count || reloads.load() < kMinReloads) && Clock::now() < deadline;
    };
    std::atomic<int> mixedRunning{kMixedThreads + 1};
    std::atomic<int> totalOps{0};

    const auto phaseStart = Clock::now();
    {
        Watchdog watchdog(progress, names);
        std::vector<std::thread> workers;
        for (int t = 0; t < kMixedThreads; ++t) {
            workers.emplace_back([&, t] {
                Progress& p = progress[t];
                std::mt19937 rng(4242 + t);
                const int devNull = open("/dev/null", O_WRONLY);
                for (int i = 0; keepGoing(i, kOpsPerThread); ++i, ++p.ops) {
                    const int pick = static_cast<int>(rng() % 100);
                    const int onOff = rng() % 2 ? kOn : kOff;
                    if (pick < 12) {
                        p.current = "timed action";
                        const int id = rng() % 2 ? kTimedAction : kColdStart;
                        expectStatus("timed action", mServer->velmoraEvent(id, "", 1, &kOn), {0});
                    } else if (pick < 22) {
                        p.current = "on/off limit";
                        const int id = 12288 + static_cast<int>(rng() % 3);
                        expectStatus("on/off", mServer->velmoraEvent(id, "", 1, &onOff), {0});
                    } else if (pick < 42) {
                        p.current = "client frequency request";
                        const int client = 1 + static_cast<int>(rng() % 3);
                        const int tag = kFreqTags[rng() % kFreqTags.size()];
                        // One request in ten is refused (negative config) and must not count.
                        const bool bad = rng() % 10 == 0;
                        const int value = bad ? -5 : static_cast<int>(rng() % 4) * 500000;
                        std::lock_guard<std::mutex> lock(clients[client].lock);
                        const int ret = mServer->velmoraSetConfig(client, 1, &tag, &value);
                        expectStatus("frequency request", ret, {bad ? 3 : 0});
                        if (ret == 0) {
                            clients[client].freq[tag] = value;
                        }
                    } else if (pick < 52) {
                        p.current = "client sched request";
                        const int client = 1 + static_cast<int>(rng() % 3);
                        std::lock_guard<std::mutex> lock(clients[client].lock);
                        if (rng() % 8 == 0) {
                            const int tag = 40;
                            const int reset = 0;
                            const int ret = mServer->velmoraSetConfig(client, 1, &tag, &reset);
                            expectStatus("sched reset", ret, {0});
                            for (auto& g : clients[client].sched) {
                                g.second = 0;
                            }
                        } else {
                            const int tag = 42;
                            const int group = 1 + static_cast<int>(rng() % 8);
                            // Levels -20..40 are valid; one in eight asks for 50 and is refused.
                            const bool bad = rng() % 8 == 0;
                            const int level = bad ? 50 : -20 + 10 * static_cast<int>(rng() % 7);
                            const int config = (group << 16) | (level + 20);
                            const int ret = mServer->velmoraSetConfig(client, 1, &tag, &config);
                            expectStatus("sched request", ret, {bad ? -1 : 0});
                            if (ret == 0) {
                                clients[client].sched[50 + group] = level;
                            }
                        }
                    } else if (pick < 62) {
                        p.current = "sched event";
                        const int id = 4113 + static_cast<int>(rng() % 3);
                        expectStatus("sched event", mServer->velmoraEvent(id, "", 0, nullptr),
                                     {0});
                    } else if (pick < 77) {
                        p.current = "probe";
                        // Thread ids from 1 up (0 is never a user thread); every eighth is the
                        // process's main thread, so that the immediate-boost path runs too.
                        const int pid = 300 + t * 50 + static_cast<int>(rng() % 6);
                        const int tid = rng() % 8 == 0 ? pid : 5000 + t * 100 + (rng() % 40);
                        const std::string msg =
                            "pid=" + std::to_string(pid) + "|tid=" + std::to_string(tid);
                        const int state = rng() % 3 == 0 ? kOff : kOn;
                        expectStatus("probe", mServer->velmoraEvent(kProbe, msg.c_str(), 1, &state),
                                     {0});
                    } else if (pick < 85) {
                        p.current = "memory latency";
                        if (rng() % 2) {
                            expectStatus("memlat ratio",
                                         mServer->velmoraEvent(
                                             20480, "pid=1|tid=2|ratio_b=0.5 ratio_l=0.75", 1,
                                             &onOff),
                                         {0});
                        } else {
                            expectStatus("memlat", mServer->velmoraEvent(20481, "", 1, &onOff),
                                         {0});
                        }
                    } else if (pick < 93) {
                        p.current = "query";
                        const int tags[3] = {22, 24, 26};
                        int values[3] = {-1, -1, -1};
                        expectStatus("query", mServer->velmoraGetConfig(3, tags, values), {0});
                        if (values[0] != 1800000 || values[1] != 2400000 || values[2] != 850000) {
                            expectStatus("query values", 1, {0});
                        }
                    } else {
                        // Dumps and log toggles race with everything else: the dumps print
                        // the managers' published copies, whole and never torn.
                        p.current = "dump / toggle";
                        const int which = static_cast<int>(rng() % 6);
                        if (which == 0) {
                            expectStatus("--freqlist lines", lineCount(dump("--freqlist")),
                                         {kFreqListLines});
                        } else if (which == 1) {
                            expectStatus("--easgrouplist lines", lineCount(dump("--easgrouplist")),
                                         {kEasGroupLines});
                        } else if (which < 5) {
                            static const char* const kOptions[] = {"--help", "--logon", "--logoff"};
                            mServer->dumpVelmoraServerInfo(devNull, {kOptions[which - 2]});
                        } else {
                            // Always with the policy bit: the cold-start check below relies on it.
                            expectStatus("notification",
                                         mServer->velmoraEvent(kNotification, "", 1, &word),
                                         {0});
                        }
                    }
                    p.current = "between operations";
                    ++totalOps;
                }
                close(devNull);
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
                    expectStatus("client restart",
                                 mServer->velmoraEvent(kClientRestart, "", 0, nullptr), {0});
                    sceneModel.clear();
                    continue;
                }
                p.current = "scene switch";
                const int id = all[rng() % all.size()];
                const int value = rng() % 2 ? kOn : kOff;
                expectStatus("scene", mServer->velmoraEvent(id, "", 1, &value), {0});
                if (value == kOn) {
                    sceneModel.insert(id);
                } else {
                    sceneModel.erase(id);
                }
                if (i % 4 == 0) {
                    std::this_thread::yield();
                }
            }
            --mixedRunning;
        });

        workers.emplace_back([&] {
            Progress& p = progress[kMixedThreads + 1];
            for (int i = 0; i < kMaxReloads && mixedRunning.load() > 0; ++i, ++p.ops) {
                p.current = "reload";
                env().custConfigPath = i % 2 ? mVariantB : pathA;
                expectStatus("reload", mServer->velmoraEvent(kReload, "", 0, nullptr), {0});
                ++reloads;
                p.current = "sleeping";
                usleep(2000 + (i % 3) * 1000);
            }
        });
        for (auto& w : workers) {
            w.join();
        }
    }

    const auto phaseMs =
        std::chrono::duration_cast<milliseconds>(Clock::now() - phaseStart).count();
    RecordProperty("phase_ms", static_cast<int>(phaseMs));
    RecordProperty("operations", totalOps.load());
    RecordProperty("reloads", reloads.load());
    for (const std::string& f : failures) {
        ADD_FAILURE() << f;
    }
    EXPECT_EQ(unexpected.load(), 0);
    EXPECT_GE(reloads.load(), kMinReloads);
    EXPECT_GT(totalOps.load(), 400);
    // A reload swaps the whole table under the write lock: no command ever goes missing.
    EXPECT_EQ(LogCapture::countContaining("doParse failed"), 0);

    // Timed actions carry one of the two configured variants, intact.
    for (const ExecutorCall& c : executor().calls(Op::DoAction)) {
        if (c.id == kTimedAction) {
            EXPECT_EQ(c.name, "winswitch");
            EXPECT_EQ(c.duration, 500);
            EXPECT_TRUE(c.tagValues == (std::vector<int>{1, 1000000}) ||
                        c.tagValues == (std::vector<int>{1, 1000001}));
        } else if (c.id == kColdStart) {
            EXPECT_EQ(c.duration, 80) << "the launch policy replaces the configured duration";
        }
    }

    // Scenes: the current one is the best switched on and the platform last applied it; every
    // other ordinary scene was last withdrawn (or never reached the platform). Governor scenes
    // applied on their own under 4119 are not withdrawn when they switch off.
    int cur = 0;
    std::set<int32_t> on;
    {
        android::Mutex::Autolock lock(mServer->mMutex);
        cur = mServer->mCurSpecialCmdId;
        on = mServer->mOnEventSet;
    }
    EXPECT_EQ(on, std::set<int32_t>(sceneModel.begin(), sceneModel.end()));
    int best = 0;
    for (int id : on) {
        best = std::max(best, kPriorities.at(id));
    }
    if (on.empty()) {
        EXPECT_EQ(cur, 0);
    } else {
        ASSERT_EQ(on.count(cur), 1u) << "current scene " << cur << " is switched off";
        EXPECT_EQ(kPriorities.at(cur), best) << "current scene " << cur;
    }
    std::map<int, int> lastWord;  // scene -> payload of its last platform call
    for (const ExecutorCall& c : executor().calls(Op::DoAction)) {
        if (kPriorities.count(c.id) != 0 && c.payload.size() == 1) {
            lastWord[c.id] = c.payload[0];
        }
    }
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

    // Every thread that was boosted is withdrawn again, by the host or by the worker's
    // lifetime, within a generous bound.
    std::map<unsigned int, int> lastState;
    std::set<unsigned int> boosted;
    const auto drainDeadline = Clock::now() + kProbeDrainBound;
    for (;;) {
        lastState.clear();
        boosted.clear();
        for (const ExecutorCall& c : executor().calls(Op::ProbeTid)) {
            lastState[c.tid] = c.state;
        }
        for (const auto& e : lastState) {
            if (e.second == kOn) {
                boosted.insert(e.first);
            }
        }
        if (boosted.empty() || Clock::now() > drainDeadline) {
            break;
        }
        usleep(10000);
    }
    EXPECT_FALSE(lastState.empty()) << "no probe boost reached the platform";
    EXPECT_TRUE(boosted.empty()) << boosted.size() << " threads still boosted, e.g. tid "
                                 << (boosted.empty() ? 0 : *boosted.begin());

    // Single-threaded epilogue: the remaining dump works on the final state.
    EXPECT_NE(dump("--easgrouplist").find("current eas group value is:"), std::string::npos);
}

}  // namespace
}  // namespace fake
}  // namespace velmora
