// Events and client requests from several host threads: each runs whole, platform call
// included, so the platform never sees two hand-overs at once and the last merge wins.
#include <gtest/gtest.h>

#include <atomic>
#include <thread>
#include <vector>

#include "platform/VelmoraPlat.h"
#include "sched/SchedLevelManager.h"
#include "tests/fakes/FakeExecutor.h"
#include "tests/fakes/LogCapture.h"
#include "tests/sched/SchedTestHelpers.h"

namespace velmora {
namespace fake {
namespace {

// Notes how many hand-overs were inside the platform at the same time.
class OverlapExecutor : public FakeExecutor {
public:
    int doSchedLevelAction(int count, const int* groups, const int* levels) override {
        const int inside = ++mInside;
        int seen = mMaxInside.load();
        while (inside > seen && !mMaxInside.compare_exchange_weak(seen, inside)) {
        }
        std::this_thread::yield();  // widen the window a second caller would hit
        const int ret = FakeExecutor::doSchedLevelAction(count, groups, levels);
        --mInside;
        return ret;
    }

    std::atomic<int> mInside{0};
    std::atomic<int> mMaxInside{0};
};

TEST(SchedLevelManagerConcurrencyTest, EventsAndRequestsAreSerialised) {
    LogCapture::start();
    OverlapExecutor executor;
    VelmoraPlat plat;
    plat.mExecutorPtr = &executor;
    SchedLevelManager manager(&plat);
    const Action defaults = schedEvent(5376, easPairs(0));
    ASSERT_EQ(manager.doEventSchedLevel(&defaults), 0);

    constexpr int kRounds = 200;
    std::atomic<int> failures{0};
    std::thread events([&] {
        const Action up = schedEvent(4500, {53, 30});
        const Action down = schedEvent(4501, {53, 20});
        for (int i = 0; i < kRounds; ++i) {
            failures += manager.doEventSchedLevel(i % 2 == 0 ? &up : &down) != 0;
        }
    });
    std::thread requests([&] {
        const int tag = 42;
        for (int i = 0; i < kRounds; ++i) {
            const int config = packLevel(4, i % 2 == 0 ? -10 : -20);
            failures += manager.doPerfSetSchedLevel(1, 1, &tag, &config) != 0;
        }
    });
    events.join();
    requests.join();

    EXPECT_EQ(failures.load(), 0);
    EXPECT_EQ(executor.mMaxInside.load(), 1);
    // Every call changed something, so each one reached the platform.
    const auto calls = executor.calls(Op::SchedLevel);
    ASSERT_EQ(calls.size(), 2u * kRounds);
    // The last hand-over merged the last event (20 for top-app) and the last request (-20
    // for root).
    EXPECT_EQ(calls.back().values, std::vector<int>({-100, -100, 20, -20, -100, -100, -100, -100}));
}

}  // namespace
}  // namespace fake
}  // namespace velmora
