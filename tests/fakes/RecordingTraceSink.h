// Test trace sink: records every trace point the library makes, in order, so a test checks
// what each entry point traced without a device. Thread safe (the probe worker traces too).
#pragma once

#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <mutex>
#include <string>
#include <vector>

#include "trace/TraceSink.h"

namespace velmora {
namespace fake {

class RecordingTraceSink : public TraceSink {
public:
    void counter(const char* track, int64_t value) override;
    void beginSlice(const char* name) override;
    void endSlice() override;

    // Values counter `track` took, in order.
    std::vector<int64_t> counter(const std::string& track) const;
    // Names of the slices begun, in order; "<end>" stands for each end. So a nested slice
    // shows as {"outer", "inner", "<end>", "<end>"}.
    std::vector<std::string> slices() const;
    // Waits until counter `track` last took `value`.
    bool waitForCounter(const std::string& track, int64_t value,
                        std::chrono::milliseconds timeout) const;
    void clear();

private:
    struct Point {
        std::string name;  // track, slice name, or "<end>"
        bool isCounter;
        int64_t value;
    };

    mutable std::mutex mLock;  // guards mPoints
    mutable std::condition_variable mChanged;
    std::vector<Point> mPoints;
};

}  // namespace fake
}  // namespace velmora
