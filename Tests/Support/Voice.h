#pragma once

#include <cmath>
#include <functional>
#include <numbers>
#include <vector>

#include "Support/Signals.h"

namespace TestSupport {

// A voice: harmonics of `hz` (of seconds; 0 is silence) under two resonances at 700 and 1100 Hz.
inline std::vector<double> Sing(double seconds, int rate, const std::function<double(double)>& hz) {
    std::vector<double> samples(static_cast<std::size_t>(seconds * rate));
    double phase = 0.0;
    for (std::size_t i = 0; i < samples.size(); ++i) {
        const double f = hz(static_cast<double>(i) / rate);
        phase += f / rate;
        for (int h = 1; f > 0.0 && h * f < std::min(0.45 * rate, 5000.0); ++h) {
            const double first = (h * f - 700.0) / 150.0, second = (h * f - 1100.0) / 200.0;
            const double level = 0.1 / h + 0.2 / (1.0 + first * first) + 0.1 / (1.0 + second * second);
            samples[i] += 0.3 * level * std::sin(2.0 * std::numbers::pi * h * phase + h * h);
        }
    }
    return samples;
}
inline std::vector<double> Sing(double seconds, int rate, double hz) {
    return Sing(seconds, rate, [hz](double) { return hz; });
}

inline double Cents(double hz, double reference) { return 1200.0 * std::log2(hz / reference); }

}  // namespace TestSupport
