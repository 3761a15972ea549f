#pragma once

#include <cmath>
#include <cstddef>
#include <cstdint>
#include <numbers>
#include <vector>

#include "Support/Signals.h"

// Sounds with a pitch, straight from their definitions.
namespace TunerSounds {

enum class Kind { Sine, Sawtooth, Plucked, MissingFundamental, Piano };

constexpr double kInharmonicity = 1e-4;

// One partial: f0 * n * stretch, at an amplitude that decays.
struct Partial {
    double ratio, amplitude, decayPerSecond;
};

// Of the partials those below 0.45 of the rate sound. A stretched series counts from its first partial.
inline std::vector<Partial> Partials(Kind kind, double f0, int rate) {
    std::vector<Partial> partials;
    const auto below = [&](double ratio) { return ratio * f0 < 0.45 * rate; };
    const auto stretch = [](int n) {
        return n * std::sqrt((1.0 + kInharmonicity * n * n) / (1.0 + kInharmonicity));
    };
    switch (kind) {
        case Kind::Sine:
            partials.push_back({1.0, 1.0, 0.0});
            break;
        case Kind::Sawtooth:
            for (int n = 1; below(n); ++n) partials.push_back({1.0 * n, 1.0 / n, 0.0});
            break;
        case Kind::Plucked:  // at a seventh of its length; high partials die first
            for (int n = 1; below(n) && n <= 40; ++n)
                partials.push_back({1.0 * n, std::sin(std::numbers::pi * n / 7.0) / n, 1.5 + 0.3 * n});
            break;
        case Kind::MissingFundamental:
            for (int n = 2; below(n) && n <= 60; ++n) partials.push_back({1.0 * n, 1.0, 0.0});
            break;
        case Kind::Piano:
            for (int n = 1; below(stretch(n)) && n <= 16; ++n)
                partials.push_back({stretch(n), std::pow(0.7, n), 0.5 * n});
            break;
    }
    return partials;
}

// `phase` (turns) is the first partial's; the others' follow in no simple ratio.
inline std::vector<float> Sound(Kind kind, double f0, int rate, std::size_t frames, double phase) {
    std::vector<double> sum(frames);
    double turn = phase;
    for (const Partial& partial : Partials(kind, f0, rate)) {
        const double step = 2.0 * std::numbers::pi * partial.ratio * f0 / rate;
        const double decay = std::exp(-partial.decayPerSecond / rate);
        // A rotating vector; in double it stays exact enough over some ten thousand samples.
        double re = partial.amplitude * std::cos(2.0 * std::numbers::pi * turn);
        double im = partial.amplitude * std::sin(2.0 * std::numbers::pi * turn);
        const double c = decay * std::cos(step), s = decay * std::sin(step);
        for (double& value : sum) {
            value += im;
            const double next = re * c - im * s;
            im = re * s + im * c;
            re = next;
        }
        turn += 0.382 + phase;
    }
    double largest = 0.0;
    for (const double value : sum) largest = std::max(largest, std::abs(value));
    std::vector<float> sound(frames);
    for (std::size_t i = 0; i < frames; ++i) sound[i] = static_cast<float>(0.5 * sum[i] / largest);
    return sound;
}

// Partials of the same amplitude; one that is named twice sounds twice as loud.
inline std::vector<float> Partials(const std::vector<int>& numbers, double hz, int rate, std::size_t frames) {
    std::vector<float> sum(frames);
    for (const int n : numbers) {
        const auto partial = TestSupport::Sine<float>(frames, n * hz, rate, 0.1);
        for (std::size_t i = 0; i < frames; ++i) sum[i] += partial[i];
    }
    return sum;
}

// Adds white noise this many decibels below the sound's own power.
inline void AddNoise(std::vector<float>& sound, double decibelsBelow, std::uint64_t seed) {
    double power = 0.0;
    for (const float value : sound) power += static_cast<double>(value) * value;
    power /= static_cast<double>(sound.size());
    // Uniform noise of amplitude a has the power a^2 / 3.
    const double amplitude = std::sqrt(3.0 * power * std::pow(10.0, -0.1 * decibelsBelow));
    const auto noise = TestSupport::Noise<float>(sound.size(), amplitude, seed);
    for (std::size_t i = 0; i < sound.size(); ++i) sound[i] += noise[i];
}

}  // namespace TunerSounds
