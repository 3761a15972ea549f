#pragma once

#include <utility>

#include "Spectrum/Fft/FftLanes.h"
#include "Spectrum/Fft/FftPlan.h"

// The complex transform. Every stage reads one buffer and writes another so that the results end up in
// natural order without a separate reordering pass: with `n` the length still to be split, `stride` the
// number of transforms already interleaved and R the radix, it takes the points
//     x[q + stride * (p + n/R * k)],  k < R,    to    y[q + stride * (R * p + k)].
// The first stage (stride 1) has its lanes over p, the others over q.
namespace Corvo::Fft {

namespace {

// Where the first stage reads and the last one writes. Swapping real and imaginary parts on both ends turns
// the forward transform into the inverse one.
template <typename T, bool Swapped = false>
struct PairSource {
    const T* data;
    template <typename V>
    Complex<V> Load(std::size_t i) const {
        const Complex<V> x = Lanes<V>::LoadPairs(data + 2 * i);
        if constexpr (Swapped) return {x.im, x.re};
        return x;
    }
};

template <typename T>
struct SplitSource {
    const T *re, *im;
    template <typename V>
    Complex<V> Load(std::size_t i) const {
        return {Lanes<V>::Load(re + i), Lanes<V>::Load(im + i)};
    }
    template <typename V>
    Complex<V> LoadAligned(std::size_t i) const {
        return {Lanes<V>::LoadAligned(re + i), Lanes<V>::LoadAligned(im + i)};
    }
};

template <typename T>
struct PairSink {
    T* data;
    template <typename V>
    void Store(const Complex<V>& x, std::size_t i) const {
        Lanes<V>::StorePairs(x, data + 2 * i);
    }
};

template <typename T>
struct SwappedScaledSink {
    T* data;
    T scale;
    template <typename V>
    void Store(const Complex<V>& x, std::size_t i) const {
        Lanes<V>::StorePairs({x.im * V(scale), x.re * V(scale)}, data + 2 * i);
    }
};

template <typename T>
struct SplitSink {
    T *re, *im;
    template <typename V>
    void Store(const Complex<V>& x, std::size_t i) const {
        Lanes<V>::Store(x.re, re + i);
        Lanes<V>::Store(x.im, im + i);
    }
};

template <typename T>
SplitSink<T> FirstBuffer(const Plan<T>& plan, T* work) {
    return {work, work + plan.points + kWorkGap};
}
template <typename T>
SplitSink<T> SecondBuffer(const Plan<T>& plan, T* work) {
    return FirstBuffer(plan, work + 2 * (plan.points + kWorkGap));
}

template <typename V>
Complex<V> TimesMinusI(const Complex<V>& x) {
    return {x.im, -x.re};
}

// Discrete Fourier transforms of 1, 2, 4 and 8 points in place. A call would send all points through memory.
template <typename V>
[[gnu::always_inline]] inline void Butterfly(Complex<V> (&)[1]) {}

template <typename V>
[[gnu::always_inline]] inline void Butterfly(Complex<V> (&x)[2]) {
    const Complex<V> sum = x[0] + x[1];
    x[1] = x[0] - x[1];
    x[0] = sum;
}

template <typename V>
[[gnu::always_inline]] inline void Butterfly(Complex<V> (&x)[4]) {
    const Complex<V> sum02 = x[0] + x[2], difference02 = x[0] - x[2];
    const Complex<V> sum13 = x[1] + x[3], turned13 = TimesMinusI(x[1] - x[3]);
    x[0] = sum02 + sum13;
    x[1] = difference02 + turned13;
    x[2] = sum02 - sum13;
    x[3] = difference02 - turned13;
}

// A transform of R points in halves, as a 32-bit program has registers for no more than one: the outputs with
// even numbers come from the sums of points that lie half of them apart, the others from the differences.
template <typename V, std::size_t R, typename Sum, typename Put>
[[gnu::always_inline]] inline void EvenOutputs(Sum sum, Put put) {
    Complex<V> x[R / 2];
    for (std::size_t k = 0; k < R / 2; ++k) x[k] = sum(k);
    Butterfly(x);
    for (std::size_t k = 0; k < R / 2; ++k) put(x[k], 2 * k);
}

template <typename V, std::size_t R, typename Difference, typename Put>
[[gnu::always_inline]] inline void OddOutputs(Difference difference, Put put) {
    if constexpr (R == 2) {
        put(difference(0), 1);
    } else if constexpr (R == 4) {
        Complex<V> x[2] = {difference(0), TimesMinusI(difference(1))};
        Butterfly(x);
        put(x[0], 1);
        put(x[1], 3);
    } else {
        const V half(static_cast<typename Lanes<V>::Value>(0.70710678118654752440));
        Complex<V> even[2] = {difference(0), TimesMinusI(difference(2))};
        Complex<V> odd[2] = {difference(1), TimesMinusI(difference(3))};
        Butterfly(even);
        Butterfly(odd);
        odd[0] = {(odd[0].re + odd[0].im) * half, (odd[0].im - odd[0].re) * half};
        put(even[0] + odd[0], 1);
        put(even[0] - odd[0], 5);
        odd[1] = {(odd[1].im - odd[1].re) * half, (odd[1].re + odd[1].im) * -half};
        put(even[1] + odd[1], 3);
        put(even[1] - odd[1], 7);
    }
}

// All points are read before the first output is put.
template <typename V, std::size_t R, typename At, typename Put>
[[gnu::always_inline]] inline void Outputs(At at, Put put) {
    if constexpr (R == 1) {
        put(at(0), 0);
    } else {
        Complex<V> differences[R / 2];
        EvenOutputs<V, R>(
            [&](std::size_t k) {
                const Complex<V> a = at(k), b = at(k + R / 2);
                differences[k] = a - b;
                return a + b;
            },
            put);
        OddOutputs<V, R>([&](std::size_t k) { return differences[k]; }, put);
    }
}

template <typename V, std::size_t R, typename T, typename Source>
void FirstStage(const Plan<T>& plan, Source source, SplitSink<T> to) {
    const std::size_t columns = plan.points / R;
    const std::size_t group = columns < kFirstGroup ? columns : kFirstGroup;
    const T* twiddles = plan.firstTwiddles;
    for (std::size_t first = 0; first < columns; first += group, twiddles += 2 * group * (R - 1))
        for (std::size_t i = 0; i < group; i += Lanes<V>::kWidth) {
            const std::size_t p = first + i;
            V re[R], im[R];
            const auto put = [&](Complex<V> x, std::size_t k) {
                if (k > 0) {
                    const T* const w = twiddles + 2 * group * (k - 1) + i;
                    x = x * Complex<V>{Lanes<V>::LoadAligned(w), Lanes<V>::LoadAligned(w + group)};
                }
                re[k] = x.re;
                im[k] = x.im;
            };
            Outputs<V, R>([&](std::size_t k) { return source.template Load<V>(p + columns * k); }, put);
            Lanes<V>::StoreTransposed(re, to.re + R * p);
            Lanes<V>::StoreTransposed(im, to.im + R * p);
        }
}

template <typename V, typename T>
void MiddleStage(std::size_t points, std::size_t stride, const T* twiddles, SplitSource<T> from,
                 SplitSink<T> to) {
    const std::size_t quarter = points / 4;
    for (std::size_t start = 0; start < quarter; start += stride, twiddles += 6) {
        const Complex<V> w[3] = {{V(twiddles[0]), V(twiddles[1])},
                                 {V(twiddles[2]), V(twiddles[3])},
                                 {V(twiddles[4]), V(twiddles[5])}};
        for (std::size_t q = 0; q < stride; q += Lanes<V>::kWidth) {
            const auto at = [&](std::size_t k) {
                return from.template LoadAligned<V>(start + q + quarter * k);
            };
            const auto put = [&](const Complex<V>& x, std::size_t k) {
                to.template Store<V>(k > 0 ? x * w[k - 1] : x, 4 * start + stride * k + q);
            };
            // Reading the points once more costs less than keeping them.
            EvenOutputs<V, 4>([&](std::size_t k) { return at(k) + at(k + 2); }, put);
            OddOutputs<V, 4>([&](std::size_t k) { return at(k) - at(k + 2); }, put);
        }
    }
}

template <typename V, std::size_t R, typename T, typename Sink>
void LastStage(std::size_t points, SplitSource<T> from, Sink sink) {
    const std::size_t stride = points / R;
    for (std::size_t q = 0; q < stride; q += Lanes<V>::kWidth)
        Outputs<V, R>([&](std::size_t k) { return from.template LoadAligned<V>(q + stride * k); },
                      [&](const Complex<V>& x, std::size_t k) { sink.template Store<V>(x, q + stride * k); });
}

// Every stage but the last. `source` may be the second buffer of `work`; returns the buffer that holds the
// points.
template <typename V, typename T, typename Source>
SplitSink<T> AllButLast(const Plan<T>& plan, Source source, T* work) {
    const std::size_t points = plan.points;
    SplitSink<T> to = FirstBuffer(plan, work), other = SecondBuffer(plan, work);
    switch (plan.firstRadix) {
        case 1:
            FirstStage<T, 1>(plan, source, to);
            break;
        case 2:
            FirstStage<T, 2>(plan, source, to);
            break;
        case 4:
            FirstStage<T, 4>(plan, source, to);
            break;
        default:
            if (points / 8 >= Lanes<V>::kWidth)
                FirstStage<V, 8>(plan, source, to);
            else
                FirstStage<T, 8>(plan, source, to);
    }
    const T* twiddles = plan.middleTwiddles;
    for (std::size_t stride = plan.firstRadix; stride * plan.lastRadix < points; stride *= 4) {
        MiddleStage<V>(points, stride, twiddles, SplitSource<T>{to.re, to.im}, other);
        twiddles += 6 * (points / stride / 4);
        std::swap(to, other);
    }
    return to;
}

// `sink` may write over `from`.
template <typename V, typename T, typename Sink>
void Last(const Plan<T>& plan, SplitSink<T> from, Sink sink) {
    const auto run = [&]<std::size_t R>() {
        if (plan.points / R >= Lanes<V>::kWidth)
            LastStage<V, R>(plan.points, SplitSource<T>{from.re, from.im}, sink);
        else
            LastStage<T, R>(plan.points, SplitSource<T>{from.re, from.im}, sink);
    };
    switch (plan.lastRadix) {
        case 1:
            run.template operator()<1>();
            break;
        case 2:
            run.template operator()<2>();
            break;
        case 4:
            run.template operator()<4>();
            break;
        default:
            run.template operator()<8>();
    }
}

}  // namespace
}  // namespace Corvo::Fft
