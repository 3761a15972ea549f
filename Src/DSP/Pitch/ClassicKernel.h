#pragma once

#include <cstddef>
#include <cstdint>

namespace Corvo::DSP::ClassicPitch {

// What the "Classic" back-end's bins go through, one by one. Arrays hold `bins` values.

// From a frame's windowed samples: each bin's strength, where the pitch takes it and its frequency there.
// Targets beyond the last bin are `bins`. A real value has the phase 0 or pi, so its change since the last
// frame is one of three, and the frequency comes from a table for each.
struct Analysis {
    const float* input;
    const double* window;
    const float *steady, *fell, *rose;  // frequencies: the sign is the same, became negative, positive
    float pitch;
    std::int32_t* last;  // the bits of the last frame's windowed samples
    float* strength;
    float* frequency;
    std::int32_t* target;
};

// Each bin's phase goes on by its frequency, and its cosine is added to the output. Wrapping the phase keeps
// the cosine exact for ever.
struct Synthesis {
    const float* magnitude;
    const float* frequency;
    const double* window;
    double binWidth, expectedPhase, oversampling, scale;
    double* phase;
    float* accumulator;
};

struct Kernels {
    void (*analyse)(const Analysis& analysis, std::size_t bins);
    void (*synthesise)(const Synthesis& synthesis, std::size_t bins);
};

// One for every processor, and one for those with AVX2. Both give the same bits.
const Kernels& BaselineKernels();
const Kernels& Avx2Kernels();

}  // namespace Corvo::DSP::ClassicPitch
