#include "DSP/Effects/Denoiser/SpectrumConversion.h"

#include <algorithm>
#include <cmath>

namespace Corvo::DSP::Denoising {

void Resample(const float* from, std::size_t fromCount, double step, float* to, std::size_t count) {
    for (std::size_t i = 0; i < count; ++i) {
        const double place = std::min(step * static_cast<double>(i), static_cast<double>(fromCount - 1));
        const auto below = static_cast<std::size_t>(place);
        const std::size_t above = std::min(below + 1, fromCount - 1);
        const auto share = static_cast<float>(place - std::floor(place));
        to[i] = from[below] + (from[above] - from[below]) * share;
    }
}

void SpectrumConversion::Prepare(const WindowTables& from, const WindowTables& to) {
    m_fromBins = from.Bins();
    m_fromValues = from.Values();
    m_toBins = to.Bins();
    m_scale = static_cast<float>(to.length) / static_cast<float>(from.length);
    m_shorter = to.length < from.length;
    m_ratio = static_cast<std::size_t>(std::max(to.length, from.length) / std::min(to.length, from.length));
}

void SpectrumConversion::Run(const float* from, float* to) {
    if (!m_shorter) {
        for (std::size_t i = 0; i + 1 < m_fromBins; ++i) {
            const float step = m_scale * (from[i + 1] - from[i]) / static_cast<float>(m_ratio);
            for (std::size_t j = 0; j < m_ratio; ++j)
                to[i * m_ratio + j] = m_scale * from[i] + step * static_cast<float>(j);
        }
        to[m_toBins - 1] = m_scale * from[m_fromBins - 1];
        return;
    }
    const std::size_t half = m_response->size() - 1;
    float *const seen = m_work, *const mirrored = seen + m_fromValues, *const middle = mirrored + half;
    std::copy_n(from, m_fromBins, middle);
    for (std::size_t i = 1; i <= half; ++i) {
        mirrored[half - i] = from[i];
        middle[m_fromBins - 1 + i] = from[m_fromBins - 1 - i];
    }
    BestSpectrumKernels().smoothBins(middle, seen, m_response->data(), static_cast<int>(half), 0,
                                     m_fromValues);
    for (std::size_t i = 0; i < m_toBins; ++i) to[i] = seen[i * m_ratio];
}

}  // namespace Corvo::DSP::Denoising
