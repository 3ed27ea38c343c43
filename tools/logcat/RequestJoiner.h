// Joins the per-pair log lines of client requests back into whole requests.
//
// The server logs one line per pair of a request, in index order, on the thread that called
// it; so the lines of one thread follow on each other, and two threads asking at once (same
// client, same moment) are told apart by their thread id. A request whose lines do not follow
// on each other (a line lost, a layout without thread ids, the log cut) is handed out with
// the pairs that were seen and `complete()` false.
//
// Owned by one import; not thread safe.
#pragma once

#include <cstdint>
#include <map>
#include <vector>

#include "tools/logcat/ServerMessage.h"

namespace velmora {

struct JoinedRequest {
    int64_t timeUs = 0;  // of its first line
    int firstLine = 0;   // log line numbers, 1-based
    int lastLine = 0;
    int thread = 0;  // thread id, or the pid in layouts without thread ids
    int clientId = 0;
    int tagLen = 0;
    std::vector<int> indexes;  // the pairs seen, in order
    std::vector<int> tags;
    std::vector<int> configs;

    bool complete() const { return static_cast<int>(indexes.size()) == tagLen; }
};

class RequestJoiner {
public:
    // Adds the pair line `pair` (kind kSetConfigPair). Appends to `done` the request it
    // completes and any request of the same thread that it cuts short.
    void add(const ServerMessage& pair, int64_t timeUs, int line, int thread,
             std::vector<JoinedRequest>* done);
    // Appends the requests still open at the end of the log: all cut short.
    void finish(std::vector<JoinedRequest>* done);

private:
    std::map<int, JoinedRequest> mOpen;  // by thread
};

}  // namespace velmora
