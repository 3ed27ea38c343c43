// Checks the values of a configuration against one device's profile, the way the device's
// kernel would take them when the host layer writes them:
//
// - a frequency outside [lowest, top] of its domain, a group level outside the device's level
//   range, a number outside a node's range, a governor the device does not offer or a
//   memory-latency ratio that is not a number: error, the device refuses the write; with a
//   note when the value is about 1000 times off the node's range (kHz written for Hz, or the
//   other way round) and a did-you-mean for governors;
// - a frequency between two available frequencies: note naming the step the kernel uses;
// - a floor of one long-lived command (special scene, on/off command) above the cap of another
//   that can be on at the same time: warning naming both lines.
//
// Judges the dispatched record of every command the server reads. Stateless apart from the
// diagnostics it reports to; not thread safe.
#pragma once

#include <string>
#include <vector>

#include "host/device/NodeMap.h"
#include "tools/lint/Diagnostics.h"
#include "tools/lint/LoadChecker.h"

namespace velmora {

class ValueChecker {
public:
    ValueChecker(const NodeMap& nodes, Diagnostics& diagnostics)
        : mNodes(nodes), mDiagnostics(diagnostics) {}

    void check(const std::vector<CheckedCommand>& commands);

private:
    // A floor or cap one command holds while it is on.
    struct Limit {
        const CheckedCommand* command;
        int pair;
        long long value;
    };

    void checkRecord(const CheckedCommand& command, const CheckedRecord& record);
    // Judges `text` written to node `key` by pair `i` of `record`.
    void checkValue(const CheckedCommand& command, const CheckedRecord& record, int i,
                    const std::string& key, const std::string& text);
    void checkFloorsAgainstCaps(const std::vector<CheckedCommand>& commands);
    static bool canBeOnTogether(int a, int b);

    const NodeMap& mNodes;
    Diagnostics& mDiagnostics;
};

}  // namespace velmora
