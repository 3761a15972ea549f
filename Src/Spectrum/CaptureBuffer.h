#pragma once

#include <array>
#include <atomic>
#include <vector>

#include "Platform/CriticalSection.h"

namespace Corvo {

// The newest samples of a signal, handed from the audio thread to the display.
//
// The audio thread writes a ring of fixed size and never waits: it empties the ring into the sample buffer
// itself when nobody holds the lock, and leaves that to the reader otherwise. As the sample buffer keeps the
// oldest sample first, long windows are moved up only once in a while, so that a sample costs the same in
// every window. Should the ring be full while the lock is held, the rest of the block is lost.
class CaptureBuffer {
public:
    // Audio thread. Frame i has its channels at samples[i * stride]; their mean is captured. Ignored without
    // samples, frames or channels; a stride below 1 counts as 1.
    template <typename Sample>
    void Feed(const Sample* samples, int frames, int stride, int channels);

    // The rest: one other thread at a time.

    // `length` samples of which the first min(window, length) are captured ones, the rest zero. The newest
    // samples are kept. Length 0 empties the buffer.
    void Resize(int length, int window);
    // New data is announced every `hop` samples, counted from here.
    void SetHop(int hop);

    bool Pending() const { return m_pending.load(std::memory_order_acquire); }
    void ClearPending() { m_pending.store(false, std::memory_order_relaxed); }
    // Copies the samples, as many as `to` takes, and clears the pending flag.
    void CopyTo(std::vector<float>& to);
    // The samples, oldest first, with everything that was fed before the call.
    std::vector<float>& Samples();

private:
    static constexpr unsigned kStaged = 16384;

    void MoveStaged();

    std::array<float, kStaged> m_staging{};
    std::atomic<unsigned> m_written{0};  // moved by the audio thread
    std::atomic<unsigned> m_read{0};     // moved by who holds the lock
    std::atomic<unsigned> m_worthMoving{1};
    std::atomic<int> m_hop{1};
    std::atomic<int> m_sinceHop{0};
    std::atomic<bool> m_pending{false};

    CriticalSection m_dataLock;  // m_samples, m_window and emptying the ring
    std::vector<float> m_samples;
    unsigned m_window = 0;
};

}  // namespace Corvo
