#include "Spectrum/CaptureBuffer.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <mutex>
#include <utility>

namespace Corvo {
namespace {

template <typename Sample>
float MeanOfFinite(const Sample* samples, int channels) {
    double sum = 0.0;
    for (int channel = 0; channel < channels; ++channel)
        if (std::isfinite(samples[channel])) sum += static_cast<double>(samples[channel]) / channels;
    const auto mean = static_cast<float>(sum);
    return std::isfinite(mean) ? mean : 0.0f;
}

}  // namespace

template <typename Sample>
void CaptureBuffer::Feed(const Sample* samples, int frames, int stride, int channels) {
    if (!samples || frames < 1 || channels < 1) return;
    const std::ptrdiff_t step = std::max(stride, 1);
    const Sample share = Sample(1) / static_cast<Sample>(channels);
    for (int done = 0; done < frames;) {
        const unsigned written = m_written.load(std::memory_order_relaxed);
        const unsigned staged = written - m_read.load(std::memory_order_acquire);
        const int piece = std::min(static_cast<int>(kStaged - staged), frames - done);
        for (int i = 0; i < piece; ++i, samples += step) {
            Sample sum = samples[0];
            for (int channel = 1; channel < channels; ++channel) sum += samples[channel];
            auto mean = static_cast<float>(sum * share);
            if (!std::isfinite(mean)) mean = MeanOfFinite(samples, channels);
            m_staging[(written + static_cast<unsigned>(i)) % kStaged] = mean;
        }
        const unsigned now = staged + static_cast<unsigned>(piece);
        m_written.store(written + static_cast<unsigned>(piece), std::memory_order_release);
        done += piece;
        if (done == frames && now < m_worthMoving.load(std::memory_order_relaxed)) break;
        const std::unique_lock lock(m_dataLock, std::try_to_lock);
        if (!lock) break;
        MoveStaged();
    }
    const std::int64_t since = std::int64_t{m_sinceHop.load(std::memory_order_relaxed)} + frames;
    const int hop = m_hop.load(std::memory_order_relaxed);
    m_sinceHop.store(static_cast<int>(since % hop), std::memory_order_relaxed);
    if (since >= hop) m_pending.store(true, std::memory_order_release);
}

template void CaptureBuffer::Feed(const float*, int, int, int);
template void CaptureBuffer::Feed(const double*, int, int, int);

void CaptureBuffer::MoveStaged() {
    const unsigned written = m_written.load(std::memory_order_acquire);
    const unsigned staged = written - m_read.load(std::memory_order_relaxed);
    const unsigned taken = std::min(staged, m_window);
    const auto window = m_samples.begin() + static_cast<std::ptrdiff_t>(m_window);
    auto to = std::copy(m_samples.begin() + static_cast<std::ptrdiff_t>(taken), window, m_samples.begin());
    const unsigned start = (written - taken) % kStaged;
    const unsigned beforeWrap = std::min(taken, kStaged - start);
    to = std::copy_n(m_staging.begin() + start, beforeWrap, to);
    std::copy_n(m_staging.begin(), taken - beforeWrap, to);
    m_read.store(written, std::memory_order_release);
}

void CaptureBuffer::Resize(int length, int window) {
    std::vector<float> samples(static_cast<std::size_t>(length));
    const auto newWindow = static_cast<unsigned>(std::min(length, window));
    {
        const std::lock_guard lock(m_dataLock);
        MoveStaged();
        const auto kept = static_cast<std::ptrdiff_t>(std::min(newWindow, m_window));
        const auto newest = m_samples.begin() + static_cast<std::ptrdiff_t>(m_window);
        std::copy(newest - kept, newest, samples.begin() + static_cast<std::ptrdiff_t>(newWindow) - kept);
        m_samples.swap(samples);
        m_window = newWindow;
        m_worthMoving.store(std::clamp(m_window / 64, 1u, kStaged / 2), std::memory_order_relaxed);
    }
}

void CaptureBuffer::SetHop(int hop) {
    m_hop.store(std::max(hop, 1), std::memory_order_relaxed);
    m_sinceHop.store(0, std::memory_order_relaxed);
}

void CaptureBuffer::CopyTo(std::vector<float>& to) {
    const std::lock_guard lock(m_dataLock);
    ClearPending();
    MoveStaged();
    std::copy_n(m_samples.begin(), std::min(to.size(), m_samples.size()), to.begin());
}

std::vector<float>& CaptureBuffer::Samples() {
    const std::lock_guard lock(m_dataLock);
    MoveStaged();
    return m_samples;
}

}  // namespace Corvo
