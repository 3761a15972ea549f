#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <type_traits>
#include <variant>

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
        if constexpr (std::is_same_v<Sample, double>) Widen();
        std::visit(
            [&](auto& ring) {
                std::copy_n(samples, upToEnd, ring.begin() + m_next);
                std::copy_n(samples + upToEnd, added - upToEnd, ring.begin());
            },
            m_samples);
        m_next = (m_next + added) % size;
    }
    void Clear() { *this = {}; }
    // Interleaved, oldest first, and finite.
    std::array<double, kFrames * 2> Samples(int channels) const {
        std::array<double, kFrames * 2> samples{};
        std::visit(
            [&](const auto& ring) {
                const auto begin = ring.begin();
                std::rotate_copy(begin, begin + m_next, begin + kFrames * channels, samples.begin());
            },
            m_samples);
        ReplaceNonFinite(samples.data(), kFrames, channels);
        return samples;
    }

private:
    template <typename Sample>
    using Ring = std::array<Sample, kFrames * 2>;

    void Widen() {
        const auto* const floats = std::get_if<Ring<float>>(&m_samples);
        if (!floats) return;
        Ring<double> doubles;
        std::ranges::copy(*floats, doubles.begin());
        m_samples = doubles;
    }

    // Floats, as converting them in every block costs more than copying; doubles once one has come.
    std::variant<Ring<float>, Ring<double>> m_samples;
    int m_next = 0;
};

}  // namespace Corvo::DSP
