// The random traces the property test and the benchmark replay (tools/tracegen), read back with
// the replay's own parser: the same on every machine for a seed, every line valid, the shares
// they were asked for, and calls kept clear of the deadlines a margin promises.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <string>
#include <utility>
#include <vector>

#include "tools/replay/TraceParser.h"
#include "tools/tracegen/DeadlineBook.h"
#include "tools/tracegen/TraceGenerator.h"

namespace velmora {
namespace {

uint64_t fnv1a(const std::string& text) {
    uint64_t hash = 0xcbf29ce484222325ULL;
    for (unsigned char c : text) {
        hash = (hash ^ c) * 0x100000001b3ULL;
    }
    return hash;
}

std::vector<TraceCall> parse(const std::string& text) {
    std::vector<TraceCall> calls;
    std::string error;
    EXPECT_EQ(0, TraceParser::parseText(text, "generated.trace", &calls, &error)) << error;
    return calls;
}

bool isHostCall(const TraceCall& call) {
    return call.kind == TraceCall::Kind::Event || call.kind == TraceCall::Kind::Reload ||
           call.kind == TraceCall::Kind::SetConfig || call.kind == TraceCall::Kind::GetConfig;
}

// The trace time each call runs at, as the replay reaches it: an "@" time that has passed does
// not wait, a sleep moves on from the time reached.
std::vector<int64_t> runTimes(const std::vector<TraceCall>& calls, int* stampedInThePast) {
    std::vector<int64_t> times;
    int64_t reached = 0;
    for (const TraceCall& call : calls) {
        if (call.atMs >= 0 && call.atMs < reached) {
            ++*stampedInThePast;
        }
        reached = std::max(reached, call.atMs);
        times.push_back(reached);
        if (call.kind == TraceCall::Kind::Sleep) {
            reached += call.sleepMs;
        }
    }
    return times;
}

// Load lines come on top of the same calls, each at the time reached (so none moves the
// replay's clock or is stamped in the past), about one per period, with loads in [0, 1].
TEST(TraceGeneratorTest, LoadLinesLeaveTheCallsAsTheyWere) {
    TraceGenOptions options;
    options.seed = 3;
    options.durationMs = 20000;
    const std::vector<TraceCall> plain = parse(TraceGenerator::generate(options));
    options.loadEveryMs = 100;
    TraceGenStats stats;
    const std::vector<TraceCall> loaded = parse(TraceGenerator::generate(options, &stats));
    std::vector<TraceCall> calls;
    int stampedInThePast = 0;
    const std::vector<int64_t> times = runTimes(loaded, &stampedInThePast);
    int64_t lastLoad = -1;  // period of the last load line
    for (size_t i = 0; i < loaded.size(); ++i) {
        if (loaded[i].kind != TraceCall::Kind::Load) {
            calls.push_back(loaded[i]);
            continue;
        }
        EXPECT_EQ(times[i], loaded[i].atMs);
        EXPECT_GE(loaded[i].atMs, i > 0 ? times[i - 1] : 0);
        EXPECT_GT(loaded[i].atMs / 100, lastLoad) << "at most one per period";
        lastLoad = loaded[i].atMs / 100;
        ASSERT_EQ(3u, loaded[i].loads.size());
        for (const auto& share : loaded[i].loads)
            EXPECT_TRUE(share.u >= 0 && share.u <= 1) << share.domain;
    }
    ASSERT_EQ(plain.size(), calls.size());
    for (size_t i = 0; i < calls.size(); ++i)
        EXPECT_EQ(plain[i].source, calls[i].source) << i;
    EXPECT_GT(stats.loadLines, 150);  // 200 periods, a few without a call in them
    EXPECT_EQ(static_cast<int64_t>(loaded.size() - calls.size()), stats.loadLines);
}

TEST(TraceGeneratorTest, SeedGivesTheSameTraceOnEveryMachine) {
    TraceGenOptions options;
    options.seed = 7;
    const std::string trace = TraceGenerator::generate(options);

    EXPECT_EQ(trace, TraceGenerator::generate(options));
    // Changes whenever the generator's model does; the same on x86-64 and AArch64.
    EXPECT_EQ(0xc9025fca1b14a524ULL, fnv1a(trace)) << std::hex << fnv1a(trace);
    options.seed = 8;
    EXPECT_NE(trace, TraceGenerator::generate(options));
}

TEST(TraceGeneratorTest, HourHoldsTheCallsAndSharesAskedFor) {
    for (const uint32_t probePpm : {150000u, 0u}) {
        SCOPED_TRACE(probePpm);
        TraceGenStats stats;
        const std::vector<TraceCall> calls =
            parse(TraceGenerator::generate(TraceGenOptions::hour(1, probePpm), &stats));
        int hostCalls = 0, probes = 0, sleeps = 0, policies = 0, past = 0;
        for (const TraceCall& call : calls) {
            hostCalls += isHostCall(call);
            probes += call.kind == TraceCall::Kind::Event && call.id == 4116;
            sleeps += call.kind == TraceCall::Kind::Sleep;
            policies += call.kind == TraceCall::Kind::Policy;
        }
        const std::vector<int64_t> times = runTimes(calls, &past);

        EXPECT_EQ(stats.hostCalls, hostCalls);
        EXPECT_NEAR(120000, hostCalls, 6000);
        EXPECT_NEAR(probePpm / 1e6, static_cast<double>(probes) / hostCalls, 0.01);
        EXPECT_GT(sleeps, 100);
        EXPECT_GT(policies, 100);
        EXPECT_GT(past, 10);
        EXPECT_EQ(stats.backwards, past);
        EXPECT_NEAR(3600 * 1000, times.back(), 1000);
    }
}

// No call within the margin of a probe's boost (8 ms after the request) or of the end of its
// lifetime (256 ms after the boost, or after the request when the process was boosted already),
// nor of a launch's or window switch's expiry as configured.
TEST(TraceGeneratorTest, MarginKeepsCallsClearOfDeadlines) {
    constexpr int64_t kMargin = 20;
    for (uint64_t seed = 1; seed <= 20; ++seed) {
        SCOPED_TRACE(seed);
        TraceGenOptions options;
        options.seed = seed;
        options.durationMs = 5000;
        options.marginMs = kMargin;
        const std::vector<TraceCall> calls = parse(TraceGenerator::generate(options));
        int past = 0;
        const std::vector<int64_t> times = runTimes(calls, &past);
        std::vector<int64_t> callTimes;
        std::vector<std::pair<int64_t, size_t>> deadlines;  // and the call that armed it
        for (size_t i = 0; i < calls.size(); ++i) {
            const TraceCall& call = calls[i];
            if (call.kind == TraceCall::Kind::Sleep || call.kind == TraceCall::Kind::Stamp) {
                continue;
            }
            const size_t armedBy = callTimes.size();
            callTimes.push_back(times[i]);
            const bool on = call.kind == TraceCall::Kind::Event && call.payload.size() == 1 &&
                            call.payload[0] == 0;
            if (on && call.id == 4116 && call.text.find("|tid=") != std::string::npos) {
                for (int64_t after : {8, 256, 264}) {
                    deadlines.emplace_back(times[i] + after, armedBy);
                }
            } else if (on && (call.id == 4098 || call.id == 4099)) {
                deadlines.emplace_back(times[i] + (call.id == 4098 ? 400 : 1500), armedBy);
            }
        }
        ASSERT_FALSE(deadlines.empty());
        // Only the calls after the one that armed a deadline can race it.
        for (const auto& [deadline, armedBy] : deadlines) {
            for (size_t i = armedBy + 1; i < callTimes.size(); ++i) {
                EXPECT_FALSE(callTimes[i] > deadline - kMargin && callTimes[i] < deadline + kMargin)
                    << "a call at " << callTimes[i] << " ms, a deadline at " << deadline << " ms";
            }
        }
    }
}

// Moving a call past one deadline may bring it within reach of the next; a deadline the call
// arms moves it too.
TEST(DeadlineBookTest, PlacesCallsAndTheirDeadlinesClearOfTheBook) {
    DeadlineBook book(20);
    for (int64_t ms : {100, 130, 200}) {
        book.add(ms);
    }
    EXPECT_EQ(60, book.clearFrom(60));
    EXPECT_EQ(150, book.clearFrom(90));
    EXPECT_EQ(180, book.placeFrom(150, {40}));
    EXPECT_EQ(220, book.clearFrom(190));
    book.forgetBefore(190);
    EXPECT_EQ(150, book.clearFrom(150));  // 100 and 130 can no longer reach
    EXPECT_EQ(100, DeadlineBook(0).placeFrom(100, {0, 8}));
}

}  // namespace
}  // namespace velmora
