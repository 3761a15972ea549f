#pragma once

#include <atomic>
#include <cstdint>

namespace Corvo::DSP {

// Decides which of two copies of something the audio thread uses, and lets other threads prepare the idle
// one. Index and flags are one atomic word; nobody waits.
class TwoCopies {
public:
    // Audio thread: the copy in use, 0 or 1.
    int Live() const { return static_cast<int>(m_word.load(std::memory_order_relaxed) & kIndex); }

    // Any thread: runs prepare(idle copy) and raises the exchange flag. If another thread is preparing right
    // now, that one is made to run it once more instead; so `prepare` reads what it needs afresh.
    template <typename Prepare>
    void Publish(Prepare prepare) {
        std::uint32_t word = m_word.load(std::memory_order_relaxed), claimed;
        do {
            claimed = (word & kPreparing) ? word | kAgain : (word & kIndex) | kPreparing;
        } while (!m_word.compare_exchange_weak(word, claimed, std::memory_order_acq_rel));
        if (word & kPreparing) return;
        for (;;) {
            prepare(static_cast<int>((claimed & kIndex) ^ 1));
            std::uint32_t expected = claimed;
            if (m_word.compare_exchange_strong(expected, (claimed & kIndex) | kExchange,
                                               std::memory_order_acq_rel))
                return;
            m_word.fetch_and(~kAgain, std::memory_order_acq_rel);
        }
    }

    // Audio thread: takes the prepared copy into use if the flag is up. True when they were exchanged.
    bool Exchange() {
        std::uint32_t word = m_word.load(std::memory_order_relaxed);
        return (word & kExchange) &&
               m_word.compare_exchange_strong(word, (word & kIndex) ^ 1, std::memory_order_acq_rel);
    }

private:
    static constexpr std::uint32_t kIndex = 0xFFFF, kExchange = 0x10000, kPreparing = 0x20000,
                                   kAgain = 0x40000;
    std::atomic<std::uint32_t> m_word{0};
};

}  // namespace Corvo::DSP
