#include "host/NodeResolver.h"

#include <cstdlib>
#include <set>

#include "platform/VelmoraLog.h"

namespace velmora {

NodeResolver::NodeResolver(const NodeMap& nodes, DeviceTree& tree) : mNodes(nodes), mTree(tree) {}

int NodeResolver::set(const std::string& key, const std::string& source, const std::string& value) {
    mRequests[key][source] = {value, ++mSeq};
    return resolve(key);
}

int NodeResolver::clear(const std::string& key, const std::string& source) {
    auto it = mRequests.find(key);
    if (it == mRequests.end() || it->second.erase(source) == 0) {
        return 0;
    }
    return resolve(key);
}

int NodeResolver::replaceSource(const std::string& source, const Requests& requests) {
    std::set<std::string> touched;
    for (auto& entry : mRequests) {
        if (entry.second.erase(source) != 0) {
            touched.insert(entry.first);
        }
    }
    for (const auto& request : requests) {
        mRequests[request.first][source] = {request.second, ++mSeq};
        touched.insert(request.first);
    }
    int ret = 0;
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
        for (const auto& entry : it->second) {
            out.push_back(entry.first);
        }
    }
    return out;
}

int NodeResolver::resolve(const std::string& key) {
    const NodeSpec* spec = mNodes.find(key);
    std::string base;
    if (spec == nullptr || !mTree.baseline(key, &base)) {
        VLOGE("host: node %s is not available", key.c_str());
        return -1;
    }
    const auto& requests = mRequests[key];
    std::string value = base;
    if (spec->kind == NodeKind::Floor || spec->kind == NodeKind::Cap) {
        long long best = strtoll(base.c_str(), nullptr, 10);
        for (const auto& entry : requests) {
            const long long v = strtoll(entry.second.value.c_str(), nullptr, 10);
            if (spec->kind == NodeKind::Cap && v <= 0) {
                continue;  // 0 is "no limit", never a cap of zero
            }
            if (spec->kind == NodeKind::Floor ? v > best : v < best) {
                best = v;
            }
        }
        value = std::to_string(best);
    } else {
        uint64_t latest = 0;
        for (const auto& entry : requests) {
            if (entry.second.seq > latest) {
                latest = entry.second.seq;
                value = entry.second.value;
            }
        }
    }
    return mTree.write(key, value);
}

}  // namespace velmora
