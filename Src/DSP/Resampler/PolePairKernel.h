#pragma once

#include <array>
#include <cstddef>
#include <xsimd/xsimd.hpp>

#include "DSP/Resampler/PolePairLowPass.h"

namespace PolePairs {

// Two channels at once. Each lane's result is the same whatever the other one holds.
using Lanes = xsimd::batch<double, xsimd::sse2>;
static_assert(Lanes::size == PolePairLowPass::kLanes);
constexpr std::size_t kPairs = PolePairLowPass::kPairs;

inline Lanes Load(const double* twice) { return Lanes::load_aligned(twice); }

// The pole pairs' states after the newest sample.
struct State {
    std::array<Lanes, kPairs> value, change;

    static State From(const double (&stored)[2 * kPairs][PolePairLowPass::kLanes]) {
        State state;
        for (std::size_t k = 0; k < kPairs; ++k) {
            state.value[k] = Lanes::load_unaligned(stored[2 * k]);
            state.change[k] = Lanes::load_unaligned(stored[2 * k + 1]);
        }
        return state;
    }
    void To(double (&stored)[2 * kPairs][PolePairLowPass::kLanes]) const {
        for (std::size_t k = 0; k < kPairs; ++k) {
            value[k].store_unaligned(stored[2 * k]);
            change[k].store_unaligned(stored[2 * k + 1]);
        }
    }

    // Over the zeros behind the last sample to the next one.
    void Take(const double* advance, Lanes sample) {
        for (std::size_t k = 0; k < kPairs; ++k, advance += 2 * PolePairLowPass::kLanes) {
            change[k] =
                sample + change[k] * Load(advance + PolePairLowPass::kLanes) - value[k] * Load(advance);
            value[k] += change[k];
        }
    }

    // The output at the step that `row` of the phase table stands for, times L. `sample` is the newest.
    Lanes Output(const double* row, Lanes sample) const {
        constexpr std::size_t kStep = PolePairLowPass::kLanes;
        Lanes even = sample * Load(row), odd = value[0] * Load(row + kStep);
        row += 2 * kStep;
        for (std::size_t k = 0; k < kPairs; ++k, row += 2 * kStep) {
            even += change[k] * Load(row);
            if (k + 1 < kPairs) odd += value[k + 1] * Load(row + kStep);
        }
        return even + odd;
    }
};

}  // namespace PolePairs
