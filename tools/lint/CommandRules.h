// What the server does with the commands it loaded: the start-up command 5376 and the probe
// command 4116 that init needs, and per dispatch class what an event of each command would be
// refused for or do unexpectedly (scheduling-level pairs, on/off frequency pairs, special-scene
// priorities, disabled commands, commands no event reads).
//
// Only the dispatched record (the first accepted action) is judged: it is the one an event
// parses. Stateless apart from the diagnostics it reports to; not thread safe.
#pragma once

#include <vector>

#include "config/Tags.h"
#include "tools/lint/Diagnostics.h"
#include "tools/lint/LoadChecker.h"

namespace velmora {

class CommandRules {
public:
    static constexpr int kMinPriority = kScenePriorityMin;
    static constexpr int kMaxPriority = kScenePriorityMax;

    // `policyLine` is where findings about missing commands go.
    CommandRules(Diagnostics& diagnostics, int policyLine)
        : mDiagnostics(diagnostics), mPolicyLine(policyLine) {}

    void check(const std::vector<CheckedCommand>& commands);

    // The priority a scene's record configures (the last tag-101 pair, or for governor scenes
    // the last "priority" string pair read with atoi); `given` tells whether there was one,
    // `index` (when not null) receives the index of that pair.
    static int configuredPriority(int cmdId, const Action& action, bool* given,
                                  int* index = nullptr);
    // The priority the server ends up with for scene `command`: the configured one when valid
    // and read, else the built-in one, else 0 (every switch refused).
    static int effectivePriority(const CheckedCommand& command);
    static bool isValidPriority(int priority) {
        return priority >= kMinPriority && priority <= kMaxPriority;
    }

private:
    void checkStartup(const CheckedCommand* command);
    void checkProbe(const CheckedCommand* command);
    void checkCommand(const CheckedCommand& command);
    void checkSchedLevels(const CheckedCommand& command, const CheckedRecord& record);
    void checkOnOff(const CheckedCommand& command, const CheckedRecord& record);
    void checkScenePriority(const CheckedCommand& command, const CheckedRecord& record);
    void checkGovernorScenesUnderHost(const std::vector<CheckedCommand>& commands);

    Diagnostics& mDiagnostics;
    int mPolicyLine;
};

}  // namespace velmora
