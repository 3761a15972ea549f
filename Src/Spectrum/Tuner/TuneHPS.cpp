#include <algorithm>
#include <cstddef>

#include "Spectrum/Tuner/PitchDetector.h"

// HPS: harmonic product spectrum (M. R. Schroeder, "Period histogram and product spectrum", J. Acoust. Soc.
// Am. 43, 1968). Five spectra are multiplied; a maximum counts when it stands 55 dB above the valleys beside
// it.
namespace Corvo {
namespace {

constexpr int kHarmonics = 5;
constexpr double kProminenceLimit = 55.0;  // dB

}  // namespace

Pitch PitchDetector::TuneHPS(std::span<const float> power, bool halveHarmonics) {
    // Stays so until a preset is chosen.
    m_sensitivity.harmonics = kHarmonics;
    m_product.HarmonicProductSepctrumComputation(power, kHarmonics, halveHarmonics);
    const int length = static_cast<int>(m_product.Values().size());
    const int lowest = static_cast<int>(std::min(LowestBins(), static_cast<double>(length)));
    double prominence = 0.0;
    const int bin = m_product.SearchMaximunInRange(lowest, length, kProminenceLimit, prominence);
    if (bin < 1) return {};
    // The product's maximum may lie a bin beside the spectrum's, where the overtones are wider apart.
    const auto at = power.begin() + bin;
    const auto peak = std::max_element(at - 1, at + 2);
    const double hz =
        m_peaks.InterpolateMax(power, static_cast<std::size_t>(peak - power.begin())) * Format().HzPerBin();
    if (hz > m_sensitivity.highestHz) return {};
    return {hz, static_cast<float>(prominence)};
}

}  // namespace Corvo
