#pragma once

#include <cstddef>

#include "DSP/Effects/Denoiser/Arena.h"
#include "DSP/Effects/Denoiser/SpectrumKernels.h"
#include "DSP/Effects/Denoiser/WindowTables.h"

namespace Corvo::DSP::Denoising {

// Turns the noise's power per bin, seen through a window of one length, into what a window of another length
// would see. A longer window has its bins interpolated; a shorter one sees the spectrum through its own,
// wider, frequency response.
class SpectrumConversion {
public:
    // Allocates.
    void Prepare(WindowTables& from, const WindowTables& to);
    void Run(const float* from, float* to);
    std::size_t Bins() const { return m_toBins; }

private:
    std::size_t m_fromBins = 0, m_toBins = 0, m_ratio = 1;
    bool m_shorter = false;
    float m_scale = 1.0f;  // of the windows' energies
    // The shorter window's frequency response, from its middle upwards. It is given at the longer window's
    // bins, m_ratio of which make one bin of the shorter window.
    Floats m_response;
    Floats m_mirrored, m_seen;
};

// `count` values at places step * i of `from`, linear between them; beyond the end its last value.
void Resample(const float* from, std::size_t fromCount, double step, float* to, std::size_t count);

}  // namespace Corvo::DSP::Denoising
