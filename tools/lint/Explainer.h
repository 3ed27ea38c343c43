// The --explain listing: for every command the server holds, in document order, how an event of it
// is dispatched (class, duration, priority of scenes) and which pairs the dispatched record
// carries, so a reader sees what the device will do with the configuration:
//
//   4099 cold_launch (line 33): timed action, duration 1500, 2 pairs
//       little_min(1)=1804800 big_min(4)=2419200
//       -> the platform applies the pairs and reverts them after 1500 ms; ...
//
// Stateless; not thread safe (it writes to the caller's stream).
#pragma once

#include <ostream>
#include <vector>

#include "tools/lint/LoadChecker.h"

namespace velmora {

class Explainer {
public:
    explicit Explainer(std::ostream& out) : mOut(out) {}

    void explain(const std::vector<CheckedCommand>& commands);

private:
    void explainOne(const CheckedCommand& command);
    void printPairs(int cmdId, const CheckedRecord& record);

    std::ostream& mOut;
};

}  // namespace velmora
