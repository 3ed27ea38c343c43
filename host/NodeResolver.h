// Combines the requests that several sources make for the same node into the one value the node
// gets, and writes it through the device tree.
//
// Sources are named by the executor: "freq" (merged frequency configuration), "sched" (group
// levels), "cmd:<id>" (an applied action), "probe" (the probe command while threads are boosted).
// How requests combine follows the node's kind (NodeMap.h); with no request left the node goes
// back to its baseline, the value it had when first seen.
// Not thread safe: the executor calls it under its own lock.
#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <utility>
#include <vector>

#include "host/DeviceTree.h"
#include "host/NodeMap.h"

namespace velmora {

class NodeResolver {
public:
    using Requests = std::vector<std::pair<std::string, std::string>>;  // (node key, value)

    NodeResolver(const NodeMap& nodes, DeviceTree& tree);

    // Sets `source`'s request for `key` and writes the node if its value changes. 0 or -1.
    int set(const std::string& key, const std::string& source, const std::string& value);
    // Drops `source`'s request for `key`. 0 or -1.
    int clear(const std::string& key, const std::string& source);
    // Makes `requests` the whole set of `source`'s requests: nodes it no longer names are
    // released. Each affected node is written at most once. 0, or -1 if a write failed.
    int replaceSource(const std::string& source, const Requests& requests);
    // Drops every request of `source`. 0 or -1.
    int clearSource(const std::string& source);
    // Sources holding a request for `key`, for the dump.
    std::vector<std::string> sources(const std::string& key) const;

private:
    struct Request {
        std::string value;
        uint64_t seq;  // order of arrival, for "latest wins"
    };

    int resolve(const std::string& key);

    const NodeMap& mNodes;
    DeviceTree& mTree;
    std::map<std::string, std::map<std::string, Request>> mRequests;  // key -> source -> request
    uint64_t mSeq = 0;
};

}  // namespace velmora
