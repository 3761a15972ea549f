#include "Spectrum/Tuner/PitchDetector.h"

#include <algorithm>

namespace Corvo {

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

std::span<const SpectralPeak> PitchDetector::Peaks(std::span<const float> power) {
    return m_peaks.FilterPeaks(power, power, m_sensitivity);
}

Pitch PitchDetector::InterpolatePitchAndAssignOutputValues(std::span<const SpectralPeak> peaks,
                                                           double bins) const {
    if (!(bins > 0.0)) return {};
    Pitch pitch;
    pitch.hz = RefineFundamental(peaks, bins) * Format().HzPerBin();
    for (const SpectralPeak& peak : peaks)
        if (FitPartial(bins, peak.position).number > 0)
            pitch.prominence = std::max(pitch.prominence, peak.aboveFloor);
    return pitch;
}

}  // namespace Corvo
