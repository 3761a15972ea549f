#include <algorithm>
#include <cmath>
#include <cstddef>

#include "Spectrum/Drawer/SpectrumDrawer.h"

// The highest bin that is higher than its neighbours; what leaks from below the lowest frequency or from half
// the rate is none. A parabola through the three logarithms refines it, since the main lobes of the windows
// are close to one.
Corvo::SpectrumPeak SpectrumDrawer::HighestPeak(double lowestHz) const {
    constexpr Corvo::SpectrumPeak kNone{0.0, -300.0};
    if (m_smoothed.size() < 4 || m_samplingRate < 1 || m_settings.fft_length < 1) return kNone;
    const double perBin = static_cast<double>(m_samplingRate) / m_settings.fft_length;
    const auto bins = static_cast<std::ptrdiff_t>(m_smoothed.size());
    // Bin 0 holds what is at the other end of the spectrum, too.
    const auto power = [&](std::ptrdiff_t k) {
        return k >= 1 ? m_smoothed[static_cast<std::size_t>(k)] : 0.0f;
    };
    const double lowest = std::ceil(lowestHz / perBin);
    const double first = lowest > 1.0 ? std::min(lowest, static_cast<double>(bins)) : 1.0;  // 1 for NaN, too
    std::ptrdiff_t peak = 0;
    for (auto k = static_cast<std::ptrdiff_t>(first); k + 1 < bins; ++k)
        if (power(k) > power(peak) && power(k) >= power(k - 1) && power(k) >= power(k + 1)) peak = k;
    if (peak == 0) return kNone;

    const auto level = [&](std::ptrdiff_t k) { return 10.0 * std::log10(std::max<double>(power(k), 1e-30)); };
    const double at = level(peak);
    double offset = 0.0, rise = 0.0;
    if (peak > 1) {
        const double below = level(peak - 1), above = level(peak + 1), bend = below - 2.0 * at + above;
        offset = bend < 0.0 ? std::clamp(0.5 * (below - above) / bend, -0.5, 0.5) : 0.0;
        rise = -0.25 * (below - above) * offset;
    }
    const double gain = static_cast<double>(m_settings.gain) * m_settings.gain;
    const double full = 10.0 * std::log10(std::max(gain, 1e-30) / Corvo::FullScalePower(m_settings));
    return {(static_cast<double>(peak) + offset) * perBin, at + rise + full};
}
