#include "tools/insight/SourceLedger.h"

#include <cstdlib>

namespace velmora {

std::string SourceLedger::clientName(int clientId) {
    switch (clientId) {
        case 1:
            return "KX";
        case 2:
            return "JN";
        case 3:
            return "ZOLA";
        default:
            return "client " + std::to_string(clientId);
    }
}

void SourceLedger::set(const std::string& key, const std::string& label, int value, bool client,
                       const CallRef& call) {
    if (value <= 0) {
        auto it = mRequests.find(key);
        if (it != mRequests.end())
            it->second.erase(label);
        return;
    }
    mRequests[key][label] = {value, ++mSeq, client, call};
}

std::map<std::string, SourceLedger::Request> SourceLedger::requestsOf(
    const std::string& label) const {
    std::map<std::string, Request> out;
    for (const auto& node : mRequests) {
        auto it = node.second.find(label);
        if (it != node.second.end())
            out[node.first] = it->second;
    }
    return out;
}

void SourceLedger::restore(const std::string& label,
                           const std::map<std::string, Request>& requests) {
    for (auto& node : mRequests) {
        node.second.erase(label);
    }
    for (const auto& entry : requests) {
        mRequests[entry.first][label] = entry.second;
    }
}

std::string SourceLedger::holderName(const std::string& key, const std::string& value,
                                     const std::string& source, const std::string& previousHolder,
                                     bool valueChanged, const std::string& currentCall) const {
    if (source.empty())
        return "initial";
    if (source == "probe")
        return "probe boost";
    if (source == "sched") {
        // The merged levels do not say which table won; the call that moved the level does.
        if (!valueChanged && previousHolder.compare(0, 6, "sched ") == 0)
            return previousHolder;
        return currentCall.empty() ? "sched levels" : "sched levels (" + currentCall + ")";
    }
    if (source.compare(0, 4, "cmd:") == 0) {
        auto it = mCommands.find(atoi(source.c_str() + 4));
        return it != mCommands.end() ? it->second : "command " + source.substr(4);
    }
    // "freq": the request equal to the merged value. Clients ask for exactly their value; an
    // on/off command is recorded with the merged value it was sent, so among equal ones the
    // earliest set the value and the later ones only found it in force.
    const int v = atoi(value.c_str());
    auto node = mRequests.find(key);
    if (node == mRequests.end())
        return "freq";
    const std::pair<const std::string, Request>* best = nullptr;
    for (const auto& entry : node->second) {
        if (entry.second.value != v)
            continue;
        if (best == nullptr || (entry.second.client && !best->second.client) ||
            (entry.second.client == best->second.client &&
             (entry.second.client ? entry.second.seq > best->second.seq
                                  : entry.second.seq < best->second.seq))) {
            best = &entry;
        }
    }
    return best != nullptr ? best->first : "freq";
}

bool SourceLedger::keepsHolder(const std::string& source, const std::string& previousHolder) {
    if (source.empty())
        return previousHolder == "initial";
    if (source == "probe")
        return previousHolder == "probe boost";
    return source == "sched" && previousHolder.compare(0, 6, "sched ") == 0;
}

std::vector<SourceLedger::Standing> SourceLedger::clientRequests() const {
    std::vector<Standing> out;
    for (const auto& node : mRequests) {
        for (const auto& entry : node.second) {
            if (entry.second.client)
                out.push_back({node.first, entry.first, entry.second});
        }
    }
    return out;
}

}  // namespace velmora
