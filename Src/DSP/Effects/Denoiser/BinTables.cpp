#include "DSP/Effects/Denoiser/BinTables.h"

#include <algorithm>
#include <cmath>
#include <span>

#include "DSP/Effects/Denoiser/HannWeights.h"

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

void BinTables::Prepare(Arena& arena, int samples) {
    length = samples;
    masking.Prepare(arena, static_cast<std::size_t>(samples) / 2 + 1);
    m_riskBands = arena.Take(kRiskBands * Values());
    gainPlace = arena.Take(Values());
    riskPlace = arena.Take(Values());
}

void BinTables::SetRate(double rate, int blendLength) {
    for (std::size_t bin = 0; bin < Values(); ++bin) {
        const double hz = static_cast<double>(bin) * rate / length;
        gainPlace[bin] =
            static_cast<float>(std::clamp(std::log2(std::max(hz, 1.0) / kGainBandHz), 0.0, kGainBands - 1.0));
    }
    masking.SetRate(rate);
    const double width = rate / blendLength;
    const std::size_t gridBins = static_cast<std::size_t>(blendLength) / 2 + 1,
                      last = static_cast<std::size_t>(length) / 2;
    const std::size_t bands = RiskBandCount(rate);
    riskRanges = {};
    for (std::size_t bin = 0; bin < gridBins && length == blendLength; ++bin) {
        const double hz = static_cast<double>(bin) * rate / length;
        riskPlace[bin] = 0.0f;
        for (std::size_t band = 0; band < bands; ++band)
            riskPlace[bin] += static_cast<float>(RiskBandWeight(band, hz) * static_cast<double>(band));
    }
    const auto ratio = static_cast<std::size_t>(std::max(length / blendLength, 1));
    std::array<float, 2 * kMostRatioOfLengths> hann;
    const auto shape = std::span(hann).first(2 * ratio - 1);
    HannWeights(shape);
    for (std::size_t band = 0; band < bands; ++band) {
        const auto weights = std::span(m_riskBands + band * Values(), Values());
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
