#pragma once

#include <array>
#include <cstddef>
#include <vector>

#include "Platform/AlignedMemory.h"

// A low-pass of order 10 for a stream whose rate is raised by L, as a sum of five complex pole pairs:
//   H(z) = d + sum of 2 Re(r / (1 - p / z)).
// Between two samples there are only zeros, so once per sample a pair moves on by P = p^L. In real numbers,
// with u the pair's denominator run over the samples at their own rate and c its last change:
//   c = x + |P|^2 c - |1 - P|^2 u,  u = u + c
// (the change is kept instead of the value before, because P may be next to 1 and their difference would
// drown in rounding), and the output j steps after a sample is
//   d x [at j = 0] + sum of 2 Re(r p^j (1 - P*)) u + 2 Re(r p^j P*) c,
// computed for the output frames only.
struct PolePairLowPass {
    static constexpr std::size_t kPairs = 5;
    static constexpr std::size_t kLanes = 2;  // every number stands here twice: two channels at once

    // A row of factors: of the sample, -0.0, then of each pair's c and u. So a wide register holds a pair,
    // and all of them start at a multiple of its size.
    static constexpr std::size_t kRow = kLanes * (2 + 2 * kPairs);
    static constexpr std::size_t ChangeAt(std::size_t pair) { return kLanes * (2 + 2 * pair); }
    static constexpr std::size_t ValueAt(std::size_t pair) { return ChangeAt(pair) + kLanes; }

    // Per step j a row: L d (at step 0, else 0) and L times the pairs' factors.
    std::vector<double, Corvo::AlignedAllocator<double>> phases;
    // Per pair |P|^2 of c and |1 - P|^2 of u.
    alignas(16) std::array<double, kRow> advance{};

    double groupDelay;
    double gain;
    std::array<double, 2 * kPairs + 1> feedback;  // the denominator of the direct form, negated

    // Butterworth, `cutoff` as a fraction of the raised rate (below 0.5). Throws std::bad_alloc.
    PolePairLowPass(int upFactor, double cutoff);
};
