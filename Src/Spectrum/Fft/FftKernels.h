#pragma once

#include "Spectrum/Fft/FftPacking.h"

// The transforms for registers of one instruction set. Included by one source file per set, which is compiled
// for it; everything is local to that file, so that no copy is shared between instruction sets.
namespace Corvo::Fft {

namespace {

template <typename T, typename Arch>
struct KernelsFor {
    using V = xsimd::batch<T, Arch>;

    static void ComplexForward(const Plan<T>& plan, const T* in, T* out, T* work) {
        Last<V>(plan, AllButLast<V>(plan, PairSource<T>{in}, work), PairSink<T>{out});
    }
    static void ComplexInverse(const Plan<T>& plan, const T* in, T* out, T* work) {
        Last<V>(plan, AllButLast<V>(plan, PairSource<T, true>{in}, work),
                SwappedScaledSink<T>{out, plan.scale});
    }
    static void RealForward(const Plan<T>& plan, const T* in, T* packed, T* work) {
        if (plan.points == 0) {
            *packed = *in;
            return;
        }
        const SplitSink<T> z = AllButLast<V>(plan, PairSource<T>{in}, work);
        Last<V>(plan, z, z);
        Pack<V>(plan, SplitSource<T>{z.re, z.im}, packed);
    }
    static void RealInverse(const Plan<T>& plan, const T* packed, T* out, T* work) {
        if (plan.points == 0) {
            *out = *packed;
            return;
        }
        const SplitSink<T> z = SecondBuffer(plan, work);
        Unpack<V>(plan, packed, z);
        Last<V>(plan, AllButLast<V>(plan, SplitSource<T>{z.re, z.im}, work),
                SwappedScaledSink<T>{out, plan.scale});
    }

    static constexpr Kernels<T> kTable{ComplexForward, ComplexInverse, RealForward, RealInverse};
};

}  // namespace
}  // namespace Corvo::Fft
