// How the simulated device takes a value written to one of its nodes, the way the kernel does:
//
// - frequency floors (kind floor) round up to the next available frequency, caps (kind cap)
//   round down to the one below; other frequency nodes take the nearest step, ties upwards;
// - a frequency outside [lowest, top] of its domain, a level or number outside its range, a
//   governor the device does not offer or a ratio that is not a number is refused, as the
//   sysfs node refuses the write (EINVAL);
// - a node without a rule takes any text.
//
// NodeResolver judges every request with it before the request can take part in a node's
// value. Stateless; thread safe.
#pragma once

#include <string>

#include "host/device/NodeKind.h"

namespace velmora {

class KernelRules {
public:
    enum class Verdict { kAccepted, kRounded, kRefused };

    struct Outcome {
        Verdict verdict = Verdict::kAccepted;
        std::string effective;  // the value the node takes (kAccepted, kRounded)
        std::string reason;     // why it was refused, e.g. "1804 is below 300000 kHz"
    };

    // What node `spec` makes of `requested`.
    static Outcome take(const NodeSpec& spec, const std::string& requested);
    // A strict decimal number ("0.6", "1", "12.50"), as memory-latency ratios are written.
    static bool isDecimal(const std::string& text);
};

}  // namespace velmora
