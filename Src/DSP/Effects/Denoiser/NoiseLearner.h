#pragma once

#include <array>
#include <cstdint>
#include <span>
#include <vector>

#include "DSP/Effects/Denoiser/NoiseProfile.h"
#include "DSP/Effects/Denoiser/Rings.h"
#include "DSP/Effects/Denoiser/SizeReducer.h"
#include "Platform/UntouchedZeros.h"

namespace Corvo::DSP::Denoising {

// Learns the noise of a passage: the mean power spectrum of all windows that lie inside it, every quarter of
// a window, for every length at once.
class NoiseLearner {
public:
    // Allocates for the windows given.
    void Prepare(Arena& arena, std::span<WindowTables, kLengths> windows);

    bool Active() const { return m_active; }
    void Begin(std::int64_t place, std::size_t channels);
    void Cancel() { m_active = false; }
    // Does a share of the work that is due at `place`, where the stream has got to.
    void Run(std::int64_t place, std::span<const SampleRing> input);
    // Takes in what is left up to `place`. True when there was a whole window of at least the shortest
    // length.
    bool End(std::int64_t place, std::span<const SampleRing> input);
    // What the passage that ended was like; null for a length that did not fit in.
    const float* Mean(std::size_t channel, std::size_t which);
    std::int64_t Length() const { return m_end - m_begin; }

private:
    bool TakeWindow(std::size_t which, std::int64_t place, std::span<const SampleRing> input);

    WindowTables* m_windows = nullptr;
    bool m_active = false;
    std::int64_t m_begin = 0, m_end = 0;
    std::size_t m_channels = 0;
    std::array<std::int64_t, kLengths> m_count{};
    UntouchedZeros<double> m_sumMemory;
    std::array<std::array<std::span<double>, kLengths>, kMostChannels> m_sums;
    float *m_re = nullptr, *m_im = nullptr, *m_power = nullptr;
};

}  // namespace Corvo::DSP::Denoising
