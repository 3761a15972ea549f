#pragma once

#include <algorithm>
#include <cstddef>
#include <type_traits>

#include "Platform/UntouchedZeros.h"

namespace Corvo::DSP {

// Zeroed memory that is handed out from the front, and all at once given back by Reset. Pages are used when
// something is first written to them. Without memory of its own it only counts, so that the same code says
// how much is needed.
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

    // `count` values, all of their bytes 0 whatever T's defaults are, from a cache line on; null while
    // counting.
    template <typename T = float>
    T* Take(std::size_t count) {
        static_assert(std::is_trivially_copyable_v<T>);
        const std::size_t from = m_taken;
        m_taken += (count * sizeof(T) + kLine - 1) / kLine * (kLine / sizeof(float));
        return m_taken <= m_memory.size() ? reinterpret_cast<T*>(m_memory.data() + from) : nullptr;
    }

private:
    static constexpr std::size_t kLine = 64;

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

}  // namespace Corvo::DSP
