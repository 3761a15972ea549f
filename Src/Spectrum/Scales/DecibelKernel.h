#pragma once

#include <cstddef>
#include <cstdint>
#include <xsimd/xsimd.hpp>

namespace Corvo {

// PowerToDecibels for every processor, and for those with AVX2. Both give the same bits.
void PowerToDecibelsBaseline(const float* power, float* decibels, std::size_t count, float offset);
void PowerToDecibelsAvx2(const float* power, float* decibels, std::size_t count, float offset);

namespace {

// Included by one source file per instruction set. With x = 2^e m and m between the square roots of 1/2 and
// 2, ln m = 2 atanh(s) for s = (m-1)/(m+1), whose series converges fast enough to stop at s^5.
template <typename Arch>
struct DecibelKernel {
    using Floats = xsimd::batch<float, Arch>;
    using Integers = xsimd::batch<std::int32_t, Arch>;

    static Floats TenLogarithms(const Floats& power) {
        constexpr float kSmallest = 1e-30f;
        constexpr float kPerNeper = 4.34294482f;   // 10 / ln 10
        constexpr float kPerOctave = 3.01029996f;  // 10 log10 2
        const Integers rootHalf(0x3f3504f3), mantissa(0x007fffff);
        const Floats one(1.0f);
        const Floats x = xsimd::max(power, Floats(kSmallest));  // the second one beside what is no number
        const Integers above = xsimd::bitwise_cast<Integers>(x) - rootHalf;
        const Floats e = xsimd::to_float(above >> 23);
        const Floats m = xsimd::bitwise_cast<Floats>((above & mantissa) + rootHalf);
        const Floats s = (m - one) / (m + one);
        const Floats s2 = s * s;
        const Floats atanh = s * (one + s2 * (Floats(1.0f / 3.0f) + s2 * Floats(1.0f / 5.0f)));
        return Floats(kPerOctave) * e + Floats(2.0f * kPerNeper) * atanh;
    }

    static void Run(const float* power, float* decibels, std::size_t count, float offset) {
        constexpr std::size_t kLanes = Floats::size;
        const Floats shift(offset);
        std::size_t k = 0;
        for (; k + kLanes <= count; k += kLanes)
            (TenLogarithms(Floats::load_unaligned(power + k)) + shift).store_unaligned(decibels + k);
        if (k == count) return;
        float rest[kLanes] = {};
        for (std::size_t i = k; i < count; ++i) rest[i - k] = power[i];
        (TenLogarithms(Floats::load_unaligned(rest)) + shift).store_unaligned(rest);
        for (std::size_t i = k; i < count; ++i) decibels[i] = rest[i - k];
    }
};

}  // namespace
}  // namespace Corvo
