#include "tools/logcat/RequestJoiner.h"

namespace velmora {

void RequestJoiner::add(const ServerMessage& pair, int64_t timeUs, int line, int thread,
                        std::vector<JoinedRequest>* done) {
    auto open = mOpen.find(thread);
    if (open != mOpen.end()) {
        const JoinedRequest& r = open->second;
        const bool follows = r.clientId == pair.clientId && r.tagLen == pair.tagLen &&
                             pair.index == r.indexes.back() + 1;
        if (!follows) {
            done->push_back(r);
            mOpen.erase(open);
            open = mOpen.end();
        }
    }
    if (open == mOpen.end()) {
        JoinedRequest r;
        r.timeUs = timeUs;
        r.firstLine = line;
        r.thread = thread;
        r.clientId = pair.clientId;
        r.tagLen = pair.tagLen;
        open = mOpen.emplace(thread, r).first;
    }
    JoinedRequest& r = open->second;
    r.lastLine = line;
    r.indexes.push_back(pair.index);
    r.tags.push_back(pair.tag);
    r.configs.push_back(pair.config);
    if (r.complete()) {
        done->push_back(r);
        mOpen.erase(open);
    }
}

void RequestJoiner::finish(std::vector<JoinedRequest>* done) {
    for (const auto& open : mOpen)
        done->push_back(open.second);
    mOpen.clear();
}

}  // namespace velmora
