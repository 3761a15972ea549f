#pragma once

#include <cstddef>
#include <span>
#include <vector>

#include "Spectrum/PeakInterpolation.h"
#include "Spectrum/SpectrumFloor.h"
#include "Spectrum/TunerSensitivity.h"

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
// ones, no more than the sensitivity's range below the strongest.
class PitchPeaks {
public:
    void Initialise(const SpectrumFormat& format);
    // At most kMostPeaks, by frequency; valid until the next call. With `clean`, a spectrum as long as
    // `power`, also writes what stands above the floor there, and finds the peaks in that.
    std::span<const SpectralPeak> FilterPeaks(std::span<const float> power,
                                              const TunerSensitivity& sensitivity, std::span<float> clean);

    // The position of the partial whose local maximum is at `bin`, 1 .. bins - 2.
    double InterpolateMax(std::span<const float> power, std::size_t bin) const;
    const SpectrumFormat& Format() const { return m_format; }

private:
    void Collect(std::span<const float> power, const TunerSensitivity& sensitivity);
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
