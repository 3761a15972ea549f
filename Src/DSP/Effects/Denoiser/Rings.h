#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <vector>

#include "DSP/Parts/Arena.h"
#include "Platform/AlignedMemory.h"

namespace Corvo::DSP::Denoising {

using Floats = std::vector<float, AlignedAllocator<float>>;

// The newest frames of a spectrum. A frame before the first is the first one.
class FrameRing {
public:
    void Take(Arena& arena, std::size_t frames, std::size_t values) {
        m_data = arena.Take(frames * values);
        m_frames = static_cast<std::int64_t>(frames);
        m_values = values;
    }
    float* operator[](std::int64_t frame) const {
        return m_data + static_cast<std::size_t>((frame < 0 ? 0 : frame) % m_frames) * m_values;
    }

private:
    float* m_data = nullptr;
    std::int64_t m_frames = 1;
    std::size_t m_values = 0;
};

// A stream's newest samples by their place in it; a power of two of them.
class SampleRing {
public:
    void Take(Arena& arena, std::size_t samples) {
        m_data = arena.Take(samples);
        m_mask = samples - 1;
    }
    std::size_t Size() const { return m_mask + 1; }
    float& operator[](std::int64_t place) const { return m_data[Index(place)]; }
    // Calls `call` with a pointer, the number of samples before it and their count, once or, across the
    // ring's end, twice.
    template <typename Call>
    void ForEachRun(std::int64_t place, std::size_t count, Call call) const {
        const std::size_t start = Index(place), first = std::min(count, Size() - start);
        call(m_data + start, std::size_t{0}, first);
        if (first < count) call(m_data, first, count - first);
    }

private:
    std::size_t Index(std::int64_t place) const { return static_cast<std::size_t>(place) & m_mask; }

    float* m_data = nullptr;
    std::size_t m_mask = 0;
};

}  // namespace Corvo::DSP::Denoising
