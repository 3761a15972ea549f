#pragma once

#include <array>
#include <cstddef>

namespace Corvo::DSP {

// What the shaping of interleaved samples needs: the left side, then the right one. A stream of one channel
// gives the left side twice.
struct TubeShaping {
    static constexpr int kNoFunction = 4;

    struct Side {
        int function;  // 0..3; with kNoFunction samples are boosted only
        float boost, drive, shapeFactor;
    };
    std::array<Side, 2> sides;
};

// Shapes `count` interleaved samples in place.
template <typename Sample>
using TubeKernel = void (*)(Sample* samples, std::size_t count, const TubeShaping& shaping);

// One for every processor, and one for those with AVX2. Both give the same bits.
template <typename Sample>
TubeKernel<Sample> BaselineTubeKernel();
template <typename Sample>
TubeKernel<Sample> Avx2TubeKernel();

}  // namespace Corvo::DSP
