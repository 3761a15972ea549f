#pragma once

#include <array>
#include <condition_variable>
#include <cstdint>
#include <exception>
#include <functional>
#include <mutex>
#include <thread>
#include <vector>

namespace dsphost {

// Interleaved samples on their way from one thread to another.
struct Block {
    std::vector<double> samples;
    std::int64_t frames = 0;
};

// What a block holds at most, in whole frames: enough that handing it over costs next to nothing, and so few
// that all blocks of a relay stay in a processor's caches.
std::size_t BlockSamples(std::size_t channels);

// Hands blocks from a thread that fills them to one that takes them. One of the two threads belongs to the
// relay. A side that had to wait goes on when half of the blocks are there for it, as going to sleep and
// waking up cost more than handing over a block.
//
// Either side may close it, with the reason where something failed. What was passed on before is still taken,
// then the taking side learns of the end, or gets the reason thrown. The filling side learns of it at once.
class Relay {
public:
    explicit Relay(std::size_t samplesPerBlock);
    ~Relay();  // closes, and waits for the thread

    // Runs `work` on a thread of the relay's own; what it throws becomes the reason. False where the system
    // has no thread to give.
    bool Start(std::function<void()> work);

    // For the side that fills: a block without frames, and its way to the other side. Null when closed.
    Block* ToFill();
    void Pass();
    // For the side that takes: the next block, and its way back. Null at the end.
    Block* ToTake();
    void Return();

    void Close(std::exception_ptr reason = {});
    // Closes, and waits until the relay's own thread has taken everything. Throws what made it fail.
    void Finish();

private:
    std::size_t Waiting() const { return m_passed - m_returned; }  // blocks, to be taken
    void ThrowReason() const;

    std::size_t m_samplesPerBlock;
    std::mutex m_mutex;
    std::condition_variable m_mayFill, m_mayTake;
    std::array<Block, 16> m_blocks;
    std::size_t m_passed = 0, m_returned = 0;  // blocks since the start
    bool m_closed = false;
    std::exception_ptr m_reason;
    std::jthread m_thread;
};

}  // namespace dsphost
