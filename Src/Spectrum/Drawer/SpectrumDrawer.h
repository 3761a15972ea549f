#pragma once

#include <atomic>
#include <cstddef>
#include <vector>

#include "Platform/Export.h"
#include "Spectrum/Scales/CoordinatesAndFrequencies.h"

class VectorInterpolationFilterFloat;

namespace Corvo {

// Between bins, and what a sine there would have: dB below full scale.
struct SpectrumPeak {
    double frequency, level;  // Hz; dB
};

}  // namespace Corvo

// Turns the power spectra of one analyser into the curve that is drawn: smooths them over time and keeps a
// memory of their peaks. Used on the display side of its analyser, which lends its lock. A curve costs a pass
// over the bins; memory is made where the settings or a larger rectangle need it.
class DSP_API SpectrumDrawer {
public:
    // Without buffers until Allocate.
    explicit SpectrumDrawer(Corvo::SpectrumSettings settings);
    ~SpectrumDrawer();

    // Stored; buffers follow with Allocate.
    void UpdateSettings(Corvo::SpectrumSettings settings);
    const Corvo::SpectrumSettings& GetSettings() const;

    // Size the spectrum, the peaks and their counters for the settings. Allocate keeps what is there;
    // ReallocateBuffers starts from zero.
    void Allocate();
    void ReallocateBuffers();
    void Deallocate();

    // Another rate than before clears all history. -1 until set.
    void UpdateSamplingFrequency(int samplingRate);
    int GetSamplingFrequency() const;

    // Takes the next power spectrum into the smoothed one. `coefficient` is the share of it that counts when
    // analyses come once a second per sample of hop: 0.15 is brisk, 0.035 calm. Always true.
    bool SmoothFftSpectrum(const std::vector<float>& power, float coefficient,
                           VectorInterpolationFilterFloat& filter);
    // |bin|^2 from 0 Hz up, smoothed; the drawer's, valid until the next call that changes it.
    const std::vector<float>& GetPowerSmoothed() const;

    // Milliseconds between display refreshes; kivspectrum's function of that name has what follows from it.
    static int GetRefreshRatePeriod();
    // Refreshes per second: 30 with time smoothing, else as many as there are new spectra.
    int GetActualRefreshRate(const std::vector<float>& power) const;
    // How many frames a peak stays before it falls: 1 without peak memory, 0 when it never falls.
    int power_decay_length(const std::vector<float>& power) const;

    // One drawn frame older: peaks that the spectrum reaches are new, those whose frames ran out sink by
    // 1 dB a frame until they meet it.
    void AgePeaks();
    // Forgets all peaks.
    void peak_reset();
    // The highest power that each bin remembers; the drawer's.
    const std::vector<float>& GetPeaks() const;

    // Works out the curve in `rectangle` and copies as many of its points as `capacity` allows to `points`
    // (may be null); `count`, also returned, says how many. `map` is for the same rectangle. Every pixel
    // column gets one point, the maximum of its bins or a smooth curve between bins further apart; octave and
    // third-octave bands get two each, so that there are never more than two per column. `offset` (dB) is
    // added to the levels. Draws the smoothed spectrum, and counts as a frame for the peaks; or `other`, with
    // fft_length / 2 powers. The sonogram has no points.
    int ComputeSpectrumPoints(const Corvo::RectF& rectangle, Corvo::PointF* points, int& count,
                              const CoordinatesAndFrequencies& map, Corvo::DisplayMode mode, int capacity,
                              float offset, const std::vector<float>* other = nullptr);
    // All points of the last curve, and the bins that they stand for.
    const std::vector<Corvo::PointF>& GetXYPoints() const;
    const std::vector<int>& GetFFTPoints() const;

    // The highest peak of the smoothed spectrum from a frequency (Hz) up, except for DC and half the rate; 0
    // Hz and -300 dB when there is none.
    Corvo::SpectrumPeak HighestPeak(double lowestHz = 0.0) const;

    // Its analyser's switch.
    void SetOn(bool on);
    bool GetOn() const;

private:
    void AddCurve(const Corvo::RectF& rectangle, const CoordinatesAndFrequencies& map,
                  const std::vector<float>& power, double scale);
    void AddBands(const Corvo::RectF& rectangle, const CoordinatesAndFrequencies& map,
                  const std::vector<float>& power, double scale);
    void AddPoint(double x, double y, std::ptrdiff_t bin);
    double RefreshRate(const std::vector<float>& power) const;

    Corvo::SpectrumSettings m_settings;
    std::vector<float> m_smoothed;
    std::vector<float> m_peaks;
    std::vector<float> m_peakFrames;  // until each peak falls
    std::vector<Corvo::PointF> m_points;
    std::vector<int> m_pointBins;
    std::vector<float> m_levels;
    int m_samplingRate = -1;
    std::atomic<bool> m_on{true};
};
