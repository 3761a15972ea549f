#pragma once

#include <cstddef>

#include "DSP/Effects/Gain/GainKernel.h"
#include "Platform/Shuffles.h"

// The kernels for registers of one instruction set. Included by one source file per set, which is compiled
// for it; everything is local to that file, so that no copy is shared between instruction sets.
namespace Corvo::DSP::GainEfx {

namespace {

template <typename Sample, typename Arch>
struct KernelsFor {
    using Batch = xsimd::batch<Sample, Arch>;
    static constexpr std::size_t kLanes = Batch::size;

    // Of one frame, or of as many as a register has lanes.
    template <typename Value>
    struct Scale {
        Value side, mid, left, right;

        explicit Scale(const Coefficients<Sample>& c)
            : side(c.side), mid(c.mid), left(c.left), right(c.right) {}
        void operator()(Value& l, Value& r) const {
            const Value difference = (l - r) * side, sum = (l + r) * mid, half(Sample(0.5));
            l = (difference + sum) * half * left;
            r = (sum - difference) * half * right;
        }
    };

    // The channels of two registers are taken apart, whatever order of frames that leaves, and put together.
    static void Interleaved(Sample* samples, int frames, const Coefficients<Sample>& c) {
        using Shuffle = Shuffles<Sample, Arch>;
        const Scale<Batch> scale(c);
        const Scale<Sample> scaleOne(c);
        Sample* const end = samples + 2 * static_cast<std::ptrdiff_t>(frames);
        for (; end - samples >= static_cast<std::ptrdiff_t>(2 * kLanes); samples += 2 * kLanes) {
            const Batch a = Batch::load_unaligned(samples), b = Batch::load_unaligned(samples + kLanes);
            Batch l = Shuffle::PickEven(a, b), r = Shuffle::PickOdd(a, b);
            scale(l, r);
            Shuffle::ZipLow(l, r).store_unaligned(samples);
            Shuffle::ZipHigh(l, r).store_unaligned(samples + kLanes);
        }
        for (; samples != end; samples += 2) scaleOne(samples[0], samples[1]);
    }

    static void Planar(Sample* left, Sample* right, int frames, const Coefficients<Sample>& c) {
        const Scale<Batch> scale(c);
        const Scale<Sample> scaleOne(c);
        const auto count = static_cast<std::size_t>(frames);
        std::size_t i = 0;
        for (; i + kLanes <= count; i += kLanes) {
            Batch l = Batch::load_unaligned(left + i), r = Batch::load_unaligned(right + i);
            scale(l, r);
            l.store_unaligned(left + i);
            r.store_unaligned(right + i);
        }
        for (; i < count; ++i) scaleOne(left[i], right[i]);
    }

    static constexpr Kernels<Sample> kTable{Interleaved, Planar};
};

}  // namespace
}  // namespace Corvo::DSP::GainEfx
