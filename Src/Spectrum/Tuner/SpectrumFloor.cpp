#include "Spectrum/Tuner/SpectrumFloor.h"

#include <algorithm>

namespace Corvo {
namespace {

constexpr double kNarrowest = 16.0;      // bins
constexpr double kRelativeWidth = 0.25;  // of the frequency
constexpr std::size_t kMostSamples = 32;
constexpr std::size_t kQuantile = 4;  // one in this many is below it
// Powers of noise are distributed exponentially: a quarter of them lies below -ln(3/4) of their mean.
constexpr float kMeanPerQuantile = 1.0f / 0.28768207f;

}  // namespace

void SpectrumFloor::Prepare(std::size_t bins, double stretch) {
    m_blocks.clear();
    const double narrowest = kNarrowest * std::max(stretch, 1.0);
    // Bin 0 holds what is not noise.
    for (std::size_t first = 1; first < bins;) {
        const auto width =
            static_cast<std::size_t>(std::max(narrowest, kRelativeWidth * static_cast<double>(first)));
        // A short rest joins the last block.
        const std::size_t end = first + width + width / 2 < bins ? first + width : bins;
        const std::size_t step = std::max<std::size_t>((end - first) / kMostSamples, 1);
        m_blocks.push_back(
            {first, (end - first + step - 1) / step, step, 0.5f * static_cast<float>(first + end - 1)});
        first = end;
    }
    m_levels.resize(m_blocks.size());
    std::size_t most = 0;
    for (const Block& block : m_blocks) most = std::max(most, block.count);
    m_samples.resize(most);
}

void SpectrumFloor::Measure(std::span<const float> power, std::span<float> floor) {
    for (std::size_t b = 0; b < m_blocks.size(); ++b) {
        const Block& block = m_blocks[b];
        for (std::size_t i = 0; i < block.count; ++i) {
            const float value = power[block.first + i * block.step];
            m_samples[i] = value > 0.0f ? value : 0.0f;  // what is not a number would upset the order
        }
        const auto begin = m_samples.begin(), end = begin + static_cast<std::ptrdiff_t>(block.count);
        const auto quantile = begin + static_cast<std::ptrdiff_t>(block.count / kQuantile);
        std::nth_element(begin, quantile, end);
        m_levels[b] = *quantile * kMeanPerQuantile;
    }
    if (m_blocks.empty()) {
        std::fill(floor.begin(), floor.end(), 0.0f);
        return;
    }
    std::size_t k = 0;
    for (std::size_t b = 0; b + 1 < m_blocks.size(); ++b) {
        const float from = m_blocks[b].middle, to = m_blocks[b + 1].middle;
        const float slope = (m_levels[b + 1] - m_levels[b]) / (to - from);
        for (; static_cast<float>(k) < from; ++k) floor[k] = m_levels[b];
        for (; static_cast<float>(k) < to; ++k)
            floor[k] = m_levels[b] + slope * (static_cast<float>(k) - from);
    }
    std::fill(floor.begin() + static_cast<std::ptrdiff_t>(k), floor.end(), m_levels.back());
}

}  // namespace Corvo
