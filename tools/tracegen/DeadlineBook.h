// The instants at which the replayed device does something on its own, as far as a trace
// generator can foresee them from the calls it wrote: timed actions expiring, the probe worker
// boosting a queued thread, a boost running out, the worker's pass right after a probe call.
// A call placed within a few milliseconds of one of them makes a real-time replay a race
// (which one goes first depends on scheduling), and so do two deadlines close together; a
// generator that wants traces whose every replay agrees keeps calls and deadlines apart.
#pragma once

#include <cstdint>
#include <set>
#include <vector>

namespace velmora {

class DeadlineBook {
public:
    // `marginMs`: how far a call must stay from every deadline; 0 keeps nothing clear.
    explicit DeadlineBook(int64_t marginMs) : mMarginMs(marginMs) {}

    void add(int64_t ms);
    // The earliest time at or after `ms` that is at least the margin away from every deadline.
    int64_t clearFrom(int64_t ms) const;
    bool isClear(int64_t ms) const { return clearFrom(ms) == ms; }
    // The earliest time at or after `ms` for a call that arms deadlines `offsets` ms after it:
    // the call and each of those deadlines clear of every deadline in the book. (Two deadlines
    // close together race each other in real time just as a call and a deadline do.)
    int64_t placeFrom(int64_t ms, const std::vector<int64_t>& offsets) const;
    bool fits(int64_t ms, const std::vector<int64_t>& offsets) const {
        return placeFrom(ms, offsets) == ms;
    }
    // Forgets deadlines that no call at or after `ms` can come near.
    void forgetBefore(int64_t ms);
    int64_t marginMs() const { return mMarginMs; }

private:
    int64_t mMarginMs;
    std::multiset<int64_t> mDeadlines;
};

}  // namespace velmora
