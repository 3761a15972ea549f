#include "DSP/Effects/Denoiser/NoiseLearner.h"

#include <algorithm>

namespace Corvo::DSP::Denoising {
namespace {

// Windows up to this length are so many, and so quickly done, that each is taken as soon as it is complete;
// of the longer ones one at a time.
constexpr std::size_t kShortLengths = 2;

}  // namespace

void NoiseLearner::Prepare(Arena& arena, std::span<WindowTables, kLengths> windows) {
    m_windows = windows.data();
    m_active = false;
    m_re = arena.Take(windows.back().Half());
    m_im = arena.Take(windows.back().Half());
    m_power = arena.Take(windows.back().Values());
    if (arena.Counting()) return;
    std::size_t bins = 0;
    for (const auto& window : windows) bins += window.Bins();
    m_sumMemory = UntouchedZeros<double>(kMostChannels * bins);
    double* sums = m_sumMemory.data();
    for (auto& channel : m_sums)
        for (std::size_t i = 0; i < kLengths; sums += windows[i++].Bins())
            channel[i] = {sums, windows[i].Bins()};
}

void NoiseLearner::Begin(std::int64_t place, std::size_t channels) {
    m_active = true;
    m_begin = place;
    m_channels = channels;
    m_count = {};
    for (auto& channel : m_sums)
        for (auto& sums : channel) std::ranges::fill(sums, 0.0);
}

void NoiseLearner::Run(std::int64_t place, std::span<const SampleRing> input) {
    for (std::size_t which = 0; which < kShortLengths; ++which)
        while (TakeWindow(which, place, input)) {
        }
    for (std::size_t which = kShortLengths; which < kLengths; ++which)
        if (TakeWindow(which, place, input)) return;
}

bool NoiseLearner::End(std::int64_t place, std::span<const SampleRing> input) {
    for (std::size_t which = 0; which < kLengths; ++which)
        while (TakeWindow(which, place, input)) {
        }
    m_active = false;
    m_end = place;
    return m_count.front() > 0;
}

bool NoiseLearner::TakeWindow(std::size_t which, std::int64_t place, std::span<const SampleRing> input) {
    auto& tables = m_windows[which];
    const std::int64_t start = m_begin + m_count[which] * (tables.length / kOverlap);
    if (start + tables.length > place) return false;
    for (std::size_t c = 0; c < m_channels; ++c) {
        // A passage begins anywhere, so the ring's end may cut it anywhere.
        input[c].ForEachRun(start, static_cast<std::size_t>(tables.length),
                            [&](const float* samples, std::size_t done, std::size_t count) {
                                std::copy_n(samples, count, tables.scratch + done);
                            });
        const auto& kernels = BestSpectrumKernels();
        kernels.multiply(tables.scratch, tables.scratch, tables.shape->analysis.data(),
                         static_cast<std::size_t>(tables.length));
        tables.Forward(m_re, m_im);
        kernels.power(m_re, m_im, m_power, tables.Half());
        auto& sums = m_sums[c][which];
        for (std::size_t bin = 0; bin < sums.size(); ++bin) sums[bin] += static_cast<double>(m_power[bin]);
    }
    ++m_count[which];
    return true;
}

const float* NoiseLearner::Mean(std::size_t channel, std::size_t which) {
    if (m_count[which] == 0) return nullptr;
    const auto& sums = m_sums[channel][which];
    for (std::size_t bin = 0; bin < sums.size(); ++bin)
        m_power[bin] = static_cast<float>(sums[bin] / static_cast<double>(m_count[which]));
    return m_power;
}

}  // namespace Corvo::DSP::Denoising
