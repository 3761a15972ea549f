#include "Spectrum/Tuner/PitchPeaks.h"

#include <algorithm>
#include <array>
#include <cmath>

namespace Corvo {
namespace {

constexpr float kFloorPerMean = 2.0f;
// Peaks below this amplitude are rounding or a filter's ringing; ignored.
constexpr double kSilentAmplitude = 1e-6;
constexpr double kTypicalWindowMean = 0.42;
// Leakage within this many bins of the window counts; further off it is weaker than any partial.
constexpr double kLeakageReach = 7.0;
constexpr float kLeakageMargin = 2.0f;
// The position's variance: of the noise, in bins at a signal as strong as the noise, and of what else moves a
// partial (its neighbours' skirts, its own decay).
constexpr double kNoiseVariance = 0.15;
constexpr double kOtherVariance = 0.004 * 0.004;

// In lanes, or the compiler would have to keep the order of the comparisons.
float Loudest(std::span<const float> power) {
    constexpr std::size_t kLanes = 8;
    std::array<float, kLanes> lanes{};
    const std::size_t whole = power.size() - power.size() % kLanes;
    for (std::size_t k = 0; k < whole; k += kLanes)
        for (std::size_t lane = 0; lane < kLanes; ++lane)
            lanes[lane] = std::max(lanes[lane], power[k + lane]);
    for (std::size_t k = whole; k < power.size(); ++k) lanes[0] = std::max(lanes[0], power[k]);
    return *std::max_element(lanes.begin(), lanes.end());
}

float PowerRatio(float decibels) { return std::pow(10.0f, 0.1f * decibels); }

}  // namespace

void PitchPeaks::Prepare(const SpectrumFormat& format) {
    m_format = {};  // until all is there: memory may run out
    m_interpolation.Prepare(format.windowType, format.windowLength, format.fftLength);
    m_floor.Prepare(format.bins, static_cast<double>(format.fftLength) / format.windowLength);
    m_floorLevels.resize(format.bins);
    // Two neighbours are never both peaks.
    m_peaks.reserve(format.bins / 2 + 1);
    m_silence = std::pow(0.5 * kSilentAmplitude * kTypicalWindowMean * format.windowLength, 2.0);
    m_format = format;
}

double PitchPeaks::InterpolateMax(std::span<const float> power, std::size_t bin) const {
    return static_cast<double>(bin) + m_interpolation.InterpolateMax(power.data() + bin);
}

float PitchPeaks::Collect(std::span<const float> power, const TunerSensitivity& sensitivity) {
    m_peaks.clear();
    const float above = kFloorPerMean * PowerRatio(sensitivity.partialDb);
    const auto binOf = [this](float hz) {
        return static_cast<std::size_t>(
            std::min(hz / m_format.HzPerBin(), static_cast<double>(m_format.bins)));
    };
    const std::size_t first = std::max<std::size_t>(binOf(sensitivity.lowestHz), 1);
    const std::size_t last = std::min(m_format.bins - 1, binOf(sensitivity.highestHz) + 1);
    const float* const p = power.data();
    const float* const floor = m_floorLevels.data();
    for (std::size_t k = first; k < last; ++k)
        if (p[k] > above * floor[k] && p[k] >= p[k - 1] && p[k] > p[k + 1])
            m_peaks.push_back({k, 0.0, 0.0, p[k], 0.0f, 0.0f});
    // Not from the slope of what lies below all bins searched, like a constant offset.
    std::size_t from = first;
    while (from < last && p[from] < p[from - 1]) ++from;
    return from < last ? Loudest({p + from, last - from}) : 0.0f;
}

void PitchPeaks::DropLeakage() {
    const double reach = kLeakageReach * m_format.fftLength / m_format.windowLength;
    if (m_interpolation.LobeWidth() >= reach) return;
    const auto leaks = [&](const SpectralPeak& from, const SpectralPeak& to) {
        const double distance = std::abs(to.position - from.position);
        return distance < reach && to.power < from.power &&
               to.power < kLeakageMargin * from.power * static_cast<float>(m_interpolation.Leakage(distance));
    };
    for (SpectralPeak& peak : m_peaks) {
        const auto near = [&](const SpectralPeak& other) { return leaks(other, peak); };
        if (std::any_of(m_peaks.begin(), m_peaks.end(), near)) peak.weight = -1.0f;
    }
    std::erase_if(m_peaks, [](const SpectralPeak& peak) { return peak.weight < 0.0f; });
}

void PitchPeaks::KeepMostImportant() {
    if (m_peaks.size() <= kMostPeaks) return;
    const auto end = m_peaks.begin() + static_cast<std::ptrdiff_t>(kMostPeaks);
    std::nth_element(m_peaks.begin(), end, m_peaks.end(), [](const SpectralPeak& a, const SpectralPeak& b) {
        return a.Importance() > b.Importance();
    });
    m_peaks.erase(end, m_peaks.end());
    std::sort(m_peaks.begin(), m_peaks.end(),
              [](const SpectralPeak& a, const SpectralPeak& b) { return a.bin < b.bin; });
}

void PitchPeaks::MeasureFloor(std::span<const float> power) {
    if (m_format.bins >= 3) m_floor.Measure(power, m_floorLevels);
}

void PitchPeaks::RemoveFloor(std::span<const float> power, std::span<float> clean) const {
    for (std::size_t k = 0; k < m_format.bins; ++k)
        clean[k] = std::max(power[k] - kFloorPerMean * m_floorLevels[k], 0.0f);
}

std::span<const SpectralPeak> PitchPeaks::FilterPeaks(std::span<const float> power,
                                                      std::span<const float> seen,
                                                      const TunerSensitivity& sensitivity) {
    if (m_format.bins < 3) return {};
    const float strongest = Collect(seen, sensitivity);
    const float weakest = strongest / PowerRatio(sensitivity.rangeDb);
    std::erase_if(m_peaks, [&](const SpectralPeak& peak) {
        return !(peak.power >= weakest && peak.power >= m_silence);
    });
    KeepMostImportant();
    for (SpectralPeak& peak : m_peaks) {
        peak.position = InterpolateMax(power, peak.bin);
        const double noise = m_floorLevels[peak.bin] / peak.power;
        peak.variance = kOtherVariance + kNoiseVariance * noise;
        peak.aboveFloor = static_cast<float>(-10.0 * std::log10(std::max(kFloorPerMean * noise, 1e-20)));
        peak.weight = 1.0f + 10.0f * std::log10(peak.power / strongest) / sensitivity.rangeDb;
    }
    DropLeakage();
    return m_peaks;
}

}  // namespace Corvo
