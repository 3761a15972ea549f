#pragma once

#include <array>
#include <cstddef>
#include <vector>

#include "Platform/AlignedMemory.h"

// A low-pass of order 10 for a stream whose rate is raised by L, as a sum of five complex pole pairs:
//   H(z) = d + sum of 2 Re(r / (1 - p / z)).
// Between two samples there are only zeros, so a pair's state v moves on by p^L once per sample and the
// output j steps after a sample is 2 Re(r p^j v), without any work for the steps that nobody reads.
struct PolePairLowPass {
    static constexpr std::size_t kPairs = 5;
    static constexpr std::size_t kLanes = 2;  // every number stands here twice: two channels at once

    // Per step j: L d (at step 0, else 0), then per pair the factors of the state's real and imaginary part.
    static constexpr std::size_t kPhaseStride = kLanes * (1 + 2 * kPairs);
    std::vector<double, Corvo::AlignedAllocator<double>> phases;
    // p^L, real and imaginary parts.
    alignas(16) std::array<double, kLanes * 2 * kPairs> advance;

    double groupDelay;
    double gain;
    std::array<double, 2 * kPairs + 1> feedback;  // the denominator of the direct form, negated

    // Butterworth, `cutoff` as a fraction of the raised rate (below 0.5). Throws std::bad_alloc.
    PolePairLowPass(int upFactor, double cutoff);
};
