// The first pass over a trace before it is replayed: every bad line is reported, and of the good
// lines only what the warnings about calls that are surely not meant need is kept: the distinct
// event command ids and launch-policy names, each with where it is first used and how many calls
// use it; the placeholders velmora-import-logcat left for the user to fill in (a probe or a
// memory-latency event whose message the log lacked, msg="pid=0|tid=0"), which a replay would
// otherwise run without a word: the probe boosts nothing, the memory-latency event fails. Load
// lines are checked against the device's energy tables. It holds no call, so a long trace costs
// what it has distinct, not what it has lines.
#pragma once

#include <functional>
#include <map>
#include <string>
#include <vector>

#include "tools/replay/TraceParser.h"

namespace velmora {

class LoadDomains;

class TraceSurvey {
public:
    struct Use {
        TraceCall::Kind kind = TraceCall::Kind::Event;  // Event or Policy
        int cmdId = 0;                                  // Event
        std::string policy;                             // Policy: the name asked for
        std::string where;                              // "file:line" of the first use
        int calls = 0;                                  // calls using it
    };
    struct Placeholder {
        std::string where;  // "file:line"
        int cmdId = 0;
    };
    // Placeholders kept with their place; more are counted only.
    static constexpr size_t kKeptPlaceholders = 10;
    // The message the importer writes where the log lacks one.
    static constexpr const char* kPlaceholderMsg = "pid=0|tid=0";
    using ErrorSink = std::function<void(const std::string& message)>;

    // Reads the trace at `path`, giving `onError` the message of every bad line (or the one
    // saying the trace cannot be opened). The number of such messages.
    int read(const std::string& path, const ErrorSink& onError);
    void add(const TraceCall& call);
    // From now on a load line naming a domain without an energy table is a bad line too.
    void checkLoadsWith(const LoadDomains* domains) { mLoadDomains = domains; }

    // Event command ids and policy names, in order of first use.
    const std::vector<Use>& uses() const { return mUses; }
    // The first kKeptPlaceholders placeholders, and how many there are in all.
    const std::vector<Placeholder>& placeholders() const { return mPlaceholders; }
    size_t placeholderCount() const { return mPlaceholderCount; }

private:
    const LoadDomains* mLoadDomains = nullptr;
    std::vector<Use> mUses;
    std::vector<Placeholder> mPlaceholders;
    size_t mPlaceholderCount = 0;
    std::map<int, size_t> mEvents;            // cmdId -> index in mUses
    std::map<std::string, size_t> mPolicies;  // name -> index in mUses
};

}  // namespace velmora
