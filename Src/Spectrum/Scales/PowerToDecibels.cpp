#include "Spectrum/Scales/PowerToDecibels.h"

#include <bit>
#include <cstdint>

namespace Corvo {

// With x = 2^e m and m between the square roots of 1/2 and 2, ln m = 2 atanh(s) for s = (m-1)/(m+1), whose
// series converges fast enough to stop at s^5. Written so that the compiler makes vectors of it.
void PowerToDecibels(const float* power, float* decibels, std::size_t count, float offset) {
    constexpr float kSmallest = 1e-30f;
    constexpr float kPerNeper = 4.34294482f;   // 10 / ln 10
    constexpr float kPerOctave = 3.01029996f;  // 10 log10 2
    constexpr std::int32_t kRootHalf = 0x3f3504f3, kMantissa = 0x007fffff;
    for (std::size_t k = 0; k < count; ++k) {
        const float x = power[k] > kSmallest ? power[k] : kSmallest;
        const std::int32_t above = std::bit_cast<std::int32_t>(x) - kRootHalf;
        const float e = static_cast<float>(above >> 23);
        const float m = std::bit_cast<float>((above & kMantissa) + kRootHalf);
        const float s = (m - 1.0f) / (m + 1.0f);
        const float s2 = s * s;
        const float atanh = s * (1.0f + s2 * (1.0f / 3.0f + s2 * (1.0f / 5.0f)));
        decibels[k] = kPerOctave * e + (2.0f * kPerNeper) * atanh + offset;
    }
}

}  // namespace Corvo
