#include "SampleCopies.h"

#include <bit>
#include <cmath>
#include <cstdint>
#include <limits>

namespace Corvo::Plugins {
namespace {

// The compiler makes vectors of these loops, of the width that the function around them may use.
#define DSP_IN_PLACE [[gnu::always_inline]] inline

DSP_IN_PLACE float Finite(float sample) {
    return std::abs(sample) <= std::numeric_limits<float>::max() ? sample : 0.0f;
}
DSP_IN_PLACE std::uint32_t Bits(float sample) { return std::bit_cast<std::uint32_t>(sample); }
// What is not finite has an exponent of ones only. Below 2 the exponent's highest bit is 0, so that the bits
// of usual samples laid over each other are never that; of others they may be.
DSP_IN_PLACE bool MayBeInfinite(std::uint32_t bits) { return (bits & 0x7f800000u) == 0x7f800000u; }

DSP_IN_PLACE void CopyLoop(const float* __restrict from, float* __restrict to, std::size_t count) {
    std::uint32_t all = 0;
    for (std::size_t i = 0; i < count; ++i) {
        to[i] = from[i];
        all |= Bits(from[i]);
    }
    for (std::size_t i = 0; i < count && MayBeInfinite(all); ++i) to[i] = Finite(from[i]);
}

DSP_IN_PLACE void CleanLoop(float* samples, std::size_t count) {
    using Words = std::uint32_t __attribute__((vector_size(32), aligned(4), may_alias));
    constexpr std::size_t kStep = 4 * sizeof(Words) / sizeof(float);
    Words a{}, b{}, c{}, d{};  // which do not wait for each other
    std::size_t done = 0;
    for (; done + kStep <= count; done += kStep) {
        const auto* const words = reinterpret_cast<const Words*>(samples + done);
        a |= words[0];
        b |= words[1];
        c |= words[2];
        d |= words[3];
    }
    a |= b | c | d;
    std::uint32_t all = a[0] | a[1] | a[2] | a[3] | a[4] | a[5] | a[6] | a[7];
    for (; done < count; ++done) all |= Bits(samples[done]);
    for (std::size_t i = 0; i < count && MayBeInfinite(all); ++i) samples[i] = Finite(samples[i]);
}

DSP_IN_PLACE void InterleaveLoop(const float* __restrict left, const float* __restrict right,
                                 float* __restrict both, std::size_t frames) {
    std::uint32_t all = 0;
    for (std::size_t i = 0; i < frames; ++i) {
        both[2 * i] = left[i];
        both[2 * i + 1] = right[i];
        all |= Bits(left[i]) | Bits(right[i]);
    }
    for (std::size_t i = 0; i < 2 * frames && MayBeInfinite(all); ++i) both[i] = Finite(both[i]);
}

DSP_IN_PLACE void SeparateLoop(const float* __restrict both, float* __restrict left, float* __restrict right,
                               std::size_t frames) {
    std::uint32_t all = 0;
    for (std::size_t i = 0; i < frames; ++i) {
        left[i] = both[2 * i];
        right[i] = both[2 * i + 1];
        all |= Bits(both[2 * i]) | Bits(both[2 * i + 1]);
    }
    for (std::size_t i = 0; i < frames && MayBeInfinite(all); ++i) {
        left[i] = Finite(left[i]);
        right[i] = Finite(right[i]);
    }
}
#undef DSP_IN_PLACE

struct Kernels {
    void (*copy)(const float*, float*, std::size_t) = CopyLoop;
    void (*clean)(float*, std::size_t) = CleanLoop;
    void (*interleave)(const float*, const float*, float*, std::size_t) = InterleaveLoop;
    void (*separate)(const float*, float*, float*, std::size_t) = SeparateLoop;
};

#define DSP_WIDE __attribute__((target("avx2")))
DSP_WIDE void WideCopy(const float* from, float* to, std::size_t count) { CopyLoop(from, to, count); }
DSP_WIDE void WideClean(float* samples, std::size_t count) { CleanLoop(samples, count); }
DSP_WIDE void WideInterleave(const float* left, const float* right, float* both, std::size_t frames) {
    InterleaveLoop(left, right, both, frames);
}
DSP_WIDE void WideSeparate(const float* both, float* left, float* right, std::size_t frames) {
    SeparateLoop(both, left, right, frames);
}
#undef DSP_WIDE
// Wide registers slow down all SSE code of a 32-bit program.
const Kernels kKernels = sizeof(void*) == 8 && __builtin_cpu_supports("avx2")
                             ? Kernels{WideCopy, WideClean, WideInterleave, WideSeparate}
                             : Kernels{};

}  // namespace

void CopyFinite(const float* from, float* to, std::size_t count) {
    if (from == to)
        kKernels.clean(to, count);
    else
        kKernels.copy(from, to, count);
}
void Interleave(const float* left, const float* right, float* both, std::size_t frames) {
    kKernels.interleave(left, right, both, frames);
}
void Separate(const float* both, float* left, float* right, std::size_t frames) {
    kKernels.separate(both, left, right, frames);
}

}  // namespace Corvo::Plugins
