#pragma once

#include <algorithm>
#include <bit>
#include <cstddef>
#include <cstdint>

#include "DSP/Parts/Arena.h"

namespace Corvo::DSP {

// The newest samples of a stream, by their place in it. Every sample is kept twice, one length of the ring
// apart, so that any stretch is contiguous.
template <typename T>
class SampleHistory {
public:
    // Keeps at least so many samples, rounded up to a power of two; cleared.
    void Prepare(Arena& arena, std::int64_t samples) {
        m_length = static_cast<std::int64_t>(std::bit_ceil(static_cast<std::uint64_t>(samples)));
        m_samples = arena.Take<T>(static_cast<std::size_t>(2 * m_length));
        m_end = 0;
    }
    void Clear() {
        if (m_end > 0) std::fill_n(m_samples, 2 * m_length, T(0));
        m_end = 0;
    }
    void Push(T sample) {
        T* const place = m_samples + (m_end++ & (m_length - 1));
        place[0] = place[m_length] = sample;
    }
    // One behind the newest sample's place. What was never given is 0, also in front of place 0.
    std::int64_t End() const { return m_end; }
    std::int64_t Length() const { return m_length; }
    // The sample at `place` and those behind it. `place` is among the kept ones.
    const T* At(std::int64_t place) const { return m_samples + (place & (m_length - 1)); }
    // Counts places from a later start; `samples` is a multiple of the length, and below End().
    void Rebase(std::int64_t samples) { m_end -= samples; }

private:
    T* m_samples = nullptr;
    std::int64_t m_length = 1, m_end = 0;
};

}  // namespace Corvo::DSP
