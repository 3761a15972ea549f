#include <algorithm>
#include <cmath>

#include "Spectrum/Tuner/PitchDetector.h"

// Pseudo HPS: a harmonic product spectrum (see TuneHPS.cpp) made of the peaks alone, so that partials may lie
// between bins. Its two constants say how far a peak may lie from its partial and how partials are weighed.
namespace Corvo {
namespace {

// A peak counts for a partial this far off, less and less, in bins.
constexpr double kReach = 1.5;
// Each further partial counts this much of the one before, so that a lone one is a fundamental.
constexpr float kNextPartial = 0.9f;

// The product's logarithm: levels in decibels above the weakest that counts, summed over the first partials.
float PseudoHarmonicProductPitchDetection(std::span<const SpectralPeak> peaks, double fundamental,
                                          int harmonics) {
    float sum = 0.0f, share = 1.0f;
    auto peak = peaks.begin();
    for (int h = 1; h <= harmonics; ++h, share *= kNextPartial) {
        const double wanted = h * fundamental;
        while (peak != peaks.end() && peak->position < wanted - kReach) ++peak;
        float level = 0.0f;
        for (auto near = peak; near != peaks.end() && near->position < wanted + kReach; ++near) {
            const double closeness = 1.0 - std::abs(near->position - wanted) / kReach;
            level = std::max(level, near->weight * static_cast<float>(closeness));
        }
        sum += share * level;
    }
    return sum;
}

}  // namespace

Pitch PitchDetector::TunePseudoHPS(std::span<const float> power) {
    const auto peaks = Peaks(power);
    const double best = BestCandidate(peaks, [&](double candidate) {
        return PseudoHarmonicProductPitchDetection(peaks, candidate, m_sensitivity.harmonics);
    });
    return InterpolatePitchAndAssignOutputValues(peaks, best);
}

}  // namespace Corvo
