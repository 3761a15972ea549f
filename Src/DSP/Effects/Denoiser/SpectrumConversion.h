#pragma once

#include <cstddef>

#include "DSP/Effects/Denoiser/Rings.h"
#include "DSP/Effects/Denoiser/SpectrumKernels.h"
#include "DSP/Effects/Denoiser/WindowTables.h"

namespace Corvo::DSP::Denoising {

// Turns the noise's power per bin, seen through a window of one length, into what a window of another length
// would see. A longer window has its bins interpolated; a shorter one sees the spectrum through its own,
// wider, frequency response.
class SpectrumConversion {
public:
    void Prepare(const WindowTables& from, const WindowTables& to);
    // Floats that it works in; conversions may share them.
    std::size_t WorkFloats() const { return m_shorter ? 2 * (m_fromValues + kResponseBins * m_ratio) : 0; }
    void WorkIn(float* work) { m_work = work; }
    // The frequency response of `to`, if it is the shorter; lives as long as it is in use.
    void Use(const Floats& response) { m_response = &response; }
    void Run(const float* from, float* to);
    std::size_t Bins() const { return m_toBins; }

private:
    std::size_t m_fromBins = 0, m_fromValues = 0, m_toBins = 0, m_ratio = 1;
    bool m_shorter = false;
    float m_scale = 1.0f;                // of the windows' energies
    const Floats* m_response = nullptr;  // at the longer window's bins, m_ratio to one of the shorter's
    float* m_work = nullptr;
};

// `count` values at places step * i of `from`, linear between them; beyond the end its last value.
void Resample(const float* from, std::size_t fromCount, double step, float* to, std::size_t count);

}  // namespace Corvo::DSP::Denoising
