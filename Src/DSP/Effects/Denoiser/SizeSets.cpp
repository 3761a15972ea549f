#include "DSP/Effects/Denoiser/SizeSets.h"

#include <algorithm>

namespace Corvo::DSP::Denoising {

Scale Scale::Of(double rate) {
    constexpr double kRate = 48000.0, kHalfOctave = 1.4142135623730951;
    Scale scale;
    while (scale.numerator < 4 && rate >= kRate * kHalfOctave * scale.numerator) scale.numerator *= 2;
    while (scale.denominator < 4 && rate < kRate / (kHalfOctave * scale.denominator)) scale.denominator *= 2;
    return scale;
}

const SizeSet& SizeSetAt(std::int32_t word) {
    return kSizeSets[static_cast<std::size_t>(
        std::clamp(word, 0, static_cast<std::int32_t>(kSizeSets.size()) - 1))];
}

Format_t FormatOf(int rate, int channels, const SizeSet& set, const Scale& scale) {
    const int length = scale(set.Sizes().back().length);
    return {.rate = rate,
            .channels = channels,
            .fftSize = length,
            .hop = length / kOverlap,
            .windowLength = length,
            .latency = scale(set.latency),
            .bins = length / 2 + 1};
}

}  // namespace Corvo::DSP::Denoising
