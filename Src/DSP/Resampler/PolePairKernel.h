#pragma once

#include <cstddef>

#include "DSP/Resampler/PolePairLowPass.h"

namespace PolePairs {

// The pole pairs after the newest sample, of two channels.
struct State {
    static constexpr std::size_t kPairs = PolePairLowPass::kPairs, kLanes = PolePairLowPass::kLanes;
    alignas(16) double value[kPairs][kLanes]{};
    double change[kPairs][kLanes]{};
    double sample[kLanes]{};
};

// What a run takes and gives, as frames of two channels, and where it stands: how many steps of the raised
// rate the next output lies behind the newest sample. With `up` or more there is a sample to be taken first.
struct Stream {
    const double* in;
    std::size_t frames;
    double* out;
    std::size_t room;
    std::ptrdiff_t up, down, step;  // in a register on every target
};

// Runs until either samples or room are used up; what is left stands in `stream`. A channel's results are the
// same whatever the other one holds.
using Kernel = void (*)(const PolePairLowPass& filter, State& state, Stream& stream);

// One for every processor, and one for those with AVX2. Both give the same bits.
void RunBaseline(const PolePairLowPass& filter, State& state, Stream& stream);
void RunAvx2(const PolePairLowPass& filter, State& state, Stream& stream);

namespace {

// What the kernels have in common. `Pairs` holds the state in registers.
template <typename Pairs>
void RunWith(const PolePairLowPass& filter, State& state, Stream& stream) {
    Pairs pairs(state, filter.advance.data());
    const double* const phases = filter.phases.data();
    Stream s = stream;
    constexpr auto kRow = static_cast<std::ptrdiff_t>(PolePairLowPass::kRow);
    for (;;) {
        for (; s.step + s.down < s.up && s.room > 1; s.room -= 2) {
            const double* const row = phases + s.step * kRow;
            pairs.TwoOutputs(row, row + s.down * kRow, s.out);
            s.step += 2 * s.down;
            s.out += 2 * State::kLanes;
        }
        for (; s.step < s.up && s.room > 0; --s.room) {
            pairs.Output(phases + s.step * kRow, s.out);
            s.step += s.down;
            s.out += State::kLanes;
        }
        if (s.step < s.up || s.frames == 0) break;
        s.step -= s.up;
        pairs.Take(s.in);
        s.in += State::kLanes;
        --s.frames;
    }
    pairs.To(state);
    stream = s;
}

}  // namespace
}  // namespace PolePairs
