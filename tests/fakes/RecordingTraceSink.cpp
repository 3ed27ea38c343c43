#include "tests/fakes/RecordingTraceSink.h"

namespace velmora {
namespace fake {

void RecordingTraceSink::counter(const char* track, int64_t value) {
    std::lock_guard<std::mutex> lock(mLock);
    mPoints.push_back({track, true, value});
    mChanged.notify_all();
}

void RecordingTraceSink::beginSlice(const char* name) {
    std::lock_guard<std::mutex> lock(mLock);
    mPoints.push_back({name, false, 0});
}

void RecordingTraceSink::endSlice() {
    std::lock_guard<std::mutex> lock(mLock);
    mPoints.push_back({"<end>", false, 0});
}

std::vector<int64_t> RecordingTraceSink::counter(const std::string& track) const {
    std::lock_guard<std::mutex> lock(mLock);
    std::vector<int64_t> values;
    for (const Point& point : mPoints) {
        if (point.isCounter && point.name == track) {
            values.push_back(point.value);
        }
    }
    return values;
}

std::vector<std::string> RecordingTraceSink::slices() const {
    std::lock_guard<std::mutex> lock(mLock);
    std::vector<std::string> names;
    for (const Point& point : mPoints) {
        if (!point.isCounter) {
            names.push_back(point.name);
        }
    }
    return names;
}

bool RecordingTraceSink::waitForCounter(const std::string& track, int64_t value,
                                        std::chrono::milliseconds timeout) const {
    std::unique_lock<std::mutex> lock(mLock);
    return mChanged.wait_for(lock, timeout, [&] {
        for (auto it = mPoints.rbegin(); it != mPoints.rend(); ++it) {
            if (it->isCounter && it->name == track) {
                return it->value == value;
            }
        }
        return false;
    });
}

void RecordingTraceSink::clear() {
    std::lock_guard<std::mutex> lock(mLock);
    mPoints.clear();
}

}  // namespace fake
}  // namespace velmora
