#include "tools/synth/SessionSynth.h"

#include <algorithm>

namespace velmora {

namespace {

constexpr int kGameScene = 4119;
constexpr int kGameBigPerformance = 4224;
constexpr int kGameGpuPerformance = 4230;
constexpr int kGameLatency = 20481;
// Share of games, in parts per million, after which the game's scenes stay on (the app
// crashed, the host missed the exit): what a fleet run finds left applied.
constexpr uint32_t kLeftOnPpm = 100000;

}  // namespace

SessionSynth::SessionSynth(const SessionOptions& options)
    : mOptions(options), mRandom(options.seed), mModel(mRandom), mLoad(mRandom) {}

std::string SessionSynth::generate(const SessionOptions& options, SessionStats* stats) {
    SessionSynth synth(options);
    std::string text = synth.run();
    if (stats != nullptr) {
        *stats = synth.mStats;
    }
    return text;
}

std::string SessionSynth::run() {
    mText = "# Generated: velmora-synth --seed " + std::to_string(mOptions.seed) +
            " --duration-ms " + std::to_string(mOptions.durationMs) +
            (mOptions.load ? "" : " --no-load") + "\n";
    advance(0);  // the load from the start, before the first call
    write(mModel.notification());
    while (mNow < mOptions.durationMs) {
        const uint64_t next = mRandom.below(10);
        if (next < 3) {
            idle(mNow + mRandom.range(15000, 90000));
        } else if (next < 8) {
            app(mNow + mRandom.range(20000, 120000));
        } else {
            game(mNow + mRandom.range(60000, 240000));
        }
    }
    return std::move(mText);
}

void SessionSynth::idle(int64_t until) {
    ++mStats.idles;
    mActivity = LoadModel::kIdle;
    write(mModel.deviceCall(DeviceUseModel::kScreenOff));
    while (mNow < until && mNow < mOptions.durationMs) {
        advance(8000);
        write(mModel.deviceCall(mRandom.chance(300000) ? DeviceUseModel::kNotification
                                                       : DeviceUseModel::kQuery));
    }
}

void SessionSynth::app(int64_t until) {
    ++mStats.apps;
    mActivity = LoadModel::kLaunching;
    write(mModel.deviceCall(DeviceUseModel::kLaunch));
    const int64_t launched = mNow + 1500;
    while (mNow < until && mNow < mOptions.durationMs) {
        advance(400);
        if (mActivity == LoadModel::kLaunching && mNow >= launched) {
            mActivity = LoadModel::kApp;
        }
        const uint64_t what = mRandom.below(100);
        if (what < 30) {
            write(mModel.probe());
        } else if (what < 45) {
            write(mModel.deviceCall(DeviceUseModel::kScroll));
            if (mActivity != LoadModel::kLaunching) {
                mActivity =
                    mActivity == LoadModel::kScrolling ? LoadModel::kApp : LoadModel::kScrolling;
            }
        } else if (what < 55) {
            write(mModel.deviceCall(DeviceUseModel::kWindowSwitch));
        } else if (what < 75) {
            write(mModel.deviceCall(DeviceUseModel::kQuery));
        } else if (what < 85) {
            write(mModel.deviceCall(DeviceUseModel::kFreqClient));
        } else if (what < 90) {
            write(mModel.deviceCall(DeviceUseModel::kZola));
        } else if (what < 95) {
            write(mModel.deviceCall(DeviceUseModel::kLevelClient));
        } else {
            write(mModel.deviceCall(DeviceUseModel::kPolicy));
        }
    }
}

void SessionSynth::game(int64_t until) {
    ++mStats.games;
    mActivity = LoadModel::kLaunching;
    write(mModel.deviceCall(DeviceUseModel::kLaunch));
    advance(1500);
    mActivity = LoadModel::kGame;
    for (int cmd : {kGameScene, kGameBigPerformance, kGameGpuPerformance, kGameLatency}) {
        if (!mModel.isOn(cmd) && (cmd == kGameScene || mRandom.chance(600000))) {
            write(mModel.toggle(cmd));
        }
    }
    while (mNow < until && mNow < mOptions.durationMs) {
        advance(600);
        const uint64_t what = mRandom.below(100);
        if (what < 45) {
            write(mModel.probe());
        } else if (what < 60) {
            write(mModel.deviceCall(DeviceUseModel::kThermalClient));
        } else if (what < 70) {
            write(mModel.deviceCall(DeviceUseModel::kFreqClient));
        } else if (what < 75) {
            write(mModel.deviceCall(DeviceUseModel::kMemLatency));
        } else {
            write(mModel.deviceCall(DeviceUseModel::kQuery));
        }
    }
    if (mRandom.chance(kLeftOnPpm)) {
        return;
    }
    // The game scene first: a governor scene switched off while the game scene is current
    // stays applied.
    for (int cmd : {kGameScene, kGameLatency, kGameGpuPerformance, kGameBigPerformance}) {
        if (mModel.isOn(cmd)) {
            advance(200);
            write(mModel.toggle(cmd));
        }
    }
}

void SessionSynth::advance(int64_t meanMs) {
    if (meanMs > 0) {
        mNow += mRandom.range(1, 2 * meanMs - 1);
    }
    if (!mOptions.load) {
        return;
    }
    while (mNextLoadMs <= mNow) {
        line("@" + std::to_string(mNextLoadMs) + " " + mLoad.sample(mActivity));
        ++mStats.loadLines;
        mNextLoadMs += mOptions.loadPeriodMs;
    }
}

void SessionSynth::write(const GeneratedCall& call) {
    const std::string at = "@" + std::to_string(mNow) + " ";
    if (!call.prelude.empty()) {
        line(at + call.prelude);
        line(call.text);
    } else {
        line(at + call.text);
    }
    if (call.hostCall) {
        ++mStats.hostCalls;
    }
}

void SessionSynth::line(const std::string& text) {
    mText += text;
    mText += '\n';
}

}  // namespace velmora
