#pragma once

#include <array>
#include <atomic>
#include <type_traits>

namespace Corvo::DSP {

// Hands whole values from one writing thread to one reading thread. Three slots change hands through one
// atomic index, so neither side waits, allocates or frees, and a value is never seen half written.
//
// Each slot belongs to one thread at a time, which may also change what is in it. A value that was replaced
// comes back to the writer, so what it owns (a slot may hold a unique_ptr) is freed on the writer's thread.
template <typename Value>
class LatestValue {
public:
    // Written out because Clang 14 takes the implicit one for one that never throws.
    LatestValue() noexcept(std::is_nothrow_default_constructible_v<Value>) {}

    // Writer: fill Draft() completely, then Publish() it. A published value that was not taken is replaced.
    Value& Draft() { return m_slots[m_draft]; }
    void Publish() {
        // Release hands the draft over; acquire sees that the reader is done with the slot coming back.
        m_draft = m_middle.exchange(m_draft | kFresh, std::memory_order_acq_rel) & kSlot;
    }

    // Reader: the newest value, or null when none came since the last call. It stays the reader's until the
    // next Take() that returns one.
    Value* Take() {
        if ((m_middle.load(std::memory_order_relaxed) & kFresh) == 0) return nullptr;
        m_taken = m_middle.exchange(m_taken, std::memory_order_acq_rel) & kSlot;
        return &m_slots[m_taken];
    }
    // Reader: the value taken last; before the first one, a slot that the writer has not touched.
    Value& Taken() { return m_slots[m_taken]; }

    // With neither thread at work: no value at all, and nothing that one of the slots still owns.
    void Clear() {
        m_slots = {};
        m_middle.fetch_and(kSlot);
    }

private:
    static constexpr unsigned kSlot = 3, kFresh = 4;

    std::array<Value, 3> m_slots{};
    unsigned m_draft = 0;               // the writer's
    unsigned m_taken = 1;               // the reader's
    std::atomic<unsigned> m_middle{2};  // whoever exchanges it owns the slot that comes back
};

}  // namespace Corvo::DSP
