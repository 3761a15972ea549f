#pragma once

#include <cstddef>
#include <xsimd/xsimd.hpp>

// What the transform's stages ask of a group of neighbouring values. A group is a SIMD register or, for the
// shortest transforms, a plain float or double; each value goes through the same operations in either.
namespace Corvo::Fft {

namespace {

template <typename V>
struct Complex {
    V re, im;
    friend Complex operator+(const Complex& a, const Complex& b) { return {a.re + b.re, a.im + b.im}; }
    friend Complex operator-(const Complex& a, const Complex& b) { return {a.re - b.re, a.im - b.im}; }
    friend Complex operator*(const Complex& a, const Complex& b) {
        return {a.re * b.re - a.im * b.im, a.re * b.im + a.im * b.re};
    }
};

template <typename T>
struct Lanes {
    using Value = T;
    static constexpr std::size_t kWidth = 1;
    static T Load(const T* from) { return *from; }
    static void Store(T value, T* to) { *to = value; }
    static T Reverse(T value) { return value; }
    static Complex<T> LoadPairs(const T* from) { return {from[0], from[1]}; }
    static void StorePairs(const Complex<T>& value, T* to) {
        to[0] = value.re;
        to[1] = value.im;
    }
    // to[p * Rows + k] = rows[k][p]
    template <std::size_t Rows>
    static void StoreTransposed(const T (&rows)[Rows], T* to) {
        for (std::size_t k = 0; k < Rows; ++k) to[k] = rows[k];
    }
};

// What differs from one instruction set to the next. Zips and picks work inside each 16 bytes; a register
// wider than that is loaded and stored as sixteens that lie `distance` values apart.
template <typename T, typename Arch>
struct Shuffles;

template <>
struct Shuffles<float, xsimd::sse2> {
    using V = xsimd::batch<float, xsimd::sse2>;
    static V ZipLow(V a, V b) { return V(_mm_unpacklo_ps(a, b)); }
    static V ZipHigh(V a, V b) { return V(_mm_unpackhi_ps(a, b)); }
    static V PickEven(V a, V b) { return V(_mm_shuffle_ps(a, b, _MM_SHUFFLE(2, 0, 2, 0))); }
    static V PickOdd(V a, V b) { return V(_mm_shuffle_ps(a, b, _MM_SHUFFLE(3, 1, 3, 1))); }
    static V Reverse(V v) { return V(_mm_shuffle_ps(v, v, _MM_SHUFFLE(0, 1, 2, 3))); }
    static V LoadSixteens(const float* from, std::size_t) { return V(_mm_loadu_ps(from)); }
    static void StoreSixteens(V v, float* to, std::size_t) { _mm_storeu_ps(to, v); }
};

template <>
struct Shuffles<double, xsimd::sse2> {
    using V = xsimd::batch<double, xsimd::sse2>;
    static V ZipLow(V a, V b) { return V(_mm_unpacklo_pd(a, b)); }
    static V ZipHigh(V a, V b) { return V(_mm_unpackhi_pd(a, b)); }
    static V PickEven(V a, V b) { return ZipLow(a, b); }
    static V PickOdd(V a, V b) { return ZipHigh(a, b); }
    static V Reverse(V v) { return V(_mm_shuffle_pd(v, v, 1)); }
    static V LoadSixteens(const double* from, std::size_t) { return V(_mm_loadu_pd(from)); }
    static void StoreSixteens(V v, double* to, std::size_t) { _mm_storeu_pd(to, v); }
};

#if defined(__AVX2__)
template <>
struct Shuffles<float, xsimd::avx2> {
    using V = xsimd::batch<float, xsimd::avx2>;
    static V ZipLow(V a, V b) { return V(_mm256_unpacklo_ps(a, b)); }
    static V ZipHigh(V a, V b) { return V(_mm256_unpackhi_ps(a, b)); }
    static V PickEven(V a, V b) { return V(_mm256_shuffle_ps(a, b, _MM_SHUFFLE(2, 0, 2, 0))); }
    static V PickOdd(V a, V b) { return V(_mm256_shuffle_ps(a, b, _MM_SHUFFLE(3, 1, 3, 1))); }
    static V Reverse(V v) {
        const __m256 halves = _mm256_permute2f128_ps(v, v, 1);
        return V(_mm256_permute_ps(halves, _MM_SHUFFLE(0, 1, 2, 3)));
    }
    static V LoadSixteens(const float* from, std::size_t distance) {
        const __m256 low = _mm256_castps128_ps256(_mm_loadu_ps(from));
        return V(_mm256_insertf128_ps(low, _mm_loadu_ps(from + distance), 1));
    }
    static void StoreSixteens(V v, float* to, std::size_t distance) {
        _mm_storeu_ps(to, _mm256_castps256_ps128(v));
        _mm_storeu_ps(to + distance, _mm256_extractf128_ps(v, 1));
    }
};

template <>
struct Shuffles<double, xsimd::avx2> {
    using V = xsimd::batch<double, xsimd::avx2>;
    static V ZipLow(V a, V b) { return V(_mm256_unpacklo_pd(a, b)); }
    static V ZipHigh(V a, V b) { return V(_mm256_unpackhi_pd(a, b)); }
    static V PickEven(V a, V b) { return ZipLow(a, b); }
    static V PickOdd(V a, V b) { return ZipHigh(a, b); }
    static V Reverse(V v) { return V(_mm256_permute4x64_pd(v, _MM_SHUFFLE(0, 1, 2, 3))); }
    static V LoadSixteens(const double* from, std::size_t distance) {
        const __m256d low = _mm256_castpd128_pd256(_mm_loadu_pd(from));
        return V(_mm256_insertf128_pd(low, _mm_loadu_pd(from + distance), 1));
    }
    static void StoreSixteens(V v, double* to, std::size_t distance) {
        _mm_storeu_pd(to, _mm256_castpd256_pd128(v));
        _mm_storeu_pd(to + distance, _mm256_extractf128_pd(v, 1));
    }
};
#endif

template <typename T, typename Arch>
struct Lanes<xsimd::batch<T, Arch>> {
    using Value = T;
    using V = xsimd::batch<T, Arch>;
    using Shuffle = Shuffles<T, Arch>;
    static constexpr std::size_t kWidth = V::size;
    static constexpr std::size_t kSide = 16 / sizeof(T);
    static V Load(const T* from) { return V::load_unaligned(from); }
    static void Store(V value, T* to) { value.store_unaligned(to); }
    static V Reverse(V value) { return Shuffle::Reverse(value); }
    static Complex<V> LoadPairs(const T* from) {
        const V a = Shuffle::LoadSixteens(from, 2 * kSide);
        const V b = Shuffle::LoadSixteens(from + kSide, 2 * kSide);
        return {Shuffle::PickEven(a, b), Shuffle::PickOdd(a, b)};
    }
    static void StorePairs(const Complex<V>& value, T* to) {
        Shuffle::StoreSixteens(Shuffle::ZipLow(value.re, value.im), to, 2 * kSide);
        Shuffle::StoreSixteens(Shuffle::ZipHigh(value.re, value.im), to + kSide, 2 * kSide);
    }
    // Squares of 16 bytes a side are turned over in registers; each row of a square is one 16-byte store.
    template <std::size_t Rows>
    static void StoreTransposed(const V (&rows)[Rows], T* to) {
        for (std::size_t first = 0; first < Rows; first += kSide) {
            V square[kSide];
            for (std::size_t i = 0; i < kSide; ++i) square[i] = rows[first + i];
            for (std::size_t round = 1; round < kSide; round *= 2) {
                V zipped[kSide];
                for (std::size_t i = 0; i < kSide / 2; ++i) {
                    zipped[2 * i] = Shuffle::ZipLow(square[i], square[i + kSide / 2]);
                    zipped[2 * i + 1] = Shuffle::ZipHigh(square[i], square[i + kSide / 2]);
                }
                for (std::size_t i = 0; i < kSide; ++i) square[i] = zipped[i];
            }
            for (std::size_t p = 0; p < kSide; ++p)
                Shuffle::StoreSixteens(square[p], to + p * Rows + first, kSide * Rows);
        }
    }
};

}  // namespace
}  // namespace Corvo::Fft
