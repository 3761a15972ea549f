#pragma once

#include <xsimd/xsimd.hpp>

// What the equaliser's kernels ask of a register of doubles, for each instruction set. Private to each source
// file that includes it: those files are compiled for different processors and must not share code.
namespace Corvo::DSP {
namespace {

template <typename Arch>
struct EqLanes;

template <>
struct EqLanes<xsimd::sse2> {
    using V = xsimd::batch<double, xsimd::sse2>;

    // The lanes move up by `Channels`; those that become free at the bottom come from the top of `before`.
    template <int Channels>
    static V MovedUp(V before, V v) {
        if constexpr (Channels == 2) return before;
        return V(_mm_shuffle_pd(before, v, 1));
    }
    // The frame in every group of `Channels` lanes.
    template <int Channels>
    static V Load(const double* frame) {
        return V(Channels == 2 ? _mm_loadu_pd(frame) : _mm_set1_pd(*frame));
    }
    template <int Channels>
    static V Load(const float* frame) {
        if constexpr (Channels == 1) return V(_mm_set1_pd(*frame));
        return V(_mm_cvtps_pd(_mm_castsi128_ps(_mm_loadl_epi64(reinterpret_cast<const __m128i*>(frame)))));
    }
    // `Channels` lanes from lane `lane` on.
    template <int Channels>
    static void Store(__m128d v, int lane, double* frame) {
        if constexpr (Channels == 2)
            _mm_storeu_pd(frame, v);
        else
            _mm_store_sd(frame, lane ? _mm_unpackhi_pd(v, v) : v);
    }
    template <int Channels>
    static void Store(__m128d v, int lane, float* frame) {
        if constexpr (Channels == 2)
            _mm_storel_pi(reinterpret_cast<__m64*>(frame), _mm_cvtpd_ps(v));
        else
            _mm_store_ss(frame, _mm_cvtpd_ps(lane ? _mm_unpackhi_pd(v, v) : v));
    }
    static V Rounded(V v, const double*) { return v; }
    static V Rounded(V v, const float*) { return V(_mm_cvtps_pd(_mm_cvtpd_ps(v))); }
};

#if defined(__AVX2__)
template <>
struct EqLanes<xsimd::avx2> {
    using V = xsimd::batch<double, xsimd::avx2>;
    using Half = EqLanes<xsimd::sse2>;

    template <int Channels>
    static V MovedUp(V before, V v) {
        const __m256d byTwo = _mm256_permute2f128_pd(before, v, 0x21);
        if constexpr (Channels == 2) return V(byTwo);
        return V(_mm256_shuffle_pd(byTwo, v, 0b0101));
    }
    template <int Channels, typename Sample>
    static V Load(const Sample* frame) {
        const __m128d half = Half::Load<Channels>(frame);
        return V(_mm256_set_m128d(half, half));
    }
    template <int Channels, typename Sample>
    static void Store(V v, int lane, Sample* frame) {
        const __m128d half = lane & 2 ? _mm256_extractf128_pd(v, 1) : _mm256_castpd256_pd128(v);
        Half::Store<Channels>(half, lane & 1, frame);
    }
    static V Rounded(V v, const double*) { return v; }
    static V Rounded(V v, const float*) { return V(_mm256_cvtps_pd(_mm256_cvtpd_ps(v))); }
};
#endif

}  // namespace
}  // namespace Corvo::DSP
