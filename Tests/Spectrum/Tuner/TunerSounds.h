#pragma once

#include <algorithm>
#include <cmath>
#include <complex>
#include <cstddef>
#include <cstdint>
#include <numbers>
#include <vector>

#include "Support/Signals.h"

// Sounds with a pitch, straight from their definitions.
namespace TunerSounds {

enum class Kind { Sine, Sawtooth, MissingFundamental, Piano };

// Frequency of the n-th partial as a multiple of the first one's, and its amplitude. A piano's strings are
// stiff, and its high partials die first.
inline double Ratio(Kind kind, int n) {
    constexpr double kInharmonicity = 1e-4;
    return kind == Kind::Piano ? n * std::sqrt((1.0 + kInharmonicity * n * n) / (1.0 + kInharmonicity)) : n;
}
inline double Amplitude(Kind kind, int n) {
    if (kind == Kind::Sine) return n == 1;
    if (kind == Kind::Sawtooth) return 1.0 / n;
    return kind == Kind::Piano ? std::pow(0.7, n) : n > 1 && n <= 60;
}

// Of the partials those below 0.45 of the rate. `phase` (turns) is the first one's; the others' follow in no
// simple ratio.
inline std::vector<float> Sound(Kind kind, double f0, int rate, std::size_t frames, double phase) {
    std::vector<double> sum(frames);
    for (int n = 1; Ratio(kind, n) * f0 < 0.45 * rate; ++n, phase += 0.382) {
        if (Amplitude(kind, n) == 0.0) continue;
        const double decay = kind == Kind::Piano ? 0.5 * n / rate : 0.0;
        // A rotating vector stays exact enough over some ten thousand samples.
        const auto step = std::polar(std::exp(-decay), 2.0 * std::numbers::pi * Ratio(kind, n) * f0 / rate);
        auto vector = std::polar(Amplitude(kind, n), 2.0 * std::numbers::pi * std::fmod(phase, 1.0));
        for (double& value : sum) {
            value += vector.imag();
            vector *= step;
        }
    }
    double largest = 0.0;
    for (const double value : sum) largest = std::max(largest, std::abs(value));
    std::vector<float> sound(frames);
    for (std::size_t i = 0; i < frames; ++i) sound[i] = static_cast<float>(0.5 * sum[i] / largest);
    return sound;
}

using TestSupport::Mixed;

// Partials of the same amplitude; one that is named twice sounds twice as loud.
inline std::vector<float> Partials(const std::vector<int>& numbers, double hz, int rate, std::size_t frames) {
    std::vector<float> sum(frames);
    for (const int n : numbers) sum = Mixed(sum, TestSupport::Sine<float>(frames, n * hz, rate, 0.1));
    return sum;
}

// With white noise this many decibels below the sound's own power.
inline std::vector<float> WithNoise(const std::vector<float>& sound, double decibelsBelow,
                                    std::uint64_t seed) {
    const double level = TestSupport::Level(sound, 0.0, static_cast<double>(sound.size()), 1) - decibelsBelow;
    // Uniform noise of amplitude a has the power a^2 / 3.
    const double amplitude = std::sqrt(3.0 * std::pow(10.0, 0.1 * level));
    return Mixed(sound, TestSupport::Noise<float>(sound.size(), amplitude, seed));
}

}  // namespace TunerSounds
