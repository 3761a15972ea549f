#include "DSP/Effects/Denoiser/HumFinder.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <utility>

namespace Corvo::DSP::Denoising {
namespace {

constexpr double kSmoothSeconds = 0.1;
constexpr float kOverValley = 4.0f, kOverFloor = 3.0f, kNeighbourOverFloor = 2.0f,
                kNeighbourSteadiness = 2.0f;
constexpr std::size_t kValleyBins = 6;  // to either side
constexpr float kLineLevel = 1.3f, kGone = 0.4f, kGoneSeconds = 0.4f;

// A loop that the compiler runs in registers.
void Lower(float* values, const float* others, std::size_t count) {
    for (std::size_t i = 0; i < count; ++i) values[i] = std::min(values[i], others[i]);
}

}  // namespace

void HumFinder::Prepare(Arena& arena, std::size_t bins, std::size_t values) {
    m_bins = bins;
    m_begun = false;
    for (auto* each :
         {&m_smooth, &m_minimum, &m_sum, &m_lowest, &m_valley, &m_mean, &m_found, &m_level, &m_low})
        *each = arena.Take(values);
    m_minima.Take(arena, kPieces, values);
    m_means.Take(arena, kPieces, values);
}

void HumFinder::Start() {
    m_framesInPiece = 0;
    m_pieces = 0;
    if (!std::exchange(m_begun, false)) return;  // the memory is all zeros
    std::fill_n(m_level, m_bins, 0.0f);
    std::fill_n(m_low, m_bins, 0.0f);
}

void HumFinder::SetMaterial(bool music, double hopSeconds) {
    m_hopSeconds = static_cast<float>(hopSeconds);
    m_smoothing = static_cast<float>(std::exp(-hopSeconds / kSmoothSeconds));
    m_steady = music ? 1.4f : 1.7f;
    const double seconds = music ? 4.0 : 2.0;
    m_framesPerPiece = std::max(static_cast<int>(seconds / hopSeconds / static_cast<double>(kPieces)), 2);
}

void HumFinder::Listen(const float* power) {
    if (!m_begun) std::copy_n(power, m_bins, m_smooth);
    m_begun = true;
    if (m_framesInPiece == 0) {
        std::fill_n(m_minimum, m_bins, std::numeric_limits<float>::max());
        std::fill_n(m_sum, m_bins, 0.0f);
    }
    for (std::size_t i = 0; i < m_bins; ++i) {
        m_smooth[i] = m_smoothing * m_smooth[i] + (1.0f - m_smoothing) * power[i];
        m_minimum[i] = std::min(m_minimum[i], m_smooth[i]);
        m_sum[i] += m_smooth[i];
    }
    ++m_framesInPiece;
}

void HumFinder::Raise(float* noise) {
    for (std::size_t i = 0; i < m_bins; ++i) {
        m_low[i] = m_smooth[i] < kGone * m_level[i] ? m_low[i] + m_hopSeconds : 0.0f;
        if (!(m_low[i] < kGoneSeconds)) m_level[i] = 0.0f;
        noise[i] = std::max(noise[i], kLineLevel * m_level[i]);
    }
}

void HumFinder::Look(const float* floor) {
    if (m_framesInPiece < m_framesPerPiece) return;
    std::copy_n(m_minimum, m_bins, m_minima[m_pieces]);
    float* const means = m_means[m_pieces];
    for (std::size_t i = 0; i < m_bins; ++i) means[i] = m_sum[i] / static_cast<float>(m_framesInPiece);
    m_framesInPiece = 0;
    if (++m_pieces < static_cast<std::int64_t>(kPieces)) return;

    std::copy_n(m_minima[0], m_bins, m_lowest);
    std::copy_n(m_means[0], m_bins, m_mean);
    for (std::int64_t piece = 1; piece < static_cast<std::int64_t>(kPieces); ++piece) {
        const float* const mean = m_means[piece];
        Lower(m_lowest, m_minima[piece], m_bins);
        for (std::size_t i = 0; i < m_bins; ++i) m_mean[i] += mean[i];
    }
    std::copy_n(m_lowest, m_bins, m_valley);
    for (std::size_t offset = 1; offset <= kValleyBins; ++offset) {
        Lower(m_valley + offset, m_lowest, m_bins - offset);
        Lower(m_valley, m_lowest + offset, m_bins - offset);
    }
    for (std::size_t i = 0; i < m_bins; ++i) {
        m_mean[i] /= static_cast<float>(kPieces);
        m_found[i] = m_mean[i] < m_steady * m_lowest[i] && m_lowest[i] > kOverValley * m_valley[i] &&
                     m_lowest[i] > kOverFloor * floor[i];
    }
    for (std::size_t i = 0; i < m_bins; ++i) {
        const bool beside = (i > 0 && m_found[i - 1] != 0.0f) || (i + 1 < m_bins && m_found[i + 1] != 0.0f);
        if (m_found[i] != 0.0f || (beside && m_mean[i] < kNeighbourSteadiness * m_steady * m_lowest[i] &&
                                   m_lowest[i] > kNeighbourOverFloor * floor[i]))
            m_level[i] = m_mean[i];
    }
}

}  // namespace Corvo::DSP::Denoising
