#include "tools/tracegen/DeadlineBook.h"

#include <algorithm>

namespace velmora {

void DeadlineBook::add(int64_t ms) {
    if (mMarginMs > 0) {
        mDeadlines.insert(ms);
    }
}

int64_t DeadlineBook::clearFrom(int64_t ms) const {
    if (mMarginMs <= 0) {
        return ms;
    }
    // A deadline d is too close to t when t - margin < d < t + margin. Moving t past the
    // latest such d may bring the next ones into reach; deadlines are sorted, so one walk does.
    int64_t t = ms;
    for (auto it = mDeadlines.upper_bound(t - mMarginMs); it != mDeadlines.end(); ++it) {
        if (*it >= t + mMarginMs) {
            break;
        }
        t = *it + mMarginMs;
    }
    return t;
}

int64_t DeadlineBook::placeFrom(int64_t ms, const std::vector<int64_t>& offsets) const {
    // Each pass only moves the call later; it stops once a pass leaves it where it was.
    for (int64_t t = ms;;) {
        int64_t next = clearFrom(t);
        for (int64_t offset : offsets) {
            next = std::max(next, clearFrom(next + offset) - offset);
        }
        if (next == t) {
            return t;
        }
        t = next;
    }
}

void DeadlineBook::forgetBefore(int64_t ms) {
    mDeadlines.erase(mDeadlines.begin(), mDeadlines.lower_bound(ms - mMarginMs));
}

}  // namespace velmora
