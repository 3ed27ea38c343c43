#include "host/device/NodeResolver.h"

#include <algorithm>
#include <cstdlib>

#include "host/device/profile/KernelRules.h"
#include "platform/VelmoraLog.h"

namespace velmora {

NodeResolver::NodeResolver(const NodeMap& nodes, DeviceTree& tree, Timeline* timeline)
    : mNodes(nodes), mTree(tree), mTimeline(timeline) {}

bool NodeResolver::take(const std::string& key, const std::string& source, const std::string& value,
                        std::string* effective) {
    const NodeSpec* spec = mNodes.find(key);
    if (spec == nullptr) {
        *effective = value;  // resolve() reports the missing node
        return true;
    }
    const KernelRules::Outcome outcome = KernelRules::take(*spec, value);
    switch (outcome.verdict) {
        case KernelRules::Verdict::kAccepted:
            *effective = value;
            return true;
        case KernelRules::Verdict::kRounded:
            *effective = outcome.effective;
            if (mTimeline != nullptr) {
                mTimeline->recordInstant(
                    "device", key + " requested " + value + ", effective " + outcome.effective);
            }
            return true;
        case KernelRules::Verdict::kRefused:
            break;
    }
    VLOGE("host: %s refuses '%s' from %s: %s", key.c_str(), value.c_str(), source.c_str(),
          outcome.reason.c_str());
    if (mTimeline != nullptr) {
        mTimeline->recordInstant("device", key + " refused " + value + ": " + outcome.reason);
    }
    return false;
}

bool NodeResolver::refreshHeld(const std::string& key, const std::string& source,
                               const std::string& value, int* ret) {
    auto node = mRequests.find(key);
    if (node == mRequests.end() || !node->second.resolved || node->second.holder != source ||
        node->second.treeGeneration != mTree.generation()) {
        return false;
    }
    auto request = node->second.requests.find(source);
    if (request == node->second.requests.end() || !request->second.asked ||
        request->second.value != value) {
        return false;
    }
    // The holder of a floor or cap stays the holder as the latest of equal requests, and the
    // holder of a "latest wins" node was the latest already: the node keeps its value.
    request->second.seq = ++mSeq;
    if (mObserver != nullptr) {
        mObserver->onNodeResolved(key, node->second.value, source);
    }
    // Written as resolve() would: the tree writes nothing when the node holds the value.
    *ret = mTree.write(key, node->second.value);
    node->second.resolved = *ret == 0;
    return true;
}

int NodeResolver::set(const std::string& key, const std::string& source, const std::string& value) {
    int ret = 0;
    if (refreshHeld(key, source, value, &ret)) {
        return ret;
    }
    std::string effective;
    if (!take(key, source, value, &effective)) {
        return -1;
    }
    const bool asked = effective == value;
    Node& node = mRequests[key];
    node.requests[source] = {std::move(effective), ++mSeq, asked};
    std::vector<std::string>& keys = mSourceKeys[source];
    if (std::find(keys.begin(), keys.end(), key) == keys.end()) {
        keys.push_back(key);
    }
    return resolve(key, node);
}

int NodeResolver::clear(const std::string& key, const std::string& source) {
    auto it = mRequests.find(key);
    if (it == mRequests.end() || it->second.requests.erase(source) == 0) {
        return 0;
    }
    std::vector<std::string>& keys = mSourceKeys[source];
    keys.erase(std::remove(keys.begin(), keys.end(), key), keys.end());
    return resolve(key, it->second);
}

int NodeResolver::replaceSource(const std::string& source, const Requests& requests) {
    std::vector<std::string>& keys = mSourceKeys[source];
    std::vector<std::string> touched;
    touched.swap(keys);
    for (const auto& key : touched) {
        mRequests[key].requests.erase(source);
    }
    int ret = 0;
    for (const auto& request : requests) {
        std::string effective;
        if (!take(request.first, source, request.second, &effective)) {
            ret = -1;
            continue;
        }
        const bool asked = effective == request.second;
        mRequests[request.first].requests[source] = {std::move(effective), ++mSeq, asked};
        if (std::find(keys.begin(), keys.end(), request.first) == keys.end()) {
            keys.push_back(request.first);
        }
    }
    touched.insert(touched.end(), keys.begin(), keys.end());
    std::sort(touched.begin(), touched.end());
    touched.erase(std::unique(touched.begin(), touched.end()), touched.end());
    for (const auto& key : touched) {
        ret |= resolve(key);
    }
    return ret;
}

int NodeResolver::clearSource(const std::string& source) {
    return replaceSource(source, {});
}

std::vector<std::string> NodeResolver::sources(const std::string& key) const {
    std::vector<std::string> out;
    auto it = mRequests.find(key);
    if (it != mRequests.end()) {
        for (const auto& entry : it->second.requests) {
            out.push_back(entry.first);
        }
    }
    return out;
}

int NodeResolver::resolve(const std::string& key) {
    return resolve(key, mRequests[key]);
}

int NodeResolver::resolve(const std::string& key, Node& node) {
    node.resolved = false;
    const uint64_t generation = mTree.generation();
    const NodeSpec* spec = mNodes.find(key);
    std::string base;
    if (spec == nullptr || !mTree.baseline(key, &base)) {
        VLOGE("host: node %s is not available", key.c_str());
        return -1;
    }
    const auto& requests = node.requests;
    std::string value = base;
    const std::string* holder = nullptr;  // source whose request is in force; none: the baseline
    if (spec->kind == NodeKind::Floor || spec->kind == NodeKind::Cap) {
        const bool floor = spec->kind == NodeKind::Floor;
        long long best = strtoll(base.c_str(), nullptr, 10);
        long long held = 0;
        uint64_t heldSeq = 0;
        for (const auto& entry : requests) {
            const long long v = strtoll(entry.second.value.c_str(), nullptr, 10);
            if (spec->kind == NodeKind::Cap && v <= 0) {
                continue;  // 0 is "no limit", never a cap of zero
            }
            if (floor ? v > best : v < best) {
                best = v;
            }
            // The winning request; among equal ones the latest, which replaced the others.
            if (holder == nullptr || (floor ? v > held : v < held) ||
                (v == held && entry.second.seq > heldSeq)) {
                holder = &entry.first;
                held = v;
                heldSeq = entry.second.seq;
            }
        }
        if (holder != nullptr && held != best) {
            holder = nullptr;  // the baseline is beyond every request
        }
        value = std::to_string(best);
    } else {
        uint64_t latest = 0;
        for (const auto& entry : requests) {
            if (entry.second.seq > latest) {
                latest = entry.second.seq;
                value = entry.second.value;
                holder = &entry.first;
            }
        }
    }
    if (mObserver != nullptr) {
        mObserver->onNodeResolved(key, value, holder != nullptr ? *holder : std::string());
    }
    const int ret = mTree.write(key, value);
    if (ret == 0) {
        node.resolved = true;
        node.holder = holder != nullptr ? *holder : std::string();
        node.value = std::move(value);
        node.treeGeneration = generation;
    }
    return ret;
}

}  // namespace velmora
