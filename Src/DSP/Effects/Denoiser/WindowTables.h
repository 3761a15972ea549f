#pragma once

#include <array>
#include <cstddef>
#include <utility>

#include "DSP/Effects/Denoiser/Arena.h"
#include "DSP/Effects/Denoiser/MaskingLimit.h"
#include "DSP/Effects/Denoiser/SpectrumKernels.h"
#include "Spectrum/Fft/CorvoFFT.h"

namespace Corvo::DSP::Denoising {

constexpr std::size_t kRiskBands = 8;  // at most

// What the parts of the reducer share for windows of one length; made before processing.
struct WindowTables {
    // Allocates for windows of `samples`; throws std::bad_alloc.
    void Prepare(int samples);
    // How much each bin counts in each of the bands in which the blend compares sizes: triangles two octaves
    // apart from 100 Hz. They belong to the grid of a spectrum of `blendLength`; a longer window's bins are
    // gathered by a Hann window, a shorter one's interpolated.
    void SetRate(double rate, int blendLength);

    int length = 0;
    Floats analysis, synthesis;  // square roots of a Hann window; the second sums to one over the overlap
    CorvoFFT fft;
    Floats scratch;
    MaskingLimit masking;
    std::array<Floats, kRiskBands> riskBands;  // how much each bin counts in each band of the blend
    std::array<std::pair<std::size_t, std::size_t>, kRiskBands> riskRanges{};

    std::size_t Half() const { return static_cast<std::size_t>(length) / 2; }
    std::size_t Bins() const { return Half() + 1; }
    // Values per frame in memory.
    std::size_t Values() const { return (Bins() + 15) / 16 * 16; }
};

// The split spectrum of the windowed samples from `start` on.
void Transform(const SpectrumKernels& kernels, WindowTables& tables, const SampleRing& input,
               std::int64_t start, float* re, float* im);
// Adds tables.scratch, windowed, to the samples from `start` on; the last hop of them is begun anew.
void OverlapAdd(const SpectrumKernels& kernels, const WindowTables& tables, const SampleRing& output,
                std::int64_t start);

// A risk band's weight at a frequency, band 0 the lowest; and how many bands there are.
double RiskBandWeight(std::size_t band, double hz);
std::size_t RiskBandCount(double rate);

}  // namespace Corvo::DSP::Denoising
