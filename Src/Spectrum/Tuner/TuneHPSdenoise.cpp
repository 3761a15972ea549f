#include "Spectrum/Tuner/PitchDetector.h"

// HPS denoise: a harmonic product spectrum (see TuneHPS.cpp) of what stands above the noise. It has no
// constants of its own: the sensitivity's say what stands above, HarmonicMatching's what fits a partial.
namespace Corvo {

// Levels in decibels above the weakest that counts, summed over a candidate's partials: the logarithm of a
// harmonic product over the cleaned spectrum, whose absent factors are 1. What the bare product lacks is the
// comparison with all that a candidate leaves unexplained and with the partials that it wants in vain.
Pitch PitchDetector::TuneHPSdenoise(std::span<const float> power, bool denoise) {
    const auto peaks = m_peaks.FilterPeaks(power, denoise ? m_denoised : power, m_sensitivity);
    const double best =
        BestCandidate(peaks, [&](double candidate) { return HarmonicMatching(peaks, candidate); });
    return InterpolatePitchAndAssignOutputValues(peaks, best);
}

}  // namespace Corvo
