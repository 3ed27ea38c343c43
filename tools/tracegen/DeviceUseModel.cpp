#include "tools/tracegen/DeviceUseModel.h"

#include <algorithm>
#include <cstdio>

namespace velmora {

namespace {

// How often each kind of call comes, in the order of DeviceUseModel::Kind.
const std::vector<uint32_t> kKindWeights = {
    40,   // launch
    60,   // window switch
    8,    // app install
    15,   // a timed action withdrawn
    120,  // scroll begin / end
    30,   // ZOLA level set / restore
    8,    // screen off
    40,   // special scene on / off
    30,   // governor scene on / off
    30,   // on/off command
    25,   // memory latency
    60,   // frequency client
    20,   // thermal client
    25,   // scheduling-level client
    80,   // query
    6,    // notification word
    12,   // launch-policy answer on its own
};

const std::vector<int> kSceneCmds = {4118, 4119, 4120, 4121};
const std::vector<int> kGovernorSceneCmds = {4224, 4230};
const std::vector<int> kOnOffCmds = {12288, 12300};
// Keys in mOn for the states that are not command ids of their own.
constexpr int kScrolling = 4101;
constexpr int kZolaSet = 4114;
constexpr int kLatencyCmd = 20481;

// The example device's frequencies (examples/device/example-device.xml).
const std::vector<int> kLittleKhz = {300000,  403200,  499200,  576000,  672000,  768000,
                                     844800,  940800,  1036800, 1113600, 1209600, 1305600,
                                     1401600, 1497600, 1593600, 1689600, 1804800};
const std::vector<int> kBigKhz = {710400,  825600,  940800,  1056000, 1209600, 1286400, 1401600,
                                  1497600, 1612800, 1708800, 1804800, 1920000, 2016000, 2131200,
                                  2227200, 2323200, 2419200, 2534400, 2649600, 2745600, 2841600};
const std::vector<int> kGpuHz = {257000000, 342000000, 414000000, 500000000,
                                 600000000, 700000000, 800000000, 900000000};

const std::vector<int> kFreqTags = {1, 2, 4, 5, 7, 8};
const std::vector<int> kQueryTags = {1,  2,  4,  5,  7,  8,  17, 18, 19, 20, 22,
                                     24, 26, 50, 51, 52, 53, 54, 55, 56, 57, 58};
const std::vector<int> kPolicyMs = {-1, 300, 600, 900, 1200, 2000, 2500};
const std::vector<int> kNotificationWords = {0x50000, 0x40000, 0x10000, 0};
const std::vector<const char*> kRatios = {"0.3", "0.5", "0.6", "0.7", "0.9"};
// Processes whose threads are probed; each has a main thread (tid == pid) and render threads.
const std::vector<int> kPids = {1200, 2100, 2750, 3300, 4410, 5120, 6001, 7777};
constexpr size_t kMostProbed = 6;

std::string event(int cmdId, int payload) {
    return "event " + std::to_string(cmdId) + " " + std::to_string(payload);
}

}  // namespace

GeneratedCall DeviceUseModel::notification() {
    GeneratedCall call;
    char word[16];
    snprintf(word, sizeof(word), "0x%x", mRandom.among(kNotificationWords));
    call.text = std::string("event 20225 ") + word;
    return call;
}

GeneratedCall DeviceUseModel::reload() {
    GeneratedCall call;
    call.text = "reload";
    return call;
}

std::pair<int, int> DeviceUseModel::probedThread() {
    const int pid = mRandom.among(kPids);
    if (mRandom.chance(3000)) {
        return {pid, 0};  // thread id 0: queued like any other, never boosted on the platform
    }
    return {pid, mRandom.chance(400000) ? pid : renderThread(pid)};
}

int DeviceUseModel::renderThread(int pid) {
    return pid + 1 + static_cast<int>(mRandom.below(24));
}

std::string DeviceUseModel::threadMsg(const std::pair<int, int>& thread) const {
    return "msg=\"pid=" + std::to_string(thread.first) + "|tid=" + std::to_string(thread.second) +
           "\"";
}

GeneratedCall DeviceUseModel::probeRequest(const std::pair<int, int>& thread) {
    if (std::find(mProbed.begin(), mProbed.end(), thread) == mProbed.end()) {
        mProbed.push_back(thread);
    }
    GeneratedCall call;
    call.probe = true;
    call.text = event(4116, 0) + " " + threadMsg(thread);
    // Boosted at once (its process is boosted) or after the delay; either way withdrawn by the
    // worker a lifetime later.
    call.deadlines = {0, kProbeDelayMs, kProbeLifetimeMs, kProbeDelayMs + kProbeLifetimeMs};
    return call;
}

GeneratedCall DeviceUseModel::probeWithdrawal(const std::pair<int, int>& thread) {
    GeneratedCall call;
    call.probe = true;
    call.text = event(4116, -1) + " " + threadMsg(thread);
    call.deadlines = {0};
    return call;
}

GeneratedCall DeviceUseModel::probe() {
    // Often a main thread asked for is followed by its render threads: they skip the delay
    // while the main thread is boosted.
    auto main = std::find_if(mProbed.begin(), mProbed.end(),
                             [](const std::pair<int, int>& t) { return t.first == t.second; });
    if (main != mProbed.end() && mProbed.size() < kMostProbed && mRandom.chance(500000)) {
        return probeRequest({main->first, renderThread(main->first)});
    }
    if (!mProbed.empty() && (mProbed.size() >= kMostProbed || mRandom.chance(450000))) {
        const size_t i = static_cast<size_t>(mRandom.below(mProbed.size()));
        const std::pair<int, int> thread = mProbed[i];
        mProbed.erase(mProbed.begin() + static_cast<std::ptrdiff_t>(i));
        return probeWithdrawal(thread);
    }
    if (mRandom.chance(40000)) {
        return probeWithdrawal(probedThread());  // a thread that was never asked for
    }
    // Mostly a new thread; now and then one asked for already (which keeps its timer).
    return probeRequest(!mProbed.empty() && mRandom.chance(80000) ? mRandom.among(mProbed)
                                                                  : probedThread());
}

std::string DeviceUseModel::policyLine(const char* name, int* policy) {
    // Now and then an answer that disables the launch boost (below -1) or makes it a
    // duration-0 command.
    *policy = mRandom.chance(30000) ? (mRandom.chance(500000) ? 0 : -2) : mRandom.among(kPolicyMs);
    return std::string("policy ") + name + " " + std::to_string(*policy);
}

GeneratedCall DeviceUseModel::launch(int cmdId, const char* policyName, int* policy,
                                     int64_t configuredMs) {
    GeneratedCall call;
    if (mRandom.chance(250000)) {
        call.prelude = policyLine(policyName, policy);
    }
    call.text = event(cmdId, 0);
    // The configured duration, or the policy's answer when launch policies are on.
    call.deadlines = {configuredMs};
    if (*policy > 0) {
        call.deadlines.push_back(*policy);
    }
    return call;
}

GeneratedCall DeviceUseModel::toggle(int cmdId, std::set<int>* on) {
    GeneratedCall call;
    const bool wasOn = on->erase(cmdId) != 0;
    if (!wasOn) {
        on->insert(cmdId);
    }
    call.text = event(cmdId, wasOn ? -1 : 0);
    return call;
}

GeneratedCall DeviceUseModel::memLatency() {
    if (mRandom.chance(600000)) {
        return toggle(kLatencyCmd, &mOn);
    }
    GeneratedCall call;
    if (!mLatencyMsg.empty()) {
        call.text = event(20480, -1) + " " + mLatencyMsg;
        mLatencyMsg.clear();
        return call;
    }
    const int pid = mRandom.among(kPids);
    mLatencyMsg = "msg=\"pid=" + std::to_string(pid) + "|tid=" + std::to_string(pid + 1) +
                  "|ratio_b=" + mRandom.among(kRatios) + " ratio_l=" + mRandom.among(kRatios) +
                  "\"";
    call.text = event(20480, 0) + " " + mLatencyMsg;
    return call;
}

int DeviceUseModel::frequencyFor(int tag) {
    if (mRandom.chance(250000)) {
        return 0;  // the client lets go of the limit
    }
    const std::vector<int>& table = tag <= 2 ? kLittleKhz : tag <= 5 ? kBigKhz : kGpuHz;
    const int value = mRandom.among(table);
    // Sometimes between two available frequencies: the device rounds it.
    return mRandom.chance(50000) ? value + 1000 : value;
}

GeneratedCall DeviceUseModel::freqClient() {
    GeneratedCall call;
    call.text = "setconfig " + std::to_string(1 + mRandom.below(2));
    std::set<int> tags;
    for (int n = static_cast<int>(mRandom.range(1, 3)); n > 0; --n) {
        tags.insert(mRandom.among(kFreqTags));
    }
    for (int tag : tags) {
        call.text += " " + std::to_string(tag) + "=" + std::to_string(frequencyFor(tag));
    }
    return call;
}

GeneratedCall DeviceUseModel::thermalClient() {
    GeneratedCall call;
    const bool release = mRandom.chance(200000);
    call.text = "setconfig 2";
    call.text += " 17=" + std::to_string(release ? 0 : 1000 * mRandom.range(45, 75));
    call.text += " 18=" + std::to_string(release ? 0 : 1000 * mRandom.range(60, 95));
    if (mRandom.chance(500000)) {
        call.text += " 19=" + std::to_string(release ? 0 : 500 * mRandom.range(2, 12));
    }
    return call;
}

GeneratedCall DeviceUseModel::levelClient() {
    GeneratedCall call;
    const int client = mRandom.chance(800000) ? 3 : 1;
    call.text = "setconfig " + std::to_string(client);
    if (mRandom.chance(300000)) {
        call.text += " 40=" + std::to_string(mRandom.below(3));  // back to defaults, down, up
        return call;
    }
    // Group index in the upper half, level + 20 in the lower; levels -20..40 in steps of 10.
    for (int n = static_cast<int>(mRandom.range(1, 2)); n > 0; --n) {
        const int64_t group = mRandom.range(0, 8);
        const int64_t level = 10 * mRandom.range(-2, 4);
        call.text += " 42=" + std::to_string((group << 16) | (level + 20));
    }
    return call;
}

GeneratedCall DeviceUseModel::query() {
    GeneratedCall call;
    call.text = "getconfig";
    for (int n = static_cast<int>(mRandom.range(1, 4)); n > 0; --n) {
        call.text += " " + std::to_string(mRandom.among(kQueryTags));
    }
    return call;
}

GeneratedCall DeviceUseModel::deviceCall() {
    return deviceCall(static_cast<Kind>(mRandom.pick(kKindWeights)));
}

GeneratedCall DeviceUseModel::deviceCall(Kind kind) {
    switch (kind) {
        case kLaunch:
            return launch(4099, "cold", &mColdPolicy, kColdLaunchMs);
        case kWindowSwitch:
            return launch(4098, "winswitch", &mWinSwitchPolicy, kWindowSwitchMs);
        case kAppInstall: {
            GeneratedCall call;
            call.text = event(4100, 0);
            call.deadlines = {kAppInstallMs};
            return call;
        }
        case kTimedWithdraw: {
            GeneratedCall call;
            call.text = event(mRandom.among(std::vector<int>{4098, 4099, 4100}), -1);
            return call;
        }
        case kScroll: {
            GeneratedCall call;
            call.text = event(mOn.count(kScrolling) != 0 ? 4102 : 4101, 0);
            toggle(kScrolling, &mOn);
            return call;
        }
        case kZola: {
            GeneratedCall call;
            call.text = event(mOn.count(kZolaSet) != 0 ? 4113 : 4114, 0);
            toggle(kZolaSet, &mOn);
            return call;
        }
        case kScreenOff: {
            GeneratedCall call;
            call.text = event(4105, 0);
            return call;
        }
        case kScene:
            return toggle(mRandom.among(kSceneCmds), &mOn);
        case kGovernorScene:
            return toggle(mRandom.among(kGovernorSceneCmds), &mOn);
        case kOnOff:
            return toggle(mRandom.among(kOnOffCmds), &mOn);
        case kMemLatency:
            return memLatency();
        case kFreqClient:
            return freqClient();
        case kThermalClient:
            return thermalClient();
        case kLevelClient:
            return levelClient();
        case kQuery:
            return query();
        case kNotification:
            return notification();
        default: {
            GeneratedCall call;
            call.text = mRandom.chance(500000) ? policyLine("cold", &mColdPolicy)
                                               : policyLine("winswitch", &mWinSwitchPolicy);
            call.hostCall = false;
            return call;
        }
    }
}

GeneratedCall DeviceUseModel::oddCall(bool probes) {
    GeneratedCall call;
    // The first two are probe events.
    switch (probes ? mRandom.below(5) : mRandom.range(2, 4)) {
        case 0:
            call.text = event(4116, 1) + " " + threadMsg(probedThread());
            call.probe = true;
            call.deadlines = {0};
            break;
        case 1:
            call.text =
                event(4116, 0) + " msg=\"pid=" + std::to_string(mRandom.among(kPids)) + "\"";
            call.probe = true;
            call.deadlines = {0};
            break;
        case 2:
            call.text = event(4321, 0);  // not in the configuration
            break;
        case 3:
            call.text = "event 4098";  // no payload
            call.deadlines = {kWindowSwitchMs};
            if (mWinSwitchPolicy > 0) {
                call.deadlines.push_back(mWinSwitchPolicy);
            }
            break;
        default:
            call.text = "setconfig 3 42=" + std::to_string((3 << 16) | 99);  // level 79
            break;
    }
    return call;
}

}  // namespace velmora
