#pragma once

#include <cstddef>

#include "DSP/Effects/Denoiser/ReducerTables.h"
#include "DSP/Effects/Denoiser/Rings.h"
#include "DSP/Effects/Denoiser/SpectrumKernels.h"
#include "Spectrum/Fft/SplitTransform.h"

namespace Corvo::DSP::Denoising {

// What the parts of a reducer share for windows of one length; made before processing.
struct WindowTables {
    // Allocates for windows of `samples`; throws std::bad_alloc.
    void Prepare(int samples);
    // A window's samples, and what its transforms work in (SplitTransform::WorkFloats). Windows of other
    // lengths may have the same.
    void WorkIn(float* samples, float* work) {
        scratch = samples;
        m_work = work;
    }
    // For what bins stand for at another rate than the shared tables'.
    void PrepareRates(Arena& arena) { m_otherRate.Prepare(arena, length); }
    // Takes length `which` of the tables that all reducers share, which live as long as they are in use.
    void Use(const ReducerTables& tables, std::size_t which);
    // What the bins stand for: from the shared tables, or at another rate than theirs worked out here.
    void SetRate(double rate, int blendLength);

    int length = 0;
    const WindowShape* shape = nullptr;
    const BinTables* bins = nullptr;
    float* scratch = nullptr;
    // Between scratch and a split spectrum.
    void Forward(float* re, float* im) const { m_transform.Forward(scratch, re, im, m_work); }
    void Inverse(const float* re, const float* im) const { m_transform.Inverse(re, im, scratch, m_work); }

    std::size_t Half() const { return static_cast<std::size_t>(length) / 2; }
    std::size_t Bins() const { return Half() + 1; }
    // Values per frame in memory.
    std::size_t Values() const { return SpectrumValues(length); }

private:
    Fft::SplitTransform m_transform;
    float* m_work = nullptr;
    const BinTables* m_preparedBins = nullptr;
    double m_preparedRate = 0.0;
    BinTables m_otherRate;
};

// The split spectrum of the windowed samples from `start` on.
void Transform(const SpectrumKernels& kernels, WindowTables& tables, const SampleRing& input,
               std::int64_t start, float* re, float* im);
// Adds tables.scratch, windowed, to the samples from `start` on; the last hop of them is begun anew.
void OverlapAdd(const SpectrumKernels& kernels, const WindowTables& tables, const SampleRing& output,
                std::int64_t start);

}  // namespace Corvo::DSP::Denoising
