#include "tools/tracegen/TraceGenerator.h"

#include <algorithm>
#include <cstdio>

namespace velmora {

namespace {

// Share of calls made at the same instant as the one before.
constexpr uint32_t kSameTimePpm = 50000;
// What a replay runs on for after the last probe boost has gone.
constexpr int64_t kSettleMs = 20;
// How far below the time reached a call stamped in the past may be.
constexpr int64_t kMostBackwardsMs = 1000;

std::string share(uint32_t ppm) {
    char text[32];
    snprintf(text, sizeof(text), "%g", ppm / 1e6);
    return text;
}

}  // namespace

TraceGenOptions TraceGenOptions::hour(uint64_t seed, uint32_t probePpm) {
    TraceGenOptions options;
    options.seed = seed;
    options.durationMs = 3600 * 1000;
    options.meanGapMs = 30;
    options.probePpm = probePpm;
    options.sleepPpm = 5000;
    options.backwardsPpm = 1000;
    options.reloadPpm = 500;
    options.oddPpm = 1000;
    return options;
}

TraceGenerator::TraceGenerator(const TraceGenOptions& options)
    : mOptions(options),
      mRandom(options.seed),
      mModel(mRandom),
      mBook(options.marginMs),
      mNow(options.startMs),
      mLoadRandom(options.seed ^ 0x10ad10ad10ad10adULL) {}

std::string TraceGenerator::generate(const TraceGenOptions& options, TraceGenStats* stats) {
    TraceGenerator generator(options);
    std::string text = generator.run();
    if (stats != nullptr) {
        *stats = generator.mStats;
    }
    return text;
}

std::string TraceGenerator::run() {
    mText = "# Generated: velmora-gen-trace " + arguments(mOptions) + "\n";
    write("@" + std::to_string(mNow) + " ", mModel.notification());
    while (mNow < mOptions.durationMs) {
        loads();
        mBook.forgetBefore(mNow);
        if (mRandom.chance(mOptions.sleepPpm)) {
            sleep();
            continue;
        }
        const GeneratedCall call = nextCall();
        write(stamp(call.deadlines), call);
    }
    if (mOptions.marginMs > 0) {
        // The replay runs on until no probe boost is left, then kSettleMs more: the trace ends
        // past the last boost, and no deadline falls near either end.
        const int64_t end =
            mBook.placeFrom(std::max(mNow, mLastProbeDeadline + mOptions.marginMs), {kSettleMs});
        if (end > mNow) {
            line("sleep " + std::to_string(end - mNow));
            ++mStats.sleeps;
            mNow = end;
        }
    }
    mStats.endMs = mNow;
    return std::move(mText);
}

GeneratedCall TraceGenerator::nextCall() {
    if (mRandom.chance(mOptions.reloadPpm)) {
        return mModel.reload();
    }
    if (mRandom.chance(mOptions.oddPpm)) {
        return mModel.oddCall(mOptions.probePpm > 0);
    }
    if (mRandom.chance(mOptions.probePpm)) {
        return mModel.probe();
    }
    return mModel.deviceCall();
}

std::string TraceGenerator::stamp(const std::vector<int64_t>& deadlines) {
    if (mRandom.chance(mOptions.backwardsPpm) && mBook.fits(mNow, deadlines)) {
        ++mStats.backwards;
        const int64_t back =
            1 + static_cast<int64_t>(mRandom.below(std::min<int64_t>(mNow, kMostBackwardsMs)));
        return "@" + std::to_string(mNow - back) + " ";
    }
    if (mRandom.chance(kSameTimePpm) && mBook.fits(mNow, deadlines)) {
        return mRandom.chance(500000) ? "" : "@" + std::to_string(mNow) + " ";
    }
    mNow = mBook.placeFrom(mNow + mRandom.range(1, 2 * mOptions.meanGapMs - 1), deadlines);
    return "@" + std::to_string(mNow) + " ";
}

void TraceGenerator::sleep() {
    int64_t ms;
    const uint64_t kind = mRandom.below(20);
    if (kind == 0) {
        ms = mRandom.range(600, 1500);  // past boosts' lifetimes and most timed actions
    } else if (kind < 6) {
        ms = mRandom.range(50, 600);
    } else {
        ms = mRandom.range(1, 2 * mOptions.meanGapMs);
    }
    // Either from the time reached or from a time of its own.
    const std::string at = mRandom.chance(500000) ? "" : stamp({});
    // A call without a time may follow: the sleep ends clear of deadlines.
    const int64_t end = mBook.clearFrom(mNow + ms);
    line(at + "sleep " + std::to_string(end - mNow));
    ++mStats.sleeps;
    mNow = end;
}

void TraceGenerator::write(const std::string& at, const GeneratedCall& call) {
    if (!call.prelude.empty()) {
        line(at + call.prelude);
        line(call.text);
    } else {
        line(at + call.text);
    }
    for (int64_t after : call.deadlines) {
        mBook.add(mNow + after);
        if (call.probe) {
            mLastProbeDeadline = std::max(mLastProbeDeadline, mNow + after);
        }
    }
    if (call.hostCall) {
        ++mStats.hostCalls;
    }
    if (call.probe) {
        ++mStats.probeEvents;
    }
}

void TraceGenerator::line(const std::string& text) {
    mText += text;
    mText += '\n';
    ++mStats.lines;
}

void TraceGenerator::loads() {
    if (mOptions.loadEveryMs <= 0 || mNow < mNextLoadMs)
        return;
    static const char* const kDomains[] = {"cpu.little", "cpu.big", "gpu"};
    std::string text = "@" + std::to_string(mNow) + " load";
    for (int i = 0; i < 3; ++i) {
        // A walk of at most 0.1 a step, held inside [0, 1].
        const int step = static_cast<int>(mLoadRandom.range(0, 200)) - 100;
        mLoadPermille[i] = std::min(1000, std::max(0, mLoadPermille[i] + step));
        char share[32];
        snprintf(share, sizeof(share), " %s=%d.%03d", kDomains[i], mLoadPermille[i] / 1000,
                 mLoadPermille[i] % 1000);
        text += share;
    }
    line(text);
    ++mStats.loadLines;
    mNextLoadMs = (mNow / mOptions.loadEveryMs + 1) * mOptions.loadEveryMs;
}

std::string TraceGenerator::arguments(const TraceGenOptions& o) {
    std::string args = "--seed " + std::to_string(o.seed);
    args += " --start-ms " + std::to_string(o.startMs);
    args += " --duration-ms " + std::to_string(o.durationMs);
    args += " --mean-gap-ms " + std::to_string(o.meanGapMs);
    args += " --probe-share " + share(o.probePpm);
    args += " --sleep-share " + share(o.sleepPpm);
    args += " --backwards-share " + share(o.backwardsPpm);
    args += " --reload-share " + share(o.reloadPpm);
    args += " --odd-share " + share(o.oddPpm);
    args += " --margin-ms " + std::to_string(o.marginMs);
    if (o.loadEveryMs > 0)
        args += " --load-every-ms " + std::to_string(o.loadEveryMs);
    return args;
}

}  // namespace velmora
