#pragma once

#include <cstdint>

namespace Corvo::DSP {

// How a normalised parameter becomes the word that is stored: word = trunc(n * span + floor), in single
// precision because n arrives as a float. Truncated, never rounded: the words in saved projects were made
// that way.
struct FixedPoint {
    float span, floor;

    // n is limited to 0..1 first; NaN counts as 0.
    constexpr std::int32_t Word(float n) const {
        const float limited = n > 0.0f ? (n < 1.0f ? n : 1.0f) : 0.0f;
        return static_cast<std::int32_t>(limited * span + floor);
    }

    // Word(Normalised(w)) == w for every word in the range; words outside it give 0 or 1.
    constexpr float Normalised(std::int32_t word) const {
        const float n = (static_cast<float>(word) - floor) / span;
        if (!(n > 0.0f)) return 0.0f;
        if (n >= 1.0f) return 1.0f;
        if (Word(n) == word) return n;
        // The division rounded across the word's edge: aim for the middle of its interval.
        const float middle = (static_cast<float>(word) + (word < 0 ? -0.5f : 0.5f) - floor) / span;
        return middle < 1.0f ? middle : 1.0f;
    }
};

}  // namespace Corvo::DSP
