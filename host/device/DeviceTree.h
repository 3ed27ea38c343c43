// The device nodes under one root directory: a simulated tree that this layer creates and seeds,
// or the real one (root "/").
//
// Remembers the last value of every node it touched and writes a node only when the value
// changes; every changing write goes to the timeline. The first value seen of a node (the seed,
// or what the real node held) is its initial value in the timeline and the baseline the
// executor falls back to. Thread safe: the executor, queries and the dump may run concurrently.
//
// A node is written with one pwrite at offset 0 to a descriptor opened at its first write and
// kept open (reopened once when a write fails); a simulated node that gets a shorter value is
// also cut to length. Changing the root closes every descriptor.
#pragma once

#include <atomic>
#include <cstdint>
#include <mutex>
#include <string>
#include <unordered_map>

#include "host/device/NodeMap.h"
#include "host/record/Timeline.h"

namespace velmora {

class DeviceTree {
public:
    DeviceTree(const NodeMap& nodes, Timeline& timeline);
    ~DeviceTree();
    DeviceTree(const DeviceTree&) = delete;
    DeviceTree& operator=(const DeviceTree&) = delete;

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
    // Moves on whenever the tree forgets what it knew (a new root, a fresh seed): values and
    // baselines learnt before may no longer hold.
    uint64_t generation() const { return mGeneration.load(std::memory_order_acquire); }

private:
    struct Node {
        std::string path;
        bool known = false;    // current and baseline are valid
        std::string current;   // last known value
        std::string baseline;  // first known value
        int fd = -1;           // kept open for writing
        bool regular = false;  // a plain file (simulated): shorter values cut it to length
    };

    // The record of `key`, created on first use; null for an unknown key. REQUIRES: mLock.
    Node* nodeLocked(const std::string& key);
    // Reads the node's value unless known. REQUIRES: mLock held.
    bool loadLocked(const std::string& key, Node& node);
    // Writes `text` and a newline; false (errno set) when the node cannot be written.
    static bool writeNode(Node& node, const std::string& text);
    static bool openNode(Node& node);
    // Closes every descriptor and forgets every value. REQUIRES: mLock held.
    void forgetLocked();

    const NodeMap& mNodes;
    Timeline& mTimeline;
    mutable std::mutex mLock;  // guards everything below
    std::string mRoot;
    std::unordered_map<std::string, Node> mNodeState;  // by key
    std::atomic<uint64_t> mGeneration{0};              // bumped by forgetLocked, read without mLock
};

}  // namespace velmora
