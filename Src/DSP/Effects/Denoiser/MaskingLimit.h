#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <span>

#include "DSP/Parts/Arena.h"

namespace Corvo::DSP::Denoising {

// Leaves noise in place that the estimated signal masks: removing it costs signal and nobody hears it.
// The signal's power is gathered in bands of half a Bark and spread by 10 dB per Bark upwards and 25
// downwards; what lies an offset below that is masked.
class MaskingLimit {
public:
    // For spectra of `bins` bins.
    void Prepare(Arena& arena, std::size_t bins);
    void SetRate(double rate);

    // Raises each gain to what leaves the noise at the masking threshold, at most 1. `noise` times `curve` is
    // the noise's power, `ratio` the power over that.
    void Apply(float* gain, const float* ratio, const float* noise, const float* curve, float offsetDb) const;

private:
    static constexpr std::size_t kBands = 64;

    std::span<std::uint16_t> m_band;  // per bin the lower of its two bands, and the share of the upper one
    float* m_share = nullptr;
    std::array<float, kBands> m_count{};
    std::size_t m_bands = 0;
};

}  // namespace Corvo::DSP::Denoising
