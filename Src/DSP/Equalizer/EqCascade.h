#pragma once

#include <cstddef>

#include "DSP/Equalizer/EqChannel.h"

namespace Corvo::DSP {

template <typename Sample>
void RunBand(EqBand& band, Sample* samples, std::ptrdiff_t stride, int count, bool gliding) {
    auto& [b0, b1, b2, a1, a2] = band._eq_coeffs;
    double w1 = band.w1, w2 = band.w2;
    for (int i = 0; i < count; ++i, samples += stride) {
        if (gliding) band.ForEachCoefficient([](auto& c) { c.Advance(); });
        const double w = *samples - a1.value * w1 - a2.value * w2;
        *samples = static_cast<Sample>(b0.value * w + b1.value * w1 + b2.value * w2);
        w2 = w1;
        w1 = w;
    }
    band.w1 = w1;
    band.w2 = w2;
}

}  // namespace Corvo::DSP
