// The trace generator's random numbers: splitmix64, with the few draws the generator needs
// derived from it by integer arithmetic only. The standard library's distributions are not
// used on purpose: their output is left to each implementation, and a seed must give the same
// trace on every machine the tests run on (x86-64, AArch64 under an emulator).
#pragma once

#include <cstdint>
#include <vector>

namespace velmora {

class SplitMix64 {
public:
    explicit SplitMix64(uint64_t seed) : mState(seed) {}

    uint64_t next() {
        uint64_t z = (mState += 0x9E3779B97F4A7C15ULL);
        z = (z ^ (z >> 30)) * 0xBF58476D1CE4E5B9ULL;
        z = (z ^ (z >> 27)) * 0x94D049BB133111EBULL;
        return z ^ (z >> 31);
    }

    // Uniform in [0, n); 0 when n is 0. The modulo bias is below 2^-40 for every n used here.
    uint64_t below(uint64_t n) { return n == 0 ? 0 : next() % n; }

    // Uniform in [lo, hi]; lo when hi < lo.
    int64_t range(int64_t lo, int64_t hi) {
        return hi <= lo ? lo : lo + static_cast<int64_t>(below(static_cast<uint64_t>(hi - lo) + 1));
    }

    // True with probability `perMillion` / 1,000,000.
    bool chance(uint32_t perMillion) { return below(1000000) < perMillion; }

    // Index of an entry of `weights` drawn in proportion to its weight; 0 when all are 0.
    size_t pick(const std::vector<uint32_t>& weights) {
        uint64_t total = 0;
        for (uint32_t w : weights) {
            total += w;
        }
        uint64_t draw = below(total);
        for (size_t i = 0; i < weights.size(); ++i) {
            if (draw < weights[i]) {
                return i;
            }
            draw -= weights[i];
        }
        return 0;
    }

    template <typename T>
    const T& among(const std::vector<T>& items) {
        return items[static_cast<size_t>(below(items.size()))];
    }

private:
    uint64_t mState;
};

}  // namespace velmora
