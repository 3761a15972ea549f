#include "DSP/Effects/Denoiser/SizeBlend.h"

#include <algorithm>
#include <cmath>

#include "DSP/Effects/Denoiser/HannWeights.h"

namespace Corvo::DSP::Denoising {
namespace {

constexpr double kTileSeconds = 0.18, kTileAheadSeconds = 0.04;
constexpr int kMostAhead = 7;  // grid frames: what the latency leaves room for
// How fast the weights turn from sharing to choosing, per unit of risk; the mean over the tile counts as the
// sum over this many frames.
constexpr float kTurn = 2.0f, kTileFrames = 8.8f, kMostDifference = 50.0f;

}  // namespace

void SizeBlend::Prepare(Arena& arena, WindowTables& grid, std::span<const SizeReducer> sizes,
                        std::size_t channels, double rate) {
    m_kernels = &BestSpectrumKernels();
    m_grid = &grid;
    m_sizes = sizes;
    m_channels = channels;
    m_bands = RiskBandCount(rate);
    m_riskFrames = 0;
    const double framesPerSecond = rate / (grid.length / kOverlap);
    const auto tile = std::min(static_cast<std::size_t>(kTileSeconds * framesPerSecond) | 1, kMostTile);
    m_ahead = std::min(static_cast<int>(kTileAheadSeconds * framesPerSecond), kMostAhead);
    m_before = static_cast<std::int64_t>(tile / 2);
    if (!arena.Counting()) HannWeights(std::span(m_tile).first(tile), static_cast<std::size_t>(m_ahead));
    m_sharpness = kTurn * static_cast<float>(tile) / kTileFrames;
    for (std::size_t i = 0; i < sizes.size(); ++i) {
        m_risks[i].Take(arena, kMostTile + 1, kRiskBands);
        m_weights[i] = arena.Take(grid.Values());
        for (std::size_t c = 0; c < channels; ++c)
            for (auto* part : {&m_re[i][c], &m_im[i][c]}) *part = arena.Take(grid.Half());
    }
    for (auto* each : {&m_outRe, &m_outIm}) *each = arena.Take(grid.Half());
}

void SizeBlend::Run(int step, const Job& job) {
    const auto number = static_cast<std::size_t>(step);
    if (number < m_sizes.size()) return Analyse(number, job);
    Weigh(job.frame);
    for (std::size_t c = 0; c < m_channels; ++c) Combine(c, job);
}

void SizeBlend::Analyse(std::size_t size, const Job& job) {
    auto& grid = *m_grid;
    const std::int64_t start = (job.frame - (kOverlap - 1)) * (grid.length / kOverlap);
    for (std::size_t c = 0; c < m_channels; ++c)
        Transform(*m_kernels, grid, job.inputs[size][c], start, m_re[size][c], m_im[size][c]);
}

// The middle of frame k of any length lies at (k - 1) of its hops.
float SizeBlend::RiskAt(const SizeReducer& size, std::int64_t gridFrame, std::size_t band) const {
    const std::int64_t hop = size.Hop(), centre = (gridFrame - 1) * (m_grid->length / kOverlap);
    if (centre <= -hop) return size.Risk(0, band);
    const std::int64_t above = (centre + 2 * hop - 1) / hop;
    const float share = static_cast<float>(centre - (above - 2) * hop) / static_cast<float>(hop);
    const float before = size.Risk(above - 1, band);
    return before + (size.Risk(above, band) - before) * share;
}

void SizeBlend::Weigh(std::int64_t frame) {
    for (; m_riskFrames <= frame + m_ahead; ++m_riskFrames)
        for (std::size_t i = 0; i < m_sizes.size(); ++i)
            for (std::size_t band = 0; band < m_bands; ++band)
                m_risks[i][m_riskFrames][band] = RiskAt(m_sizes[i], m_riskFrames, band);

    std::array<std::array<float, kRiskBands + 1>, kMostSizes> weights{};
    for (std::size_t band = 0; band < m_bands; ++band) {
        float risk[kMostSizes]{}, sum = 0.0f;
        for (std::size_t i = 0; i < m_sizes.size(); ++i)
            for (std::int64_t offset = -m_before; offset <= m_ahead; ++offset)
                risk[i] +=
                    m_tile[static_cast<std::size_t>(m_before + offset)] * m_risks[i][frame + offset][band];
        const float least = *std::min_element(risk, risk + m_sizes.size());
        for (std::size_t i = 0; i < m_sizes.size(); ++i)
            sum += weights[i][band] = static_cast<float>(
                std::exp(static_cast<double>(-std::min((risk[i] - least) * m_sharpness, kMostDifference))));
        for (std::size_t i = 0; i < m_sizes.size(); ++i) weights[i][band] /= sum;
    }
    for (std::size_t bin = 0; bin < m_grid->Bins(); ++bin) {
        const float place = m_grid->bins->riskPlace[bin];
        const auto below = static_cast<std::size_t>(place);
        const float share = place - static_cast<float>(below);
        for (std::size_t i = 0; i < m_sizes.size(); ++i)
            m_weights[i][bin] = weights[i][below] + (weights[i][below + 1] - weights[i][below]) * share;
    }
}

void SizeBlend::Combine(std::size_t channel, const Job& job) {
    auto& grid = *m_grid;
    const std::size_t half = grid.Half();
    std::fill_n(m_outRe, half, 0.0f);
    std::fill_n(m_outIm, half, 0.0f);
    for (std::size_t i = 0; i < m_sizes.size(); ++i) {
        m_kernels->applyGain(m_re[i][channel], m_im[i][channel], m_weights[i], half);
        for (std::size_t bin = 0; bin < half; ++bin) {
            m_outRe[bin] += m_re[i][channel][bin];
            m_outIm[bin] += m_im[i][channel][bin];
        }
    }
    grid.Inverse(m_outRe, m_outIm);
    OverlapAdd(*m_kernels, grid, job.output[channel],
               (job.frame - (kOverlap - 1)) * (grid.length / kOverlap));
}

}  // namespace Corvo::DSP::Denoising
