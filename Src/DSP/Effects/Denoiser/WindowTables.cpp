#include "DSP/Effects/Denoiser/WindowTables.h"

#include <algorithm>
#include <cmath>
#include <new>
#include <numbers>

#include "DSP/Effects/Denoiser/HannWeights.h"
#include "DSP/Effects/Denoiser/SizeSets.h"

namespace Corvo::DSP::Denoising {
namespace {

constexpr double kLowestHz = 100.0, kBandsPerOctave = 0.5;
constexpr std::size_t kMostRatioOfLengths = 16;

double PlaceOf(double hz) { return std::log2(std::max(hz, kLowestHz) / kLowestHz) * kBandsPerOctave; }

}  // namespace

double RiskBandWeight(std::size_t band, double hz) {
    return std::max(0.0, 1.0 - std::abs(PlaceOf(hz) - static_cast<double>(band)));
}

std::size_t RiskBandCount(double rate) {
    return std::min(kRiskBands, static_cast<std::size_t>(std::ceil(PlaceOf(0.5 * rate))) + 1);
}

void Transform(const SpectrumKernels& kernels, WindowTables& tables, const SampleRing& input,
               std::int64_t start, float* re, float* im) {
    input.ForEachRun(start, static_cast<std::size_t>(tables.length),
                     [&](const float* samples, std::size_t done, std::size_t count) {
                         kernels.multiply(tables.scratch.data() + done, samples,
                                          tables.analysis.data() + done, count);
                     });
    tables.fft.DoFFTReal(tables.scratch.data(), re, im, tables.length, 0);
}

void OverlapAdd(const SpectrumKernels& kernels, const WindowTables& tables, const SampleRing& output,
                std::int64_t start) {
    const auto whole = static_cast<std::size_t>(tables.length), begun = whole - whole / kOverlap;
    const float* const from = tables.scratch.data();
    const float* const window = tables.synthesis.data();
    output.ForEachRun(start, begun, [&](float* samples, std::size_t done, std::size_t count) {
        kernels.multiplyAdd(samples, from + done, window + done, count);
    });
    output.ForEachRun(start + static_cast<std::int64_t>(begun), whole - begun,
                      [&](float* samples, std::size_t done, std::size_t count) {
                          kernels.multiply(samples, from + begun + done, window + begun + done, count);
                      });
}

void WindowTables::Prepare(int samples) {
    length = samples;
    const auto count = static_cast<std::size_t>(samples);
    analysis.resize(count);
    synthesis.resize(count);
    scratch.resize(count);
    for (std::size_t i = 0; i < count; ++i) {
        const double turn = 2.0 * std::numbers::pi * static_cast<double>(i) / static_cast<double>(count);
        const double window = std::sqrt(0.5 - 0.5 * std::cos(turn));
        analysis[i] = static_cast<float>(window);
        synthesis[i] = static_cast<float>(0.5 * window);  // four squared windows add up to 2
    }
    fft.AllocateReal(samples, 1);
    // Without memory it transforms nothing and says nothing.
    std::ranges::fill(scratch, 0.0f);
    scratch[1] = 1.0f;
    fft.DoFFTReal(scratch.data(), 0, 0);
    const bool forward = scratch[0] != 0.0f;
    fft.DoIFFTReal(scratch.data(), 0, 0);
    if (!forward || !(scratch[1] > 0.5f)) throw std::bad_alloc();
    masking.Prepare(Bins());
    for (auto& band : riskBands) band.assign(Values(), 0.0f);
}

void WindowTables::SetRate(double rate, int blendLength) {
    masking.SetRate(rate);
    const double width = rate / blendLength;
    const std::size_t gridBins = static_cast<std::size_t>(blendLength) / 2 + 1, last = Half();
    const std::size_t bands = RiskBandCount(rate);
    riskRanges = {};
    const auto ratio = static_cast<std::size_t>(std::max(length / blendLength, 1));
    std::array<float, 2 * kMostRatioOfLengths> hann;
    const auto shape = std::span(hann).first(2 * ratio - 1);
    HannWeights(shape);
    for (std::size_t band = 0; band < bands; ++band) {
        auto& weights = riskBands[band];
        std::ranges::fill(weights, 0.0f);
        const auto add = [&](std::size_t bin, double weight) { weights[bin] += static_cast<float>(weight); };
        for (std::size_t grid = 0; grid < gridBins; ++grid) {
            const double weight = RiskBandWeight(band, static_cast<double>(grid) * width);
            if (weight == 0.0) continue;
            if (length > blendLength) {
                for (std::size_t i = 0; i < shape.size(); ++i) {
                    const std::size_t place = grid * ratio + i;  // ratio - 1 too high, so never negative
                    add(std::min(place < ratio - 1 ? 0 : place - (ratio - 1), last), weight * shape[i]);
                }
            } else {
                const double place = static_cast<double>(grid) * length / blendLength;
                const auto below = static_cast<std::size_t>(place);
                const double share = place - static_cast<double>(below);
                add(below, weight * (1.0 - share));
                if (share > 0.0) add(below + 1, weight * share);
            }
        }
        const auto used = [](float weight) { return weight != 0.0f; };
        const auto first = std::ranges::find_if(weights, used);
        const auto end = std::find_if(weights.rbegin(), weights.rend(), used).base();
        if (first < end)
            riskRanges[band] = {static_cast<std::size_t>(first - weights.begin()),
                                static_cast<std::size_t>(end - weights.begin())};
    }
}

}  // namespace Corvo::DSP::Denoising
