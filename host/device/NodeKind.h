// How requests for a node combine (NodeKind), and one node of the device (NodeSpec): its logical
// name, where its file is, the value a fresh simulated device starts with and what it accepts.
// Device profiles produce these; the node map, the resolver and the checker read them.
#pragma once

#include <string>

#include "host/device/ValueRule.h"

namespace velmora {

enum class NodeKind {
    Floor,  // the largest request wins; never below the node's initial value
    Cap,    // the smallest request wins; never above the node's initial value
    Value,  // the latest request wins; the initial value when none is left
    Text,   // like Value, for text nodes (governors)
};

struct NodeSpec {
    std::string key;   // logical name, e.g. "cpu.little.max"
    std::string path;  // relative to the device root
    NodeKind kind;
    std::string seed;  // value of a fresh simulated device
    ValueRule rule;    // what the node accepts
    int line = 0;      // line of the node in its device profile
};

}  // namespace velmora
