// The device nodes under one root directory: a simulated tree that this layer creates and seeds,
// or the real one (root "/").
//
// Remembers the last value of every node it touched and writes a node only when the value
// changes; every changing write goes to the timeline. The first value seen of a node (the seed,
// or what the real node held) is its initial value in the timeline and the baseline the
// executor falls back to. Thread safe: the executor, queries and the dump may run concurrently.
#pragma once

#include <map>
#include <mutex>
#include <string>

#include "host/NodeMap.h"
#include "host/Timeline.h"

namespace velmora {

class DeviceTree {
public:
    DeviceTree(const NodeMap& nodes, Timeline& timeline);

    // Uses `root` from now on and forgets every remembered value. "/" is the real device.
    void setRoot(const std::string& root);
    std::string root() const;
    bool simulated() const;

    // Creates the simulated tree (directories and every node at its seed value, overwriting
    // earlier contents: a fresh device). 0, or -1 with a log line when a file cannot be written.
    // Does nothing on the real device.
    int seed();

    // Full path of node `key`, or "" for an unknown key.
    std::string pathOf(const std::string& key) const;
    // Current value of `key` (remembered, else read from the node). False when unreadable.
    bool read(const std::string& key, std::string* text);
    // Writes `text` to `key` unless the node already holds it. 0 written or unchanged, -1 on
    // failure (unknown key, unwritable node; logged).
    int write(const std::string& key, const std::string& text);
    // The value `key` had when first seen (what requests fall back to). False when unreadable.
    bool baseline(const std::string& key, std::string* text);

private:
    // REQUIRES: mLock held.
    bool loadLocked(const std::string& key, const NodeSpec& spec);

    const NodeMap& mNodes;
    Timeline& mTimeline;
    mutable std::mutex mLock;  // guards everything below
    std::string mRoot;
    std::map<std::string, std::string> mCurrent;   // last known value per key
    std::map<std::string, std::string> mBaseline;  // first known value per key
};

}  // namespace velmora
