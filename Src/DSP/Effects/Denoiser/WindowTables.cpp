#include "DSP/Effects/Denoiser/WindowTables.h"

namespace Corvo::DSP::Denoising {

void Transform(const SpectrumKernels& kernels, WindowTables& tables, const SampleRing& input,
               std::int64_t start, float* re, float* im) {
    input.ForEachRun(start, static_cast<std::size_t>(tables.length),
                     [&](const float* samples, std::size_t done, std::size_t count) {
                         kernels.multiply(tables.scratch + done, samples,
                                          tables.shape->analysis.data() + done, count);
                     });
    tables.Forward(re, im);
}

void OverlapAdd(const SpectrumKernels& kernels, const WindowTables& tables, const SampleRing& output,
                std::int64_t start) {
    const auto whole = static_cast<std::size_t>(tables.length), begun = whole - whole / kOverlap;
    const float* const from = tables.scratch;
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
    m_transform.Prepare(samples);
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
