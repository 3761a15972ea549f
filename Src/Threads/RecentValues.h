#pragma once

#include <algorithm>
#include <array>
#include <atomic>
#include <bit>
#include <cstddef>
#include <cstdint>
#include <type_traits>
#include <vector>

namespace Corvo::DSP {

// A stream of small values from one writing thread to one reading thread, of which the newest `Length` are
// kept (a power of two). The writer never waits; a reader that comes too late misses the oldest ones and
// never gets one half written.
template <typename Value, std::uint32_t Length>
class RecentValues {
public:
    // Writer.
    void Push(const Value& value) {
        const auto words = std::bit_cast<Words>(value);
        const std::uint32_t number = m_ended.load(std::memory_order_relaxed);
        m_begun.store(number + 1, std::memory_order_relaxed);
        auto& slot = m_slots[number % Length];
        // Release: who reads one of these words also sees that its slot was begun afresh.
        for (std::size_t i = 0; i < words.size(); ++i) slot[i].store(words[i], std::memory_order_release);
        m_ended.store(number + 1, std::memory_order_release);
    }

    // Reader: appends the values that came since the last call.
    void Take(std::vector<Value>& values) {
        const std::uint32_t ended = m_ended.load(std::memory_order_acquire);
        m_taken += std::max(ended - m_taken, Length) - Length;
        const std::size_t before = values.size();
        for (std::uint32_t number = m_taken; number != ended; ++number) {
            Words words;
            for (std::size_t i = 0; i < words.size(); ++i)
                words[i] = m_slots[number % Length][i].load(std::memory_order_acquire);
            values.push_back(std::bit_cast<Value>(words));
        }
        // What the writer has begun to overwrite meanwhile does not count.
        const std::uint32_t begun = m_begun.load(std::memory_order_relaxed) - m_taken;
        const auto lost =
            static_cast<std::ptrdiff_t>(std::min(std::max(begun, Length) - Length, ended - m_taken));
        const auto first = values.begin() + static_cast<std::ptrdiff_t>(before);
        values.erase(first, first + lost);
        m_taken = ended;
    }

private:
    static_assert(std::is_trivially_copyable_v<Value> && sizeof(Value) % 4 == 0 &&
                  std::has_single_bit(Length));
    using Words = std::array<std::uint32_t, sizeof(Value) / 4>;

    std::array<std::array<std::atomic<std::uint32_t>, sizeof(Value) / 4>, Length> m_slots{};
    std::atomic<std::uint32_t> m_begun{0}, m_ended{0};
    std::uint32_t m_taken = 0;  // the reader's
};

}  // namespace Corvo::DSP
