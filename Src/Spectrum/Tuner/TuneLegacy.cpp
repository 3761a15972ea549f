#include <algorithm>
#include <cmath>

#include "Spectrum/Tuner/PitchDetector.h"

// Legacy: the oldest and simplest method, kept for those used to it: the strongest peak, or a subharmonic of
// it. Its two constants say how deep a subharmonic is tried and how many of its partials must be there.
namespace Corvo {
namespace {

constexpr int kLowestSubharmonic = 5;
// Of the multiples below twice the strongest peak this share must be there.
constexpr double kNeededShare = 0.5;

// The share of the multiples of strongest / divisor, up to twice the strongest, that are peaks too; those
// that are the strongest's own multiples do not count.
double SharePresent(std::span<const SpectralPeak> peaks, double strongest, int divisor) {
    const double fundamental = strongest / divisor;
    int present = 0;
    for (int n = 1; n < 2 * divisor; ++n) {
        if (n == divisor) continue;
        present += std::any_of(peaks.begin(), peaks.end(), [&](const SpectralPeak& peak) {
            return FitPartial(fundamental, peak.position).number == n;
        });
    }
    return present / (2.0 * (divisor - 1));
}

}  // namespace

Pitch PitchDetector::TuneLegacy(std::span<const float> power) {
    const auto peaks = Peaks(power);
    if (peaks.empty()) return {};
    const auto weaker = [](const SpectralPeak& a, const SpectralPeak& b) { return a.power < b.power; };
    const double strongest = std::max_element(peaks.begin(), peaks.end(), weaker)->position;
    double best = strongest, most = 0.0;
    for (int divisor = 2; divisor <= kLowestSubharmonic && strongest / divisor >= LowestBins(); ++divisor)
        if (const double share = SharePresent(peaks, strongest, divisor);
            share >= kNeededShare && share > most) {
            most = share;
            best = strongest / divisor;
        }
    return InterpolatePitchAndAssignOutputValues(peaks, best);
}

}  // namespace Corvo
