#pragma once

#include <vector>

#include "Spectrum/Fft/SharedPlan.h"

namespace Corvo::DSP {

// What the detectors for one rate and one lowest pitch have in common.
struct VoicePitchTables {
    // Throws std::bad_alloc.
    VoicePitchTables(double rate, double lowestHz);
    ~VoicePitchTables() { Fft::GiveBack(m_plan); }
    VoicePitchTables(const VoicePitchTables&) = delete;
    VoicePitchTables& operator=(const VoicePitchTables&) = delete;
    bool IsFor(double otherRate, double otherLowestHz) const {
        return otherRate == rate && otherLowestHz == lowestHz;
    }
    const Fft::Plan<float>& Transform() const { return *m_plan->plan; }

    const double rate, lowestHz;
    const int decimation;
    const double analysisRate;           // of the decimated samples
    const int length, lags, size;        // of frame and transform, in decimated samples
    const int meanBins;                  // of the mean that flattens the spectrum, to either side
    std::vector<float> window, overlap;  // the window's own autocorrelation
    std::vector<float> band;             // of the flattened spectrum

private:
    Fft::SharedPlan<float>* m_plan;
};

}  // namespace Corvo::DSP
