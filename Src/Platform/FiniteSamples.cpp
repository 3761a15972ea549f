#include "Platform/FiniteSamples.h"

#include <immintrin.h>

#include <cstdint>
#include <cstring>

#include "Platform/Processor.h"

namespace Corvo {
namespace {

// A sample is not finite when all bits of its exponent are set. These stand in its upper 32-bit word, or in
// its only one.
template <typename Sample>
struct Exponent {
    static constexpr std::size_t kWords = sizeof(Sample) / 4;
    static constexpr std::uint32_t kBits = kWords == 1 ? 0x7F800000u : 0x7FF00000u;
    static constexpr int kUpperWords = kWords == 1 ? 0xFF : 0xAA;  // of a register
};

template <typename Sample>
bool RestIsFinite(const Sample* samples, std::size_t count) {
    bool finite = true;
    for (std::size_t i = 0; i < count; ++i) {
        Sample sample;
        std::memcpy(&sample, samples + i, sizeof(sample));
        finite &= std::isfinite(sample);
    }
    return finite;
}

template <typename Sample>
bool Baseline(const Sample* samples, std::size_t count) {
    constexpr std::size_t kLanes = 16 / sizeof(Sample);
    const __m128i bits = _mm_set1_epi32(static_cast<int>(Exponent<Sample>::kBits));
    __m128i found = _mm_setzero_si128();
    std::size_t i = 0;
    for (; i + kLanes <= count; i += kLanes) {
        const __m128i words = _mm_loadu_si128(reinterpret_cast<const __m128i*>(samples + i));
        found = _mm_or_si128(found, _mm_cmpeq_epi32(_mm_and_si128(words, bits), bits));
    }
    return (_mm_movemask_ps(_mm_castsi128_ps(found)) & Exponent<Sample>::kUpperWords) == 0 &&
           RestIsFinite(samples + i, count - i);
}

// True when no sample in whole registers reaches 2, as usual: then the highest bit of all exponents is 0, and
// the bits over each other show it. Takes two thirds of the exact look's time.
template <typename Sample>
[[gnu::target("avx2")]] bool AllBelowTwo(const Sample* samples, std::size_t count) {
    constexpr std::size_t kLanes = 32 / sizeof(Sample);
    const auto* from = reinterpret_cast<const __m256i*>(samples);
    __m256i bits[4] = {_mm256_setzero_si256(), _mm256_setzero_si256(), _mm256_setzero_si256(),
                       _mm256_setzero_si256()};
    std::size_t left = count;
    for (; left >= 4 * kLanes; left -= 4 * kLanes, from += 4)
        for (int k = 0; k < 4; ++k) bits[k] = _mm256_or_si256(bits[k], _mm256_loadu_si256(from + k));
    for (; left >= kLanes; left -= kLanes, ++from)
        bits[0] = _mm256_or_si256(bits[0], _mm256_loadu_si256(from));
    const __m256i all = _mm256_or_si256(_mm256_or_si256(bits[0], bits[1]), _mm256_or_si256(bits[2], bits[3]));
    // The exponent's highest bit becomes the sign.
    const __m256i highest = _mm256_slli_epi32(all, 1);
    return (_mm256_movemask_ps(_mm256_castsi256_ps(highest)) & Exponent<Sample>::kUpperWords) == 0;
}

template <typename Sample>
[[gnu::target("avx2")]] bool Wide(const Sample* samples, std::size_t count) {
    constexpr std::size_t kLanes = 32 / sizeof(Sample);
    if (AllBelowTwo(samples, count)) {
        const std::size_t rest = count % kLanes;
        return RestIsFinite(samples + (count - rest), rest);
    }
    const auto* from = reinterpret_cast<const __m256i*>(samples);
    // Doubling shifts the sign out of a word. Then a sample is not finite where a word reaches the exponent's
    // bits, shifted as well: the largest words tell whether any does.
    __m256i most[4] = {_mm256_setzero_si256(), _mm256_setzero_si256(), _mm256_setzero_si256(),
                       _mm256_setzero_si256()};
    std::size_t left = count;
    for (; left >= 4 * kLanes; left -= 4 * kLanes, from += 4)
        for (int k = 0; k < 4; ++k) {
            const __m256i words = _mm256_loadu_si256(from + k);
            most[k] = _mm256_max_epu32(most[k], _mm256_add_epi32(words, words));
        }
    for (; left >= kLanes; left -= kLanes, ++from) {
        const __m256i words = _mm256_loadu_si256(from);
        most[0] = _mm256_max_epu32(most[0], _mm256_add_epi32(words, words));
    }
    const __m256i top =
        _mm256_max_epu32(_mm256_max_epu32(most[0], most[1]), _mm256_max_epu32(most[2], most[3]));
    const __m256i bound = _mm256_set1_epi32(static_cast<int>(2 * Exponent<Sample>::kBits));
    const __m256i reached = _mm256_cmpeq_epi32(_mm256_max_epu32(top, bound), top);
    return (_mm256_movemask_ps(_mm256_castsi256_ps(reached)) & Exponent<Sample>::kUpperWords) == 0 &&
           RestIsFinite(samples + (count - left), left);
}

}  // namespace

bool AllFiniteBaseline(const float* samples, std::size_t count) { return Baseline(samples, count); }
bool AllFiniteBaseline(const double* samples, std::size_t count) { return Baseline(samples, count); }
bool AllFiniteAvx2(const float* samples, std::size_t count) { return Wide(samples, count); }
bool AllFiniteAvx2(const double* samples, std::size_t count) { return Wide(samples, count); }

bool AllFinite(const float* samples, std::size_t count) {
    return HasAvx2() ? Wide(samples, count) : Baseline(samples, count);
}
bool AllFinite(const double* samples, std::size_t count) {
    return HasAvx2() ? Wide(samples, count) : Baseline(samples, count);
}

}  // namespace Corvo
