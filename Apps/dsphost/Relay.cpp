#include "Relay.h"

#include <algorithm>
#include <system_error>
#include <utility>

namespace dsphost {

std::size_t BlockSamples(std::size_t channels) {
    constexpr std::size_t kSamples = 1 << 14;
    return std::max(kSamples / channels, std::size_t{1}) * channels;
}

Relay::Relay(std::size_t samplesPerBlock) : m_samplesPerBlock(samplesPerBlock) {}

Relay::~Relay() { Close(); }

bool Relay::Start(std::function<void()> work) {
    try {
        m_thread = std::jthread([this, work = std::move(work)] {
            try {
                work();
            } catch (...) {
                Close(std::current_exception());
            }
        });
    } catch (const std::system_error&) {
        return false;
    }
    return true;
}

Block* Relay::ToFill() {
    std::unique_lock lock(m_mutex);
    if (Waiting() == m_blocks.size())
        m_mayFill.wait(lock, [this] { return m_closed || Waiting() <= m_blocks.size() / 2; });
    ThrowReason();
    if (m_closed) return nullptr;
    Block& block = m_blocks[m_passed % m_blocks.size()];
    block.samples.resize(m_samplesPerBlock);  // short files need few blocks
    block.frames = 0;
    return &block;
}

void Relay::Pass() {
    const std::lock_guard lock(m_mutex);
    ++m_passed;
    if (Waiting() == m_blocks.size() / 2) m_mayTake.notify_one();
}

Block* Relay::ToTake() {
    std::unique_lock lock(m_mutex);
    if (Waiting() == 0) m_mayTake.wait(lock, [this] { return m_closed || Waiting() >= m_blocks.size() / 2; });
    if (Waiting() > 0) return &m_blocks[m_returned % m_blocks.size()];
    ThrowReason();
    return nullptr;
}

void Relay::Return() {
    const std::lock_guard lock(m_mutex);
    ++m_returned;
    if (Waiting() == m_blocks.size() / 2) m_mayFill.notify_one();
}

void Relay::Close(std::exception_ptr reason) {
    const std::lock_guard lock(m_mutex);
    m_closed = true;
    if (!m_reason) m_reason = std::move(reason);
    m_mayFill.notify_all();
    m_mayTake.notify_all();
}

void Relay::Finish() {
    Close();
    if (m_thread.joinable()) m_thread.join();
    ThrowReason();
}

void Relay::ThrowReason() const {
    if (m_reason) std::rethrow_exception(m_reason);
}

}  // namespace dsphost
