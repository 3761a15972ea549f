#pragma once

#include <cstddef>
#include <xsimd/xsimd.hpp>

namespace Corvo {

namespace {

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

}  // namespace
}  // namespace Corvo
