#include "Spectrum/Tuner/PitchDetector.h"

#include <algorithm>
#include <cmath>

namespace Corvo {
namespace {

// Partials that explain this share of what is heard count in full.
constexpr float kConvincing = 0.5f;

// Decibels by which a series of partials stands out: all of them together, less when they leave much else
// unexplained, as what noise has in a row by chance does. Never less than the strongest alone.
float Prominence(std::span<const SpectralPeak> peaks, double fundamental) {
    float strongest = 0.0f, together = 0.0f;
    for (const SpectralPeak& peak : peaks) {
        if (FitPartial(fundamental, peak.position).number < 1) continue;
        strongest = std::max(strongest, peak.aboveFloor);
        together += std::pow(10.0f, 0.1f * peak.aboveFloor);
    }
    const float explained = std::min(HarmonicMatching(peaks, fundamental) / kConvincing, 1.0f);
    return std::max(strongest, 10.0f * std::log10(together * explained * explained));
}

}  // namespace

void PitchDetector::Prepare(const SpectrumFormat& format) {
    if (format == Format()) return;
    // Made now, so that no analysis has to when the spectrum is asked for.
    m_denoised.clear();
    m_denoised.reserve(format.bins);
    m_peaks.Prepare(format);  // takes note of the format
}

void PitchDetector::MeasureFloor(std::span<const float> power, bool keepDenoised) {
    m_peaks.MeasureFloor(power);
    m_denoised.resize(keepDenoised ? power.size() : 0);
    if (keepDenoised) m_peaks.RemoveFloor(power, m_denoised);
}

const Pitch& PitchDetector::Keep(const Pitch& pitch) {
    m_beforeHz = m_now.hz;
    return m_now = pitch;
}

std::span<const SpectralPeak> PitchDetector::Peaks(std::span<const float> power) {
    return m_peaks.FilterPeaks(power, power, m_sensitivity);
}

Pitch PitchDetector::InterpolatePitchAndAssignOutputValues(std::span<const SpectralPeak> peaks,
                                                           double bins) const {
    if (!(bins > 0.0)) return {};
    return {RefineFundamental(peaks, bins) * Format().HzPerBin(), Prominence(peaks, bins)};
}

}  // namespace Corvo
