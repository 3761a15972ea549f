#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <vector>

#include "Platform/AlignedMemory.h"
#include "Platform/UntouchedZeros.h"

namespace Corvo::DSP::Denoising {

using Floats = std::vector<float, AlignedAllocator<float>>;

// Zeroed memory that is handed out from the front, and all at once given back by Reset: what the reducer's
// parts work in when the settings, and with them the parts, change while audio runs. Without memory of its
// own it only counts, so that the same code says how much is needed.
class Arena {
public:
    void Reserve(std::size_t count) {
        m_memory = UntouchedZeros<float>(count);
        m_taken = 0;
    }
    void Reset() {
        std::fill_n(m_memory.begin(), std::min(m_taken, m_memory.size()), 0.0f);
        m_taken = 0;
    }
    std::size_t Taken() const { return m_taken; }
    bool Counting() const { return m_memory.empty(); }

    // `count` floats from a cache line on; null while counting.
    float* Take(std::size_t count) {
        const std::size_t from = m_taken;
        m_taken += (count + kLine - 1) / kLine * kLine;
        return m_taken <= m_memory.size() ? m_memory.data() + from : nullptr;
    }

private:
    static constexpr std::size_t kLine = 16;

    UntouchedZeros<float> m_memory;
    std::size_t m_taken = 0;
};

// Memory for all that `lay` takes out of an arena; called twice.
void ReserveFor(Arena& arena, const auto& lay) {
    Arena counting;
    lay(counting);
    arena.Reserve(counting.Taken());
    lay(arena);
}

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
