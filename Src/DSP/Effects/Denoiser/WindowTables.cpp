#include "DSP/Effects/Denoiser/WindowTables.h"

#include <algorithm>
#include <new>

namespace Corvo::DSP::Denoising {

void Transform(const SpectrumKernels& kernels, WindowTables& tables, const SampleRing& input,
               std::int64_t start, float* re, float* im) {
    input.ForEachRun(start, static_cast<std::size_t>(tables.length),
                     [&](const float* samples, std::size_t done, std::size_t count) {
                         kernels.multiply(tables.scratch.data() + done, samples,
                                          tables.shape->analysis.data() + done, count);
                     });
    tables.fft.DoFFTReal(tables.scratch.data(), re, im, tables.length, 0);
}

void OverlapAdd(const SpectrumKernels& kernels, const WindowTables& tables, const SampleRing& output,
                std::int64_t start) {
    const auto whole = static_cast<std::size_t>(tables.length), begun = whole - whole / kOverlap;
    const float* const from = tables.scratch.data();
    const float* const window = tables.shape->synthesis.data();
    output.ForEachRun(start, begun, [&](float* samples, std::size_t done, std::size_t count) {
        kernels.multiplyAdd(samples, from + done, window + done, count);
    });
    output.ForEachRun(start + static_cast<std::int64_t>(begun), whole - begun,
                      [&](float* samples, std::size_t done, std::size_t count) {
                          kernels.multiply(samples, from + begun + done, window + begun + done, count);
                      });
}

void WindowTables::Prepare(int samples) {
    length = samples;
    scratch = UntouchedZeros<float>(static_cast<std::size_t>(samples));
    fft.AllocateReal(samples, 1);
    // Without memory it transforms nothing and says nothing.
    scratch[1] = 1.0f;
    fft.DoFFTReal(scratch.data(), 0, 0);
    const bool forward = scratch[0] != 0.0f;
    fft.DoIFFTReal(scratch.data(), 0, 0);
    if (!forward || !(scratch[1] > 0.5f)) throw std::bad_alloc();
}

void WindowTables::Use(const ReducerTables& tables, std::size_t which) {
    shape = &tables.shapes[which];
    m_preparedBins = &tables.bins[which];
    m_preparedRate = tables.rate;
}

void WindowTables::SetRate(double rate, int blendLength) {
    bins = m_preparedBins;
    if (rate == m_preparedRate) return;
    m_otherRate.SetRate(rate, blendLength);
    bins = &m_otherRate;
}

}  // namespace Corvo::DSP::Denoising
