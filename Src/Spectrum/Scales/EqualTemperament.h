#pragma once

#include <cmath>

// Equal temperament on A = 440 Hz, whatever the tuner is set to: what scales and readouts are marked with.
namespace Corvo {

constexpr double kConcertPitch = 440.0;
constexpr int kConcertSemitone = 69;  // counted from C-1

inline double SemitoneOf(double hz) { return 12.0 * std::log2(hz / kConcertPitch) + kConcertSemitone; }
inline double FrequencyOf(double semitone) {
    return kConcertPitch * std::exp2((semitone - kConcertSemitone) / 12.0);
}

}  // namespace Corvo
