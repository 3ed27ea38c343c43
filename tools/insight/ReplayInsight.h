// Watches one replay and works out who held each node's value at every moment, how long each
// node sat at each value, what stayed applied at the end, and the spans of scenes, on/off
// commands, timed actions and probe boosts.
//
// Fed through two narrow doors: the host calls of the replay (beginCall/endCall, from the
// replay thread) and the host executor's observer interface (from whichever thread carries out
// a request). Reads time from the host clock. Thread safe: mLock guards everything; it is taken
// inside the executor's lock and never calls out while held.
#pragma once

#include <cstdint>
#include <functional>
#include <map>
#include <mutex>
#include <set>
#include <string>
#include <unordered_map>
#include <vector>

#include "host/device/NodeMap.h"
#include "host/record/ExecutorObserver.h"
#include "host/time/HostClock.h"
#include "tools/insight/ChangeHolders.h"
#include "tools/insight/InsightResult.h"
#include "tools/insight/SourceLedger.h"

namespace velmora {

// One host call as the analysis sees it.
struct CallRecord {
    enum class Kind { Event, SetConfig, Other };
    Kind kind = Kind::Other;
    int id = 0;  // event: cmdId; setconfig: clientId
    std::vector<int> payload;
    std::string msg;
    std::vector<int> tags;
    std::vector<int> values;
    std::string where;  // "file:line"
    std::string text;   // as written
    int64_t atUs = -1;  // the call's "@" time when it has one
};

class ReplayInsight : public ExecutorObserver {
public:
    // Configured name of a command; called only from beginCall, with no lock held.
    using NameLookup = std::function<std::string(int cmdId)>;

    ReplayInsight(HostClock& clock, const NodeMap& nodes, NameLookup names);

    // The value a node starts with (time 0), before anything is replayed.
    void setInitial(const std::string& key, const std::string& value);
    // For comparing two runs of one trace; nothing is kept per call otherwise. Before the first
    // call: keepCallDigests() keeps every call's status and digest in the result (the first
    // run); compareWith(an earlier run's digests) has the result name the first call whose
    // digest differs (the second run).
    void keepCallDigests();
    void compareWith(std::vector<uint64_t> digests);
    void beginCall(CallRecord call);
    void endCall(int status);

    // Everything found, with the trace ending now. Open spans end here. Call once: the
    // records move into the result.
    InsightResult finish();
    // Holder of `key` at trace time `us` in a finished result, "" when unknown.
    static std::string holderAt(const InsightResult& result, const std::string& key, int64_t us);
    // Per node, the holder of the value it took in each change (index 0: the initial value),
    // matching the timeline's samples one to one.
    static ChangeHolders holdersByChange(const InsightResult& result);

    // ExecutorObserver
    void onCommandApplied(int cmdId, const std::string& category, const std::string& name,
                          int durationMs) override;
    void onCommandWithdrawn(int cmdId, bool expired) override;
    void onProbeBoost(unsigned int tid, bool boosted) override;
    void onFreqConfig(int id, const std::string& key, int value) override;
    void onNodeResolved(const std::string& key, const std::string& value,
                        const std::string& source) override;

private:
    struct NodeTrack {
        std::string initial;
        std::string value;
        std::string holder = "initial";
        int changes = 0;
        std::vector<HolderSegment> segments;
    };
    struct Applied {
        std::string category;
        std::string name;
        int64_t beginUs = 0;
        CallRef call;
    };

    CallRef currentCallLocked() const;  // REQUIRES: mLock held
    void closeSpanLocked(const std::string& category, const std::string& name, int64_t beginUs,
                         int64_t endUs, const CallRef& call, bool expired);
    void stuckWarningsLocked(InsightResult* result) const;

    HostClock& mClock;
    const NodeMap& mNodes;
    NameLookup mNames;

    mutable std::mutex mLock;  // guards everything below
    SourceLedger mLedger;
    std::unordered_map<std::string, NodeTrack> mTracks;
    std::vector<std::string> mOrder;  // node keys in order of first sight
    bool mInCall = false;
    CallRecord mCall;
    CallRef mCallRef;
    // Looked up before the call: the lookup takes the parser's lock, which must never be taken
    // inside the executor (the probe worker calls it while a reload may hold the parser).
    std::string mCallName;   // configured name of the event's command
    std::string mCallLabel;  // "KX", "event 4114 zola_level", ...
    std::map<std::string, SourceLedger::Request> mClientBefore;  // to undo a failed request
    uint64_t mDigest = 0;  // FNV-1a over the current call's node changes
    int mCallCount = 0;
    bool mKeepDigests = false;
    std::vector<uint64_t> mDigests;  // when kept
    std::vector<int> mStatus;        // when kept
    std::vector<uint64_t> mEarlier;  // an earlier run's digests, to find where this one parts
    CallRef mDivergentCall;
    int mDivergentStatus = 0;
    std::map<int, Applied> mApplied;              // executor: applied commands by cmdId
    std::map<int, Applied> mOnOff;                // calls: on/off commands switched on
    std::set<int> mSwitchedOff;                   // calls: scenes last switched off by the host
    std::map<unsigned int, CallRef> mProbeCalls;  // the call that queued each thread
    std::map<unsigned int, Applied> mBoosts;
    std::vector<SpanInsight> mSpans;
};

}  // namespace velmora
