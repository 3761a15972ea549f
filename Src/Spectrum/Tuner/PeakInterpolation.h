#pragma once

#include <array>
#include <cstddef>

namespace Corvo {

// Where between the bins of a power spectrum a sinusoid lies, given the window it was seen through.
//
// A parabola through the logarithms of a peak and its neighbours comes close for windows with a wide main
// lobe; what it is off by follows from the window's transform and is undone with a table. The rectangular
// window's lobe is too narrow for that, there the ratio of the peak to its larger neighbour serves.
class PeakInterpolation {
public:
    // Window types as in the analyser's settings, anything else being Blackman.
    void Prepare(int windowType, int windowLength, int fftLength);

    // -0.5 .. 0.5 bins from the local maximum at `peak` to the sinusoid. peak[-1], peak[0] and peak[1] are
    // powers; 0 where these are no peak.
    double InterpolateMax(const float* peak) const;

    // The largest power, relative to the peak's, that the window lets leak `bins` away from it.
    double Leakage(double bins) const;
    // Half the width of a peak, in bins.
    double LobeWidth() const;

private:
    double Measure(double before, double at, double after) const;
    double Shape(double bins) const;

    static constexpr int kSteps = 32;
    std::array<double, kSteps + 1> m_offsets{};  // for measures at equal distances
    double m_lowestMeasure = 0.0, m_measureStep = 1.0;
    int m_windowType = 4;
    double m_windowBins = 1.0;  // the window's bins per bin of the transform
};

}  // namespace Corvo
