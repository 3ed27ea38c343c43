// A copy of plain values that a debug dump prints, kept apart from the tables it shows.
//
// A manager holds its request lock through platform calls, so a dump that read its tables would
// either race with a request or wait behind the platform. Instead every operation of the
// manager that changes a printed table publishes a copy of what the dump prints before it
// returns (an entry point once, when it has finished), and the dump reads that copy. The manager
// keeps the values it last published under its own lock and publishes only when they change. mLock is held only to copy the value in or out: it never waits behind
// anything but another copy, and nothing is called while it is held.
//
// T must be a plain value type (arrays of ints, flags): copying it may not allocate or call out.
#pragma once

#include <utils/Mutex.h>

#include <type_traits>

namespace velmora {

template <typename T>
class DumpSnapshot {
    static_assert(std::is_trivially_copyable<T>::value, "a snapshot holds plain values");

public:
    DumpSnapshot() : mValue() {}

    // Replaces the copy. Callers publish while holding their own request lock, so copies
    // arrive in the order the requests finished; mLock is taken after it and is never held
    // while taking another.
    void publish(const T& value) EXCLUDES(mLock) {
        android::Mutex::Autolock lock(mLock);
        mValue = value;
    }

    // The copy as last published.
    T read() const EXCLUDES(mLock) {
        android::Mutex::Autolock lock(mLock);
        return mValue;
    }

private:
    mutable android::Mutex mLock;  // guards mValue; held only for one copy
    T mValue GUARDED_BY(mLock);
};

}  // namespace velmora
