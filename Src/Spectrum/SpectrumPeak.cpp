#include <algorithm>
#include <cmath>
#include <cstddef>

#include "Spectrum/SpectrumDrawer.h"

// A parabola through the logarithms of the highest bin and its neighbours: the main lobes of the windows are
// close to one.
Corvo::SpectrumPeak SpectrumDrawer::HighestPeak() const {
    constexpr Corvo::SpectrumPeak kNone{0.0, -300.0};
    if (m_smoothed.size() < 4 || m_samplingRate < 1) return kNone;
    const auto highest = std::max_element(m_smoothed.begin() + 1, m_smoothed.end());
    if (!(*highest > 0.0f)) return kNone;
    const auto bin = std::clamp<std::ptrdiff_t>(highest - m_smoothed.begin(), 2,
                                                static_cast<std::ptrdiff_t>(m_smoothed.size()) - 2);
    const auto level = [&](std::ptrdiff_t k) {
        return 10.0 *
               std::log10(std::max(static_cast<double>(m_smoothed[static_cast<std::size_t>(k)]), 1e-30));
    };
    const double below = level(bin - 1), at = level(bin), above = level(bin + 1);
    const double bend = below - 2.0 * at + above;
    const double offset = bend < 0.0 ? std::clamp(0.5 * (below - above) / bend, -0.5, 0.5) : 0.0;
    const double gain = static_cast<double>(m_settings.gain) * m_settings.gain;
    const double full = 10.0 * std::log10(std::max(gain, 1e-30) / Corvo::FullScalePower(m_settings));
    return {(static_cast<double>(bin) + offset) * m_samplingRate / m_settings.fft_length,
            at - 0.25 * (below - above) * offset + full};
}
