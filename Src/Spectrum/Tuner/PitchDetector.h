#pragma once

#include <span>
#include <vector>

#include "Spectrum/Tuner/HarmonicMatching.h"
#include "Spectrum/Tuner/HarmonicProduct.h"
#include "Spectrum/Tuner/PitchPeaks.h"
#include "Spectrum/Tuner/TunerSensitivity.h"

namespace Corvo {

struct Pitch {
    double hz = 0.0;  // 0: none
    float prominence = 0.0f;
    double expectedHz = 0.0;  // where the pitch expected is now, if it is still heard; else 0
};

// The five ways to find the pitch of a power spectrum. Each method has a file of its own.
class PitchDetector {
public:
    void SetSensitivity(const TunerSensitivity& sensitivity) { m_sensitivity = sensitivity; }
    const TunerSensitivity& Sensitivity() const { return m_sensitivity; }
    // Before every analysis, in this order. The first allocates only when the format changed; the second
    // measures the floor of the spectrum to analyse, and with `keepDenoised` keeps that spectrum without it.
    void Prepare(const SpectrumFormat& format);
    void MeasureFloor(std::span<const float> power, bool keepDenoised);
    // What was heard up to now, 0 for nothing: TuneHPSdenoise prefers it to another pitch that explains the
    // peaks hardly better, and looks for it beside one that explains them much better.
    void Expect(double hz) { m_expectedHz = hz; }

    // Of the peaks above the floor, the fundamental that explains them best. With `denoise` they are those of
    // the spectrum without its floor, which must have been kept.
    Pitch TuneHPSdenoise(std::span<const float> power, bool denoise);
    // The maximum of the harmonic product over five spectra, by the letter: weak where the fundamental is
    // missing or an overtone of an overtone takes over.
    Pitch TuneHPS(std::span<const float> power, bool halveHarmonics);
    // The candidate whose first partials have the largest sum of levels.
    Pitch TunePseudoHPS(std::span<const float> power);
    // The strongest peak, or the frequency below it whose other multiples are there as well.
    Pitch TuneLegacy(std::span<const float> power);
    // Two-way mismatch: the candidate with the least distances from its partials to the peaks and back.
    Pitch TuneTWMorig(std::span<const float> power);

    // Notes what a method found. That, and the pitch found before it.
    const Pitch& Keep(const Pitch& pitch);
    const Pitch& Now() const { return m_now; }
    double Before() const { return m_beforeHz; }

    // Empty unless it was kept at the last analysis.
    const std::vector<float>& Denoised() const { return m_denoised; }

private:
    // The pitch at about `bins`, as exact as the peaks around its partials allow.
    Pitch InterpolatePitchAndAssignOutputValues(std::span<const SpectralPeak> peaks, double bins) const;
    double LowestBins() const { return m_sensitivity.lowestHz / Format().HzPerBin(); }
    double HighestBins() const { return m_sensitivity.highestHz / Format().HzPerBin(); }
    const SpectrumFormat& Format() const { return m_peaks.Format(); }
    std::span<const SpectralPeak> Peaks(std::span<const float> power);
    // The candidate with the highest score, 0 without one.
    template <typename Score>
    double BestCandidate(std::span<const SpectralPeak> peaks, Score score);

    TunerSensitivity m_sensitivity = kTunerSensitivities[0].values;
    PitchPeaks m_peaks;
    PitchCandidates m_candidates;
    HarmonicProduct m_product;
    std::vector<float> m_denoised;
    double m_expectedHz = 0.0, m_beforeHz = 0.0;
    Pitch m_now;
};

template <typename Score>
double PitchDetector::BestCandidate(std::span<const SpectralPeak> peaks, Score score) {
    m_candidates.FindMultipleFrequencies(peaks, LowestBins(), HighestBins());
    double best = 0.0;
    float highest = 0.0f;
    for (const double candidate : m_candidates)
        if (const float reached = score(candidate); reached > highest) {
            highest = reached;
            best = candidate;
        }
    return best;
}

}  // namespace Corvo
