#pragma once

#include "Spectrum/Fft/FftStages.h"

// Real transforms. N real values are N/2 complex points z, even values real, odd ones imaginary. With Z their
// transform and w = exp(-2 pi i / N), the bins of the real input are
//     X[k] = E + w^k O,    X[N/2 - k] = conj(E - w^k O),
//     E = (Z[k] + conj Z[N/2-k]) / 2,    O = (Z[k] - conj Z[N/2-k]) / 2i.
// Both passes go outside in over pairs of bins k and N/2 - k, a register of each at a time. They write where
// they do not read, so the last, shorter step simply starts early and does a few pairs twice.
namespace Corvo::Fft {

namespace {

// Calls step.operator()<V>(k) so that every pair k = 1 .. points/2 - 1 is covered.
template <typename V, typename Step>
void ForPairs(std::size_t points, Step step) {
    constexpr std::size_t kWidth = Lanes<V>::kWidth;
    const std::size_t half = points / 2;
    if (half > kWidth) {
        std::size_t k = 1;
        for (; k + kWidth < half; k += kWidth) step.template operator()<V>(k);
        step.template operator()<V>(half - kWidth);
    } else {
        for (std::size_t k = 1; k < half; ++k) step.template operator()<typename Lanes<V>::Value>(k);
    }
}

template <typename V>
Complex<V> Reversed(const Complex<V>& x) {
    return {Lanes<V>::Reverse(x.re), Lanes<V>::Reverse(x.im)};
}

// Split Z to the packed spectrum.
template <typename V, typename T>
void Pack(const Plan<T>& plan, SplitSource<T> z, T* packed) {
    const std::size_t points = plan.points, half = points / 2;
    packed[0] = z.re[0] + z.im[0];
    packed[1] = z.re[0] - z.im[0];
    if (points < 2) return;
    packed[points] = z.re[half];
    packed[points + 1] = -z.im[half];
    const SplitSource<T> twiddles{plan.packTwiddles, plan.packTwiddles + half};
    ForPairs<V>(points, [&]<typename L>(std::size_t k) {
        const std::size_t mirror = points - k - (Lanes<L>::kWidth - 1);
        const Complex<L> a = z.template Load<L>(k), b = Reversed(z.template Load<L>(mirror));
        const L scale(T(0.5));
        const Complex<L> even{(a.re + b.re) * scale, (a.im - b.im) * scale};
        const Complex<L> odd{(a.im + b.im) * scale, (b.re - a.re) * scale};
        const Complex<L> turned = odd * twiddles.template Load<L>(k);
        Lanes<L>::StorePairs(even + turned, packed + 2 * k);
        Lanes<L>::StorePairs(Reversed(Complex<L>{even.re - turned.re, turned.im - even.im}),
                             packed + 2 * mirror);
    });
}

// The packed spectrum to split 2 Z with real and imaginary parts swapped, as the inverse transform reads it.
template <typename V, typename T>
void Unpack(const Plan<T>& plan, const T* packed, SplitSink<T> swapped) {
    const std::size_t points = plan.points, half = points / 2;
    const SplitSink<T> z{swapped.im, swapped.re};
    z.re[0] = packed[0] + packed[1];
    z.im[0] = packed[0] - packed[1];
    if (points < 2) return;
    z.re[half] = 2 * packed[points];
    z.im[half] = -2 * packed[points + 1];
    const SplitSource<T> twiddles{plan.packTwiddles, plan.packTwiddles + half};
    ForPairs<V>(points, [&]<typename L>(std::size_t k) {
        const std::size_t mirror = points - k - (Lanes<L>::kWidth - 1);
        const Complex<L> a = Lanes<L>::LoadPairs(packed + 2 * k);
        const Complex<L> b = Reversed(Lanes<L>::LoadPairs(packed + 2 * mirror));
        const Complex<L> w = twiddles.template Load<L>(k);
        const Complex<L> even{a.re + b.re, a.im - b.im};
        const Complex<L> difference{a.re - b.re, a.im + b.im};
        const Complex<L> turned = difference * Complex<L>{w.re, -w.im};
        const Complex<L> odd{-turned.im, turned.re};
        z.template Store<L>(even + odd, k);
        z.template Store<L>(Reversed(Complex<L>{even.re - odd.re, odd.im - even.im}), mirror);
    });
}

}  // namespace
}  // namespace Corvo::Fft
