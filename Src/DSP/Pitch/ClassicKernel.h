#pragma once

#include <cstddef>
#include <cstdint>

namespace Corvo::DSP::ClassicPitch {

// What the "Classic" back-end's bins go through, one by one. Arrays hold `bins` values.

// From a frame's windowed samples: each bin's strength and what follows from its change of phase. A real
// value has the phase 0 or pi, so its change since the last frame is one of three, with a table for each.
template <typename Number>
struct Analysis {
    const float* input;
    const double* window;
    const Number *steady, *fell, *rose;  // the sign is the same, became negative, positive
    std::int32_t* last;                  // the bits of the last frame's windowed samples
    float* strength;
    Number* found;
};

// Where the pitch takes each bin. Beyond the last bin that is `bins`.
struct Placement {
    float pitch;
    std::int32_t* target;
};

// By how much the phase of bin `target` goes on in a frame, at a frequency times the pitch.
struct Advance {
    const float* frequency;
    const std::int32_t* target;
    float pitch;
    double binWidth, expectedPhase, oversampling;
    double* advance;
};

// Each bin's phase goes on, and its cosine is added to the output. Wrapping the phase keeps the cosine exact
// for ever.
struct Synthesis {
    float* level;  // the magnitudes; what the cosines make of them comes in their place
    const double *advance, *window;
    double scale;
    double* phase;
    float* accumulator;
};

struct Kernels {
    void (*analyse)(const Analysis<float>& analysis, std::size_t bins);
    void (*analyseStanding)(const Analysis<double>& analysis, std::size_t bins);
    void (*place)(const Placement& placement, std::size_t bins);
    void (*advance)(const Advance& advance, std::size_t bins);
    void (*synthesise)(const Synthesis& synthesis, std::size_t bins);
};

// One for every processor, and one for those with AVX2. Both give the same bits.
const Kernels& BaselineKernels();
const Kernels& Avx2Kernels();

}  // namespace Corvo::DSP::ClassicPitch
