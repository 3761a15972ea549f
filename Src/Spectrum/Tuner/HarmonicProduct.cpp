#include "Spectrum/Tuner/HarmonicProduct.h"

#include <algorithm>
#include <cmath>

namespace Corvo {

void HarmonicProduct::HarmonicProductSepctrumComputation(std::span<const float> spectrum, int harmonics,
                                                         bool halve) {
    const auto count = static_cast<std::size_t>(std::max(harmonics, 1));
    const std::size_t length = spectrum.size() / count;
    if (m_product.size() != length) m_product.resize(length);
    const double scale = halve ? 0.5 : 1.0;
    for (std::size_t k = 0; k < length; ++k) {
        double product = spectrum[k];
        for (std::size_t h = 2; h <= count; ++h) product *= std::max(spectrum[h * k] * scale, 1.0);
        m_product[k] = product;
    }
}

int HarmonicProduct::SearchMaximunInRange(int start, int end, double limit, double& prominence) const {
    prominence = 0.0;
    const int length = static_cast<int>(m_product.size());
    start = std::max(start, 0);
    end = std::min(end, length);
    if (start >= end) return -1;
    const double* const p = m_product.data();
    const auto isValley = [p](int k) { return p[k - 1] >= p[k] && p[k + 1] >= p[k]; };
    const int peak = static_cast<int>(std::max_element(p + start, p + end) - p);
    int right = peak + 1;
    while (right <= length - 2 && !isValley(right)) ++right;
    int left = peak - 1;
    while (left >= 1 && !isValley(left)) --left;
    if (right > length - 2 || left < 1) return -1;
    const double above = 10.0 * std::log10(p[peak]) - 5.0 * std::log10(p[left] * p[right]);
    if (!(above >= limit)) return -1;
    prominence = above;
    return peak;
}

}  // namespace Corvo
