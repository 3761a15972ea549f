#include "Spectrum/HarmonicMatching.h"

#include <algorithm>
#include <cmath>

namespace Corvo {
namespace {

constexpr int kMostPartials = 48;
// A peak may be this far from its partial: in bins, as a share of its frequency, and that growing with the
// square of its number, as stiff strings have it; never so far that it would be as close to another's.
constexpr double kOffBins = 0.3;
constexpr double kOffShare = 0.003;
constexpr double kStretchShare = 1.5e-4;
constexpr double kOffSpacing = 0.25;
// What missing partials below a peak cost.
constexpr float kMissingCost = 0.6f;

// Expected spread of a string's inharmonicity.
constexpr double kUsualInharmonicity = 5e-4;
// Peaks that miss the fit by more standard deviations than this belong to something else.
constexpr double kOutlier = 6.0;

// The line  position / n = first + stretch (n^2 - 1)  through the peaks, by weighted least squares. A stretch
// is as unlikely as the strings of instruments make it, or one high partial could not tell it from the pitch.
struct StretchedSeries {
    double first, stretch;
    double At(double number) const { return number * (first + stretch * (number * number - 1.0)); }
};

struct WeightedLine {
    double w = 0, wx = 0, wy = 0, wxx = 0, wxy = 0;
    void Add(double x, double y, double weight) {
        w += weight;
        wx += weight * x;
        wy += weight * y;
        wxx += weight * x * x;
        wxy += weight * x * y;
    }
    StretchedSeries Fit(double slopeWeight) const {
        const double slopes = wxx + slopeWeight;
        const double determinant = w * slopes - wx * wx;
        return {(wy * slopes - wx * wxy) / determinant, (w * wxy - wx * wy) / determinant};
    }
};

}  // namespace

void PitchCandidates::FindMultipleFrequencies(std::span<const SpectralPeak> peaks, double lowest,
                                              double highest) {
    std::array<const SpectralPeak*, kPeaks> strongest{};
    std::size_t found = 0;
    for (const SpectralPeak& peak : peaks) {
        std::size_t place = found < kPeaks ? found++ : kPeaks;
        if (place == kPeaks) {
            if (peak.power <= strongest[kPeaks - 1]->power) continue;
            place = kPeaks - 1;
        }
        for (; place > 0 && strongest[place - 1]->power < peak.power; --place)
            strongest[place] = strongest[place - 1];
        strongest[place] = &peak;
    }
    m_count = 0;
    for (std::size_t i = 0; i < found; ++i)
        for (std::size_t divisor = 1; divisor <= kDivisors; ++divisor) {
            const double bins = strongest[i]->position / static_cast<double>(divisor);
            if (bins < lowest) break;
            if (bins <= highest) m_bins[m_count++] = bins;
        }
}

PartialFit FitPartial(double fundamental, double position) {
    const int number = static_cast<int>(position / fundamental + 0.5);
    if (number < 1 || number > kMostPartials) return {0, 0.0f};
    const double n = number;
    const double off = (position - n * fundamental);
    const double taken =
        std::min(kOffBins + position * (kOffShare + kStretchShare * n * n), kOffSpacing * fundamental);
    const double share = off / taken;
    const double fit = 1.0 - share * share;
    return fit > 0.0 ? PartialFit{number, static_cast<float>(fit)} : PartialFit{0, 0.0f};
}

float HarmonicMatching(std::span<const SpectralPeak> peaks, double fundamental) {
    float explained = 0.0f, all = 0.0f;
    int before = 0;
    for (const SpectralPeak& peak : peaks) {
        all += peak.weight;
        const auto [number, fit] = FitPartial(fundamental, peak.position);
        if (number == 0 || number == before) continue;
        const float step = static_cast<float>(number - before);
        explained += peak.weight * fit * (1.0f - kMissingCost * (step - 1.0f) / step);
        before = number;
    }
    return all > 0.0f ? explained / all : 0.0f;
}

double RefineFundamental(std::span<const SpectralPeak> peaks, double fundamental) {
    const double usualStretch = 0.5 * kUsualInharmonicity * fundamental;
    const auto fit = [&](const auto& number) {
        WeightedLine line;
        for (const SpectralPeak& peak : peaks)
            if (const double n = number(peak); n > 0.0)
                line.Add(n * n - 1.0, peak.position / n, n * n / peak.variance);
        return line.w > 0.0 ? line.Fit(1.0 / (usualStretch * usualStretch))
                            : StretchedSeries{fundamental, 0.0};
    };
    const auto near = [&](const SpectralPeak& peak) { return FitPartial(fundamental, peak.position).number; };
    const StretchedSeries rough = fit([&](const SpectralPeak& peak) { return double{1.0 * near(peak)}; });
    const StretchedSeries fine = fit([&](const SpectralPeak& peak) {
        const double n = near(peak);
        const double off = n > 0.0 ? peak.position - rough.At(n) : 0.0;
        return off * off <= kOutlier * kOutlier * peak.variance ? n : 0.0;
    });
    return fine.first > 0.0 ? fine.first : fundamental;
}

}  // namespace Corvo
