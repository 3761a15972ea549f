#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <span>

#include "DSP/Equalizer/EqBand.h"

namespace Corvo::DSP {

// The active bands of one channel, or of two neighbouring ones with the same bands active, and the samples
// they run over in place.
template <typename Sample>
struct EqCascade {
    Sample* samples;  // the (first) channel's first
    std::ptrdiff_t stride;
    int frames;
    int channels;  // 1 or 2
    int count = 0;
    std::array<std::array<EqBand*, builtin_effects_data::kMaxBands>, 2> bands{};  // [channel][0..count)
};

// Kernels for registers of one size; all give the same bits as the bands one after the other, each over the
// whole block. They run bands first .. first + count - 1.
template <typename Sample>
struct EqKernels {
    // Nothing glides.
    void (*settled)(const EqCascade<Sample>& cascade, int first, int count);
    // Every coefficient that moves takes a step per sample. Leaves the counter alone; gives the number of
    // coefficients that arrived.
    int (*gliding)(const EqCascade<Sample>& cascade, int first, int count);
};

template <typename Sample>
const EqKernels<Sample>& EqBaselineKernels();
template <typename Sample>
const EqKernels<Sample>& EqAvx2Kernels();  // for processors that have it

// Whether RunCascade takes the wide ones where it can. A test may turn them off.
bool& MayUseWideEqKernels();

// Runs the first `numBands` bands, as far as they are active, of one channel or of two neighbouring ones.
// `counter` counts the coefficients on the move; while it is 0 nothing moves.
template <typename Sample>
void RunCascade(Sample* samples, std::ptrdiff_t stride, int frames, std::span<EqBands* const> channels,
                int numBands, std::int32_t& counter);

// Whether two channels side by side come out as one after the other: they have the same bands active, and
// the first one's glides do not decide whether the second one's go on.
bool MayRunTogether(const EqBands& first, const EqBands& second, int numBands, std::int32_t counter);

}  // namespace Corvo::DSP
