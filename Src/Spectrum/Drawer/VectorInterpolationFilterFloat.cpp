#include "Spectrum/Drawer/VectorInterpolationFilterFloat.h"

#include <algorithm>
#include <cmath>
#include <numbers>

VectorInterpolationFilterFloat::VectorInterpolationFilterFloat() = default;
VectorInterpolationFilterFloat::~VectorInterpolationFilterFloat() = default;

void VectorInterpolationFilterFloat::Resize(int spectra, int bins) {
    const bool usable = spectra > 0 && bins > 0;
    const auto count = static_cast<std::size_t>(usable ? spectra : 0);
    const auto size = static_cast<std::size_t>(usable ? bins : 0);
    m_current = 0;
    // Empty until all is there: the ring is large, and making it may throw.
    m_weights.clear();
    m_bins = 0;
    m_ring.assign(count * size, 0.0f);
    m_ring.shrink_to_fit();
    m_weights.resize(count);
    m_bins = size;
    // The cosines of a whole turn sum to zero, so the weights sum to 1 without scaling.
    const double steps = static_cast<double>(count) + 1.0;
    for (std::size_t age = 0; age < count; ++age)
        m_weights[age] = static_cast<float>(
            (1.0 - std::cos(2.0 * std::numbers::pi * (static_cast<double>(age) + 1.0) / steps)) / steps);
}

int VectorInterpolationFilterFloat::GetSpectra() const { return static_cast<int>(m_weights.size()); }

void VectorInterpolationFilterFloat::Average(const std::vector<float>& newest, std::vector<float>& average) {
    const std::size_t spectra = m_weights.size();
    if (spectra == 0) return;
    const std::size_t bins = std::min({newest.size(), average.size(), m_bins});
    std::copy_n(newest.begin(), bins, m_ring.begin() + static_cast<std::ptrdiff_t>(m_current * m_bins));
    for (std::size_t age = 0; age < spectra; ++age) {
        const float* const spectrum = m_ring.data() + (m_current + spectra - age) % spectra * m_bins;
        const float weight = m_weights[age];
        float* const sum = average.data();
        if (age == 0)
            for (std::size_t k = 0; k < bins; ++k) sum[k] = weight * spectrum[k];
        else
            for (std::size_t k = 0; k < bins; ++k) sum[k] += weight * spectrum[k];
    }
    m_current = (m_current + 1) % spectra;
}
