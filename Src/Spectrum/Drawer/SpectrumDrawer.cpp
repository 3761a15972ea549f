#include "Spectrum/Drawer/SpectrumDrawer.h"

#include <algorithm>
#include <cmath>
#include <cstddef>

#include "Spectrum/Drawer/VectorInterpolationFilterFloat.h"
#include "Spectrum/Scales/SpectrumLimits.h"

namespace {

constexpr int kRefreshPeriod = 30;
constexpr double kRefreshRate = 30.0;
// Rises are followed faster than falls.
constexpr double kRise = 1.6;
constexpr float kPeakFall = 0.79432823f;  // 1 dB of power

enum SmoothingType { kExponential = 0, kMovingFilter = 1 };

}  // namespace

SpectrumDrawer::SpectrumDrawer(Corvo::SpectrumSettings settings) : m_settings(settings) {}
SpectrumDrawer::~SpectrumDrawer() = default;

void SpectrumDrawer::UpdateSettings(Corvo::SpectrumSettings settings) { m_settings = settings; }
const Corvo::SpectrumSettings& SpectrumDrawer::GetSettings() const { return m_settings; }

void SpectrumDrawer::Allocate() {
    const auto bins = static_cast<std::size_t>(Corvo::BufferLength(m_settings.fft_length) / 2);
    for (auto* vector : {&m_smoothed, &m_peaks, &m_peakFrames}) vector->resize(bins);
}

void SpectrumDrawer::ReallocateBuffers() {
    for (auto* vector : {&m_smoothed, &m_peaks, &m_peakFrames}) vector->clear();
    Allocate();
}

void SpectrumDrawer::Deallocate() {
    for (auto* vector : {&m_smoothed, &m_peaks, &m_peakFrames}) *vector = {};
}

void SpectrumDrawer::UpdateSamplingFrequency(int samplingRate) {
    if (samplingRate == m_samplingRate) return;
    m_samplingRate = -1;  // until the buffers are there
    ReallocateBuffers();
    m_samplingRate = samplingRate;
}

int SpectrumDrawer::GetSamplingFrequency() const { return m_samplingRate; }

bool SpectrumDrawer::SmoothFftSpectrum(const std::vector<float>& power, float coefficient,
                                       VectorInterpolationFilterFloat& filter) {
    if (!m_settings.time_smoothing) {
        m_smoothed = power;
        return true;
    }
    switch (m_settings.smoothing_type) {
        case kExponential: {
            const int hop = m_settings.hop_length >= 1 ? m_settings.hop_length : m_settings.window_length;
            const double rate = static_cast<double>(m_samplingRate) / std::max(hop, 1);
            const double alpha = std::clamp(rate * static_cast<double>(coefficient), 0.0, 1.0);
            const auto fall = static_cast<float>(alpha);
            const auto rise = static_cast<float>(std::min(kRise * alpha, 1.0));
            const std::size_t bins = std::min(m_smoothed.size(), power.size());
            for (std::size_t k = 0; k < bins; ++k) {
                const float share = power[k] > m_smoothed[k] ? rise : fall;
                m_smoothed[k] = (1.0f - share) * m_smoothed[k] + share * power[k];
            }
            break;
        }
        case kMovingFilter:
            filter.Average(power, m_smoothed);
            break;
        default:
            break;  // the last spectrum stays
    }
    return true;
}

const std::vector<float>& SpectrumDrawer::GetPowerSmoothed() const { return m_smoothed; }

int SpectrumDrawer::GetRefreshRatePeriod() { return kRefreshPeriod; }

double SpectrumDrawer::RefreshRate(const std::vector<float>& power) const {
    if (m_settings.time_smoothing) return kRefreshRate;
    return power.empty() ? 0.0 : static_cast<double>(m_samplingRate) / static_cast<double>(power.size());
}

int SpectrumDrawer::GetActualRefreshRate(const std::vector<float>& power) const {
    return static_cast<int>(RefreshRate(power));
}

int SpectrumDrawer::power_decay_length(const std::vector<float>& power) const {
    if (m_settings.peak_hold_mode == 0) return 1;
    constexpr double kSeconds[] = {0.0, 1.5, 0.8, 0.5};
    const int mode = m_settings.peak_decay_mode;
    const double seconds = mode >= 0 && mode <= 3 ? kSeconds[mode] : 0.0;
    const int frames = static_cast<int>(RefreshRate(power) * seconds);
    return m_settings.time_smoothing ? 2 * frames : frames;
}

void SpectrumDrawer::AgePeaks() {
    if (m_settings.peak_hold_mode == 0) return;
    const int frames = power_decay_length(m_smoothed);
    const bool fall = m_settings.peak_hold_mode == 1 && frames > 0;
    const std::size_t bins = std::min({m_smoothed.size(), m_peaks.size(), m_peakFrames.size()});
    for (std::size_t k = 0; k < bins; ++k) {
        if (m_smoothed[k] >= m_peaks[k]) {
            m_peaks[k] = m_smoothed[k];
            m_peakFrames[k] = static_cast<float>(frames);
        } else if (fall) {
            if (m_peakFrames[k] > 0.0f)
                m_peakFrames[k] -= 1.0f;
            else
                m_peaks[k] = std::max(m_peaks[k] * kPeakFall, m_smoothed[k]);
        }
    }
}

void SpectrumDrawer::peak_reset() { std::fill(m_peaks.begin(), m_peaks.end(), 0.0f); }
const std::vector<float>& SpectrumDrawer::GetPeaks() const { return m_peaks; }

void SpectrumDrawer::SetOn(bool on) { m_on = on; }
bool SpectrumDrawer::GetOn() const { return m_on; }
