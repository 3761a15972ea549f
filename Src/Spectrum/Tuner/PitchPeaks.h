#pragma once

#include <cstddef>
#include <span>
#include <vector>

#include "Spectrum/Tuner/PeakInterpolation.h"
#include "Spectrum/Tuner/SpectrumFloor.h"
#include "Spectrum/Tuner/TunerSensitivity.h"

namespace Corvo {

// What the spectra to analyse are made of. `bins` of them are looked at.
struct SpectrumFormat {
    int fftLength = 0, windowLength = 0, windowType = 4, samplingRate = 0;
    std::size_t bins = 0;
    bool operator==(const SpectrumFormat&) const = default;
    double HzPerBin() const { return static_cast<double>(samplingRate) / fftLength; }
};

// A partial of the sound.
struct SpectralPeak {
    std::size_t bin;  // of the local maximum
    double position;  // bins, interpolated
    double variance;  // expected of the position
    float power;
    float aboveFloor;  // dB
    float weight;      // 0 for what counts for nothing .. 1 for the strongest
    // Of equally strong peaks the lower ones say more: they are the partials of low numbers.
    float Importance() const { return power / static_cast<float>(bin); }
};

inline constexpr std::size_t kMostPeaks = 32;

// Finds the partials in a power spectrum: local maxima above the noise and above what leaks from stronger
// ones, no more than the sensitivity's range below the loudest bin. That need not be a partial: where noise
// is louder than they are, as in many an attack, there is none.
class PitchPeaks {
public:
    void Prepare(const SpectrumFormat& format);
    // First of all for a spectrum: finds its floor, of which the others make use.
    void MeasureFloor(std::span<const float> power);
    // Writes what stands above the floor, as many bins as the spectrum has.
    void RemoveFloor(std::span<const float> power, std::span<float> clean) const;
    // At most kMostPeaks, by frequency; valid until the next call. They are sought in `seen`, which is
    // `power` itself or what RemoveFloor made of it.
    std::span<const SpectralPeak> FilterPeaks(std::span<const float> power, std::span<const float> seen,
                                              const TunerSensitivity& sensitivity);

    // The position of the partial whose local maximum is at `bin`, 1 .. bins - 2.
    double InterpolateMax(std::span<const float> power, std::size_t bin) const;
    const SpectrumFormat& Format() const { return m_format; }

private:
    // Returns the largest power at the frequencies that the sensitivity seeks, of a peak or not.
    float Collect(std::span<const float> power, const TunerSensitivity& sensitivity);
    void DropLeakage();
    void KeepMostImportant();

    SpectrumFormat m_format;
    PeakInterpolation m_interpolation;
    SpectrumFloor m_floor;
    std::vector<float> m_floorLevels;
    std::vector<SpectralPeak> m_peaks;
    double m_silence = 0.0;
};

}  // namespace Corvo
