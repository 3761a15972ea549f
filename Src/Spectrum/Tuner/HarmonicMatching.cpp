#include "Spectrum/Tuner/HarmonicMatching.h"

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
// A low candidate's partials lie so close that some peaks fit them by chance: the wider what is taken beside
// their distance, the less a fit says.
constexpr double kChanceCost = 1.5;
// What missing partials below a peak cost.
constexpr float kMissingCost = 0.8f;

// Expected spread of a string's inharmonicity.
constexpr double kUsualInharmonicity = 5e-4;
// Standard deviations of the first partial, as far as it is known, within which others are looked for.
constexpr double kDoubt = 3.0;
// Peaks that miss the fit by more standard deviations than this belong to something else.
constexpr double kOutlier = 6.0;
// A fit that explains less than this share of what it set out from has taken partials for others.
constexpr float kStillExplained = 0.5f;

// Partials at n sqrt(square + stretch (n^2 - 1)): the first one's square, and what a stiff string adds.
// Exactly a straight line over n^2, fitted by weighted least squares. A stretch is as unlikely as the strings
// of instruments make it, or one high partial could not tell it from the pitch.
struct StretchedSeries {
    double square, stretch;
    double First() const { return std::sqrt(square); }
    double At(double number) const {
        return number * std::sqrt(std::max(square + stretch * (number * number - 1.0), 0.0));
    }
    // Of the partial at `position`, 0 for none. `doubt` is how far the first one may be off.
    int NumberOf(double position, double doubt) const {
        const double first = First(), unstretched = position / first;
        const double number = std::round(unstretched * position / At(unstretched));
        const double off = std::abs(position - At(number));
        const double taken = kOffBins + kOffShare * position + doubt * number;
        const bool near = off <= std::min(taken, kOffSpacing * first);
        return number >= 1.0 && number <= kMostPartials && near ? static_cast<int>(number) : 0;
    }
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
    std::array<const SpectralPeak*, kPeaks> most{};
    std::size_t found = 0;
    for (const SpectralPeak& peak : peaks) {
        std::size_t place = found < kPeaks ? found++ : kPeaks;
        if (place == kPeaks) {
            if (peak.Importance() <= most[kPeaks - 1]->Importance()) continue;
            place = kPeaks - 1;
        }
        for (; place > 0 && most[place - 1]->Importance() < peak.Importance(); --place)
            most[place] = most[place - 1];
        most[place] = &peak;
    }
    m_count = 0;
    for (std::size_t i = 0; i < found; ++i)
        for (std::size_t divisor = 1; divisor <= kDivisors; ++divisor) {
            const double bins = most[i]->position / static_cast<double>(divisor);
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
    const double fit = (1.0 - share * share) * (1.0 - kChanceCost * taken / fundamental);
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

// Partial by partial upwards, so that each is looked for where those below it, stretched as they are,
// foretell.
double RefineFundamental(std::span<const SpectralPeak> peaks, double fundamental) {
    const double square = fundamental * fundamental;
    const double usualStretch = kUsualInharmonicity * square;
    const double slopeWeight = 1.0 / (usualStretch * usualStretch);
    std::array<int, kMostPeaks> numbers{};
    const auto add = [&](WeightedLine& line, const SpectralPeak& peak, double n) {
        const double first = peak.position / n;
        line.Add(n * n - 1.0, first * first, n * n / (4.0 * square * peak.variance));
    };

    WeightedLine line;
    StretchedSeries series{square, 0.0};
    for (std::size_t i = 0; i < peaks.size() && i < numbers.size(); ++i) {
        const double doubt = line.w > 0.0 ? kDoubt / (2.0 * fundamental * std::sqrt(line.w)) : 0.0;
        const int number = series.NumberOf(peaks[i].position, doubt);
        if (number < 1) continue;
        numbers[i] = number;
        add(line, peaks[i], number);
        series = line.Fit(slopeWeight);
    }
    WeightedLine belonging;
    for (std::size_t i = 0; i < peaks.size() && i < numbers.size(); ++i) {
        if (numbers[i] < 1) continue;
        const double off = peaks[i].position - series.At(numbers[i]);
        if (off * off <= kOutlier * kOutlier * peaks[i].variance) add(belonging, peaks[i], numbers[i]);
    }
    const double fitted = belonging.w > 0.0 ? belonging.Fit(slopeWeight).First() : series.First();
    if (!(fitted > 0.0)) return fundamental;
    const float before = HarmonicMatching(peaks, fundamental);
    return HarmonicMatching(peaks, fitted) >= kStillExplained * before ? fitted : fundamental;
}

}  // namespace Corvo
