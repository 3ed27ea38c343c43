// How busy the example device's frequency domains are while a user does one thing or another:
// a utilisation in [0, 1] per domain (cpu.little, cpu.big, gpu: the domains with an <energy> table
// in examples/device/example-device.xml), written as the trace's `load` lines. Each activity has a
// typical level per domain; a sample moves part of the way from the last value towards it,
// with some noise, so that a scroll or a launch shows as a rise over a few samples rather than
// a step.
#pragma once

#include <array>
#include <cstdint>
#include <string>

#include "tools/tracegen/SplitMix64.h"

namespace velmora {

class LoadModel {
public:
    enum Activity { kIdle, kApp, kScrolling, kLaunching, kGame, kActivityCount };
    static constexpr size_t kDomains = 3;
    static const std::array<const char*, kDomains> kDomainIds;

    explicit LoadModel(SplitMix64& random);

    // The next sample while the user does `activity`, as a line without its time:
    // "load cpu.little=0.35 cpu.big=0.70 gpu=0.65".
    std::string sample(Activity activity);

private:
    SplitMix64& mRandom;
    std::array<int, kDomains> mPercent;  // the last sample, in hundredths
};

}  // namespace velmora
