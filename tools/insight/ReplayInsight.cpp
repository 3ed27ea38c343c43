#include "tools/insight/ReplayInsight.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>

#include "config/CommandKind.h"

namespace velmora {

namespace {

constexpr uint64_t kDigestSeed = 14695981039346656037ull;

// FNV-1a, continued over `text` and a separator.
uint64_t digest(uint64_t hash, const std::string& text) {
    for (char c : text) {
        hash = (hash ^ static_cast<unsigned char>(c)) * 1099511628211ull;
    }
    return (hash ^ 0xff) * 1099511628211ull;
}

}  // namespace

ReplayInsight::ReplayInsight(HostClock& clock, const NodeMap& nodes, NameLookup names)
    : mClock(clock), mNodes(nodes), mNames(std::move(names)) {}

void ReplayInsight::setInitial(const std::string& key, const std::string& value) {
    std::lock_guard<std::mutex> lock(mLock);
    if (mTracks.count(key) != 0)
        return;
    NodeTrack& track = mTracks[key];
    track.initial = track.value = value;
    track.segments.push_back({0, value, "initial"});
    mOrder.push_back(key);
}

void ReplayInsight::keepCallDigests() {
    std::lock_guard<std::mutex> lock(mLock);
    mKeepDigests = true;
}

void ReplayInsight::compareWith(std::vector<uint64_t> digests) {
    std::lock_guard<std::mutex> lock(mLock);
    mEarlier = std::move(digests);
}

CallRef ReplayInsight::currentCallLocked() const {
    return mInCall ? mCallRef : CallRef();
}

void ReplayInsight::beginCall(CallRecord call) {
    const int64_t now = std::max(mClock.nowUs(), call.atUs);
    std::string name;
    if (call.kind == CallRecord::Kind::Event && mNames)
        name = mNames(call.id);
    std::lock_guard<std::mutex> lock(mLock);
    mInCall = true;
    // Buffers are reused from call to call: this runs for every call of long replays.
    mCallRef.index = mCallCount;
    mCallRef.where = std::move(call.where);
    mCallRef.text = std::move(call.text);
    mCallRef.us = now;
    mCall = std::move(call);
    mCallName = name;
    if (mCall.kind == CallRecord::Kind::SetConfig) {
        mCallLabel = SourceLedger::clientName(mCall.id);
    } else if (mCall.kind == CallRecord::Kind::Event) {
        mCallLabel.assign("event ").append(std::to_string(mCall.id));
        if (!name.empty())
            mCallLabel.append(" ").append(name);
    } else {
        mCallLabel = mCallRef.text;
    }
    mDigest = kDigestSeed;
    if (mCall.kind == CallRecord::Kind::SetConfig) {
        // Clients ask for exactly these values; the server merges them with the others.
        const std::string label = SourceLedger::clientName(mCall.id);
        mClientBefore = mLedger.requestsOf(label);
        for (size_t i = 0; i < mCall.tags.size() && i < mCall.values.size(); ++i) {
            const std::string& key = mNodes.keyForTag(mCall.tags[i]);
            if (!key.empty())
                mLedger.set(key, label, mCall.values[i], /*client=*/true, mCallRef);
        }
    }
}

void ReplayInsight::endCall(int status) {
    const int64_t now = mClock.nowUs();
    std::lock_guard<std::mutex> lock(mLock);
    if (mCall.kind == CallRecord::Kind::SetConfig && status != 0) {
        mLedger.restore(SourceLedger::clientName(mCall.id), mClientBefore);
    }
    if (mCall.kind == CallRecord::Kind::Event && status == 0 && !mCall.payload.empty()) {
        const int cmdId = mCall.id;
        const bool on = mCall.payload[0] == 0;
        const bool off = mCall.payload[0] == -1;
        if (classify(cmdId) == CommandKind::kProbe && on) {
            int pid = 0;
            unsigned int tid = 0;
            if (sscanf(mCall.msg.c_str(), "pid=%d|tid=%u", &pid, &tid) == 2)
                mProbeCalls[tid] = mCallRef;
        } else if (isOnOffId(cmdId) && on && mOnOff.count(cmdId) == 0) {
            mOnOff[cmdId] = {"onoff",
                             std::to_string(cmdId) + (mCallName.empty() ? "" : " " + mCallName),
                             now, mCallRef};
        } else if (isOnOffId(cmdId) && off && mOnOff.count(cmdId) != 0) {
            const Applied applied = mOnOff[cmdId];
            mOnOff.erase(cmdId);
            closeSpanLocked("onoff", applied.name, applied.beginUs, now, applied.call, false);
        }
        if (on)
            mSwitchedOff.erase(cmdId);
        else if (off)
            mSwitchedOff.insert(cmdId);
    }
    const uint64_t callDigest = digest(mDigest, std::to_string(status));
    if (mKeepDigests) {
        mDigests.push_back(callDigest);
        mStatus.push_back(status);
    }
    const size_t index = static_cast<size_t>(mCallCount);
    if (mDivergentCall.index < 0 && index < mEarlier.size() && mEarlier[index] != callDigest) {
        mDivergentCall = mCallRef;
        mDivergentStatus = status;
    }
    ++mCallCount;
    mInCall = false;
}

void ReplayInsight::onCommandApplied(int cmdId, const std::string& category,
                                     const std::string& name, int durationMs) {
    const int64_t now = mClock.nowUs();
    std::lock_guard<std::mutex> lock(mLock);
    const std::string label = std::string(category == "action" ? "action" : category) + " " +
                              std::to_string(cmdId) + (name.empty() ? "" : " " + name);
    mLedger.nameCommand(cmdId, label);
    if (category == "onoff")
        return;  // spans of on/off commands follow their calls: most never reach the executor
    auto it = mApplied.find(cmdId);
    if (it != mApplied.end()) {
        if (durationMs <= 0)
            return;  // applied again while applied: one span
        // A timed action re-armed: the span so far ends, a new one starts.
        closeSpanLocked(category, it->second.name, it->second.beginUs, now, it->second.call, false);
        mApplied.erase(it);
    }
    const std::string spanName = std::to_string(cmdId) + (name.empty() ? "" : " " + name);
    mApplied[cmdId] = {category, spanName, now, currentCallLocked()};
}

void ReplayInsight::onCommandWithdrawn(int cmdId, bool expired) {
    const int64_t now = mClock.nowUs();
    std::lock_guard<std::mutex> lock(mLock);
    auto it = mApplied.find(cmdId);
    if (it == mApplied.end())
        return;
    closeSpanLocked(it->second.category, it->second.name, it->second.beginUs, now, it->second.call,
                    expired);
    mApplied.erase(it);
}

void ReplayInsight::onProbeBoost(unsigned int tid, bool boosted) {
    const int64_t now = mClock.nowUs();
    std::lock_guard<std::mutex> lock(mLock);
    if (boosted) {
        auto call = mProbeCalls.find(tid);
        mBoosts[tid] = {"probe", "tid " + std::to_string(tid), now,
                        call != mProbeCalls.end() ? call->second : CallRef()};
        return;
    }
    auto it = mBoosts.find(tid);
    if (it != mBoosts.end()) {
        closeSpanLocked("probe", it->second.name, it->second.beginUs, now, it->second.call, false);
        mBoosts.erase(it);
    }
}

void ReplayInsight::onFreqConfig(int id, const std::string& key, int value) {
    if (id < 4)
        return;  // clients: their own requests were taken from the call
    std::lock_guard<std::mutex> lock(mLock);
    const bool off = mInCall && mCall.kind == CallRecord::Kind::Event && mCall.id == id &&
                     !mCall.payload.empty() && mCall.payload[0] == -1;
    // The merged configuration of an on/off command arrives during its own call.
    const std::string name = mInCall && mCall.id == id ? mCallName : std::string();
    const std::string label = "onoff " + std::to_string(id) + (name.empty() ? "" : " " + name);
    mLedger.set(key, label, off ? 0 : value, /*client=*/false, currentCallLocked());
}

void ReplayInsight::onNodeResolved(const std::string& key, const std::string& value,
                                   const std::string& source) {
    const int64_t now = mClock.nowUs();
    std::lock_guard<std::mutex> lock(mLock);
    auto it = mTracks.find(key);
    if (it == mTracks.end()) {
        mTracks[key].initial = value;  // a node nobody read first: its history starts here
        mTracks[key].value = value;
        mTracks[key].segments.push_back({0, value, "initial"});
        mOrder.push_back(key);
        it = mTracks.find(key);
    }
    NodeTrack& track = it->second;
    const bool changed = value != track.value;
    if (!changed && SourceLedger::keepsHolder(source, track.holder))
        return;
    const std::string holder =
        mLedger.holderName(key, value, source, track.holder, changed, mInCall ? mCallLabel : "");
    if (!changed && holder == track.holder)
        return;
    if (changed) {
        ++track.changes;
        mDigest = digest(digest(mDigest, key), value);
    }
    track.value = value;
    track.holder = holder;
    // Every change gets a segment, also several in one instant: they match the timeline's
    // samples one to one. A change that falls due while the clock moves on to the call's time
    // (a timer running out on the way) is the timer's, not the call's.
    const bool byCall = mInCall && now >= mCallRef.us;
    track.segments.push_back({now, value, holder, byCall ? mCallRef.index : -1});
}

void ReplayInsight::closeSpanLocked(const std::string& category, const std::string& name,
                                    int64_t beginUs, int64_t endUs, const CallRef& call,
                                    bool expired) {
    mSpans.push_back({"", category, name, beginUs, endUs, false, call, expired});  // track: later
}

}  // namespace velmora
