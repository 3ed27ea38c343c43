// Names the holder of a node's value. The host executor knows its sources only coarsely: "freq"
// is the server's merged frequency configuration, "sched" its merged group levels. The ledger
// keeps what each client (KX, JN, ZOLA, the feature-switch channel) and each on/off command
// asked for per node, so a merged value is traced back to the request that set it: the lowest
// cap of three clients is held by the client that asked for it.
//
// Not thread safe: ReplayInsight calls it under its own lock.
#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <vector>

#include "tools/insight/InsightResult.h"

namespace velmora {

class SourceLedger {
public:
    struct Request {
        int value = 0;
        uint64_t seq = 0;
        bool client = false;
        CallRef call;
    };

    static std::string clientName(int clientId);

    // A request of `label` for `key`; a value of 0 or below releases it.
    void set(const std::string& key, const std::string& label, int value, bool client,
             const CallRef& call);
    // Requests of `label` as they are now, to put back when its call fails.
    std::map<std::string, Request> requestsOf(const std::string& label) const;
    void restore(const std::string& label, const std::map<std::string, Request>& requests);

    // Label of an executor source: "cmd:<id>" as named by nameCommand(), "probe", "sched" with
    // the call that last changed the node's level, "freq" traced back to its request.
    void nameCommand(int cmdId, const std::string& label) { mCommands[cmdId] = label; }
    std::string holderName(const std::string& key, const std::string& value,
                           const std::string& source, const std::string& previousHolder,
                           bool valueChanged, const std::string& currentCall) const;

    // Whether holderName() of an unchanged value names `previousHolder` again whatever the
    // requests: for the baseline, the probe, and the group levels that did not move. Lets a
    // caller skip the lookup for the resolutions that repeat themselves.
    static bool keepsHolder(const std::string& source, const std::string& previousHolder);

    // Every client request still standing, for the end-of-replay warnings.
    struct Standing {
        std::string key;
        std::string label;
        Request request;
    };
    std::vector<Standing> clientRequests() const;

private:
    std::map<std::string, std::map<std::string, Request>> mRequests;  // key -> label -> request
    std::map<int, std::string> mCommands;
    uint64_t mSeq = 0;
};

}  // namespace velmora
