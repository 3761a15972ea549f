#pragma once

#include <array>
#include <cstddef>
#include <utility>

#include "DSP/Effects/Denoiser/MaskingLimit.h"
#include "DSP/Effects/Denoiser/SizeSets.h"
#include "DSP/Parts/Arena.h"

namespace Corvo::DSP::Denoising {

constexpr std::size_t kRiskBands = 8;  // at most
constexpr double kGainBandHz = 62.5;   // of the lowest band of gains; the others are octaves
constexpr std::size_t kGainBands = 8;  // octaves from 63 Hz to 8 kHz

// What the bins of windows of one length stand for at a rate.
struct BinTables {
    // For windows of `samples`.
    void Prepare(Arena& arena, int samples);
    // How much each bin counts in each of the bands in which the blend compares sizes: triangles two octaves
    // apart from 100 Hz. They belong to the grid of a spectrum of `blendLength`; a longer window's bins are
    // gathered by a Hann window, a shorter one's interpolated.
    void SetRate(double rate, int blendLength);

    int length = 0;
    MaskingLimit masking;
    // How much each bin counts in a band.
    const float* RiskBand(std::size_t band) const { return m_riskBands + band * Values(); }
    std::array<std::pair<std::size_t, std::size_t>, kRiskBands> riskRanges{};
    float* gainPlace = nullptr;  // per bin the place between the gain bands
    float* riskPlace = nullptr;  // per bin of the blend's own length the place between the risk bands

private:
    std::size_t Values() const { return SpectrumValues(length); }

    float* m_riskBands = nullptr;  // one after the other
};

// A risk band's weight at a frequency, band 0 the lowest; and how many bands there are.
double RiskBandWeight(std::size_t band, double hz);
std::size_t RiskBandCount(double rate);

}  // namespace Corvo::DSP::Denoising
