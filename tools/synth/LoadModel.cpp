#include "tools/synth/LoadModel.h"

#include <algorithm>
#include <cstdio>

namespace velmora {

namespace {

// Typical utilisation in hundredths per activity and domain (cpu.little, cpu.big, gpu).
// A game keeps the big cluster and the GPU near their top; scrolling mostly the little
// cluster and the GPU's composition; a launch the big cluster for a second or two.
const std::array<std::array<int, LoadModel::kDomains>, LoadModel::kActivityCount> kTypical = {{
    {{8, 2, 1}},     // idle, screen off
    {{30, 15, 15}},  // an app in the foreground
    {{55, 35, 45}},  // scrolling
    {{70, 85, 30}},  // launching
    {{60, 85, 90}},  // a game
}};
// Share of the way towards the typical level one sample goes, in percent.
constexpr int kFollowPercent = 60;
// Noise around the typical level, in hundredths either way.
constexpr int kNoise = 12;

}  // namespace

const std::array<const char*, LoadModel::kDomains> LoadModel::kDomainIds = {"cpu.little", "cpu.big",
                                                                            "gpu"};

LoadModel::LoadModel(SplitMix64& random) : mRandom(random) {
    mPercent = kTypical[kIdle];
}

std::string LoadModel::sample(Activity activity) {
    std::string line = "load";
    for (size_t d = 0; d < kDomains; ++d) {
        const int target = kTypical[activity][d] + static_cast<int>(mRandom.range(-kNoise, kNoise));
        int& value = mPercent[d];
        value += (target - value) * kFollowPercent / 100;
        value = std::clamp(value, 0, 100);
        char text[16];
        snprintf(text, sizeof(text), "=%d.%02d", value / 100, value % 100);
        line += std::string(" ") + kDomainIds[d] + text;
    }
    return line;
}

}  // namespace velmora
