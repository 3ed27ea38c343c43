// What a device node accepts, as its device profile describes it: the available frequencies of
// a cpufreq or devfreq domain, the governors it offers, a numeric range (scheduler-group
// levels, thermal trip points, switches) or a decimal number. A node without a rule takes any
// text. Plain data; see KernelRules for how a written value is judged.
#pragma once

#include <string>
#include <vector>

namespace velmora {

struct ValueRule {
    enum class Type {
        kAny,      // no constraint
        kSteps,    // one of `steps` (ascending); writes between steps are rounded
        kChoices,  // one of `choices` (governor names)
        kRange,    // an integer in min..max
        kDecimal,  // a non-negative decimal number, e.g. "0.6"
    };

    Type type = Type::kAny;
    std::string table;  // the profile's name of the frequency or governor table, for messages
    std::string unit;   // "kHz", "Hz", "mC", ... ("" when the profile gives none)
    std::vector<long long> steps;
    std::vector<std::string> choices;
    long long min = 0;  // kSteps: the lowest step; kRange: the lower bound
    long long max = 0;  // kSteps: the top step; kRange: the upper bound
};

}  // namespace velmora
