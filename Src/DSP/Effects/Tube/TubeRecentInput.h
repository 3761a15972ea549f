#pragma once

#include <algorithm>
#include <array>
#include <cstddef>

#include "Platform/FiniteSamples.h"

namespace Corvo::DSP {

// The newest frames in front of the tube distortion's shaper, for filters that come into use in mid-stream.
// They ring out to 1e-12 within this length. To be cleared when the channel count changes.
class TubeRecentInput {
public:
    static constexpr int kFrames = 64;

    template <typename Sample>
    void Add(const Sample* samples, int frames, int channels) {
        const int size = kFrames * channels, added = std::min(frames, kFrames) * channels;
        samples += static_cast<std::ptrdiff_t>(std::max(frames - kFrames, 0)) * channels;
        const int upToEnd = std::min(added, size - m_next);
        std::copy_n(samples, upToEnd, m_samples.begin() + m_next);
        std::copy_n(samples + upToEnd, added - upToEnd, m_samples.begin());
        m_next = (m_next + added) % size;
    }
    void Clear() { *this = {}; }
    // Interleaved, oldest first, and finite.
    std::array<double, kFrames * 2> Samples(int channels) const {
        std::array<double, kFrames * 2> samples{};
        const auto begin = m_samples.begin();
        std::rotate_copy(begin, begin + m_next, begin + kFrames * channels, samples.begin());
        ReplaceNonFinite(samples.data(), kFrames, channels);
        return samples;
    }

private:
    std::array<double, kFrames * 2> m_samples{};  // a ring of kFrames
    int m_next = 0;
};

}  // namespace Corvo::DSP
