#include "Processor.h"

#include <algorithm>
#include <array>
#include <chrono>
#include <cmath>

#include "Spectrum/Tuner/Tuner.h"

namespace analyser {
namespace {

constexpr int kBlock = 256;
constexpr float kSilence = -120.0f, kLoudest = 24.0f, kFallPerSecond = 20.0f;

}  // namespace

Processor::Processor() : m_view(*this), m_thread([this] { Refresh(); }) {}

Processor::~Processor() {
    {
        const std::lock_guard lock(m_mutex);
        m_ended = true;
    }
    m_end.notify_one();
    m_thread.join();
}

void Processor::Refresh() {
    using Clock = std::chrono::steady_clock;
    constexpr auto kPeriod = std::chrono::nanoseconds(1'000'000'000 / 30);
    auto next = Clock::now();
    std::unique_lock lock(m_mutex);
    while (!m_ended) {
        if (m_view.Refresh()) ++m_changes;
        next = std::max(next + kPeriod, Clock::now());
        m_end.wait_until(lock, next, [this] { return m_ended; });
    }
}

void Processor::Process(const float* const* inputs, float* const* outputs, int channels, int frames,
                        bool bypassed) {
    std::array<float, 2 * kBlock> block;
    const auto width = static_cast<std::size_t>(channels);
    const double rate = m_rate;
    for (int from = 0; from < frames; from += kBlock) {
        const int count = std::min(kBlock, frames - from);
        const auto samples = static_cast<std::size_t>(count) * width;
        for (std::size_t i = 0; i < samples; ++i) {
            const float sample = inputs[i % width][static_cast<std::size_t>(from) + i / width];
            block[i] = std::isfinite(sample) ? sample : 0.0f;
        }
        const float peak = bypassed ? 0.0f : m_view.Feed(block.data(), count, channels);
        m_tone.AddTo(block.data(), count, channels, rate, !bypassed);
        for (std::size_t i = 0; i < samples; ++i)
            outputs[i % width][static_cast<std::size_t>(from) + i / width] = block[i];
        const float now = peak > 1e-6f ? std::min(20.0f * std::log10(peak), kLoudest) : kSilence;
        const float fallen = GetLevel() - kFallPerSecond * static_cast<float>(count / rate);
        m_level.store(std::max(now, std::max(fallen, kSilence)), std::memory_order_relaxed);
    }
}

void Processor::SetRate(double rate) {
    m_rate = rate;
    Hold(*this)->SetSamplingRate(static_cast<int>(rate));
}

void Processor::AddWindow(const void* window, Clipboard copy) {
    const std::lock_guard lock(m_mutex);
    m_windows.emplace_back(window, std::move(copy));
}

void Processor::RemoveWindow(const void* window) {
    const std::lock_guard lock(m_mutex);
    std::erase_if(m_windows, [&](const auto& each) { return each.first == window; });
    if (m_windows.empty()) m_tone.Set(false, 440.0);
}

std::string Processor::Source() const {
    return IsToneOn() ? "The reference tone is added to what comes in"
                      : std::to_string(std::lround(m_rate)) + " Hz, passed through untouched";
}

void Processor::SetTone(bool on) { m_tone.Set(on, 4.0 * Tuner::GetCalibrationBase()); }

}  // namespace analyser
