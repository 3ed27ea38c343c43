// Combines the requests that several sources make for the same node into the one value the node
// gets, and writes it through the device tree.
//
// Sources are named by the executor: "freq" (merged frequency configuration), "sched" (group
// levels), "cmd:<id>" (an applied action), "probe" (the probe command while threads are boosted).
// How requests combine follows the node's kind (NodeMap.h); with no request left the node goes
// back to its baseline, the value it had when first seen.
//
// Every request is first taken the way the device's kernel takes a write (KernelRules): a
// value the node refuses is dropped (the call reports -1, the source's earlier request stays),
// one between available frequencies is rounded, and the rounding is noted on the timeline.
//
// A source asking again for the value it already holds (the server re-sends every group level
// whenever one of them moves) changes nothing on the node: the request only becomes the latest,
// the observer hears of the same resolution, and nothing is combined or compared anew.
// Not thread safe: the executor calls it under its own lock.
#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <unordered_map>
#include <utility>
#include <vector>

#include "host/device/DeviceTree.h"
#include "host/device/NodeMap.h"
#include "host/record/ExecutorObserver.h"
#include "host/record/Timeline.h"

namespace velmora {

class NodeResolver {
public:
    using Requests = std::vector<std::pair<std::string, std::string>>;  // (node key, value)

    // `timeline` (optional) receives a "device" instant for every rounded or refused request.
    NodeResolver(const NodeMap& nodes, DeviceTree& tree, Timeline* timeline = nullptr);

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
    // Told about every resolution and the source holding the result; null for none.
    void setObserver(ExecutorObserver* observer) { mObserver = observer; }

private:
    struct Request {
        std::string value;
        uint64_t seq = 0;    // order of arrival, for "latest wins"
        bool asked = false;  // `value` is what the source wrote: the node took it unchanged
    };
    struct Node {
        std::map<std::string, Request> requests;  // by source
        // The last resolution, valid when it was written: the value in force and its holder
        // ("" for the baseline), on the tree as it was then.
        bool resolved = false;
        std::string value;
        std::string holder;
        uint64_t treeGeneration = 0;
    };

    int resolve(const std::string& key);
    int resolve(const std::string& key, Node& node);
    // set() for a source re-requesting the value it holds: true when that is the case, with
    // the request refreshed, the observer told and `ret` what set() returns.
    bool refreshHeld(const std::string& key, const std::string& source, const std::string& value,
                     int* ret);
    // The value node `key` takes for `value`; false when the node refuses it (logged).
    bool take(const std::string& key, const std::string& source, const std::string& value,
              std::string* effective);

    const NodeMap& mNodes;
    DeviceTree& mTree;
    Timeline* mTimeline;
    std::unordered_map<std::string, Node> mRequests;                        // by node key
    std::unordered_map<std::string, std::vector<std::string>> mSourceKeys;  // source -> its keys
    uint64_t mSeq = 0;
    ExecutorObserver* mObserver = nullptr;
};

}  // namespace velmora
