#include <algorithm>
#include <cmath>

#include "Spectrum/Tuner/PitchDetector.h"

// HPS denoise: a harmonic product spectrum (see TuneHPS.cpp) of what stands above the noise. Its constants
// say how long it stays with the pitch expected; the sensitivity's say what stands above, HarmonicMatching's
// what fits a partial.
namespace Corvo {
namespace {

// As far as a candidate may lie from the pitch expected to be that one: a quarter tone.
constexpr double kExpectedOctaves = 1.0 / 24.0;
// It is believed until another explains more than this times as much, and heard as long as none explains
// more than this times as much.
constexpr float kBelieved = 1.2f, kHeardBeside = 2.0f;

}  // namespace

// Levels in decibels above the weakest that counts, summed over a candidate's partials: the logarithm of a
// harmonic product over the cleaned spectrum, whose absent factors are 1. What the bare product lacks is the
// comparison with all that a candidate leaves unexplained and with the partials that it wants in vain.
Pitch PitchDetector::TuneHPSdenoise(std::span<const float> power, bool denoise) {
    const auto peaks = m_peaks.FilterPeaks(power, denoise ? m_denoised : power, m_sensitivity);
    const double expected = m_expectedHz / Format().HzPerBin();
    double stillHeard = 0.0;
    float most = 0.0f, mostExpected = 0.0f;
    const double best = BestCandidate(peaks, [&](double candidate) {
        const float explained = HarmonicMatching(peaks, candidate);
        most = std::max(most, explained);
        if (!(expected > 0.0 && std::abs(std::log2(candidate / expected)) < kExpectedOctaves))
            return explained;
        if (explained > mostExpected) {
            mostExpected = explained;
            stillHeard = candidate;
        }
        return kBelieved * explained;
    });
    Pitch pitch = InterpolatePitchAndAssignOutputValues(peaks, best);
    if (stillHeard == best || kHeardBeside * mostExpected <= most) return pitch;
    const Pitch still = InterpolatePitchAndAssignOutputValues(peaks, stillHeard);
    if (still.prominence >= m_sensitivity.onsetDb) pitch.expectedHz = still.hz;
    return pitch;
}

}  // namespace Corvo
