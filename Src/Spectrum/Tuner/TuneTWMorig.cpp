#include <algorithm>
#include <cmath>

#include "Spectrum/Tuner/PitchDetector.h"

// TWM: two-way mismatch, in its original form; the constants are those of the article below.
namespace Corvo {
namespace {

// Constants as found best in R. C. Maher and J. W. Beauchamp, "Fundamental frequency estimation of musical
// signals using a two-way mismatch procedure", J. Acoust. Soc. Am. 95 (1994).
constexpr double kFrequencyExponent = -0.5;
constexpr double kAmplitudeFactor = 1.4;
constexpr double kAmplitudeReward = 0.5;
constexpr double kMeasuredShare = 0.33;

// One partial's error: its distance to the nearest on the other side, less weighted where the frequency is
// high, more where the peak is strong. Frequencies in Hz, amplitude relative to the strongest.
double Mismatch(double distance, double hz, double amplitude) {
    const double error = distance * std::pow(hz, kFrequencyExponent);
    return error + amplitude * (kAmplitudeFactor * error - kAmplitudeReward);
}

double TwoWayMismatch(std::span<const SpectralPeak> peaks, double fundamental, double hzPerBin,
                      float strongest) {
    const auto amplitude = [&](const SpectralPeak& peak) { return std::sqrt(peak.power / strongest); };
    const int partials = static_cast<int>(std::ceil(peaks.back().position / fundamental));
    double predicted = 0.0;
    auto nearest = peaks.begin();
    for (int n = 1; n <= partials; ++n) {
        const double wanted = n * fundamental;
        const auto distance = [&](auto peak) { return std::abs(peak->position - wanted); };
        while (nearest + 1 != peaks.end() && distance(nearest + 1) <= distance(nearest)) ++nearest;
        predicted += Mismatch(distance(nearest) * hzPerBin, wanted * hzPerBin, amplitude(*nearest));
    }
    double measured = 0.0;
    for (const SpectralPeak& peak : peaks) {
        const double number = std::max(std::round(peak.position / fundamental), 1.0);
        const double distance = std::abs(peak.position - number * fundamental);
        measured += Mismatch(distance * hzPerBin, peak.position * hzPerBin, amplitude(peak));
    }
    return predicted / partials + kMeasuredShare * measured / static_cast<double>(peaks.size());
}

}  // namespace

Pitch PitchDetector::TuneTWMorig(std::span<const float> power) {
    const auto peaks = Peaks(power);
    float strongest = 0.0f;
    for (const SpectralPeak& peak : peaks) strongest = std::max(strongest, peak.power);
    // No error is below -1: every strongest partial met exactly.
    const double best = BestCandidate(peaks, [&](double candidate) {
        const double error = TwoWayMismatch(peaks, candidate, Format().HzPerBin(), strongest);
        return static_cast<float>(1.0 / (2.0 + error));
    });
    return InterpolatePitchAndAssignOutputValues(peaks, best);
}

}  // namespace Corvo
