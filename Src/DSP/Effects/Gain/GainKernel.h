#pragma once

namespace Corvo::DSP::GainEfx {

// The gain effect's arithmetic on one stereo frame:
//   L' = ((L - R) * side + (L + R) * mid) * 0.5 * left,  R' = ((L + R) * mid - (L - R) * side) * 0.5 * right.
template <typename Sample>
struct Coefficients {
    Sample side, mid, left, right;
};

// Scales stereo blocks in place.
template <typename Sample>
struct Kernels {
    void (*interleaved)(Sample* samples, int frames, const Coefficients<Sample>& coefficients);
    void (*planar)(Sample* left, Sample* right, int frames, const Coefficients<Sample>& coefficients);
};

// One for every processor, and one for those with AVX2. Both give the same bits.
template <typename Sample>
const Kernels<Sample>& BaselineKernels();
template <typename Sample>
const Kernels<Sample>& Avx2Kernels();

}  // namespace Corvo::DSP::GainEfx
