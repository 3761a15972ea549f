#pragma once

#include <algorithm>
#include <cmath>
#include <numbers>
#include <vector>

#include "Plain/ButterworthReference.h"

namespace Plain {

// The tube distortion's shaping of one sample, step by step.
inline double TubeShape(int function, double x, double drive) {
    const auto clamp = [](double v) { return std::clamp(v, -1.0, 1.0); };
    if (drive == 0.0) return x;
    switch (function) {
        case 0: {
            const double s = static_cast<float>(std::sin((drive + 0.0099) * std::numbers::pi / 2));
            const double k = 2 * s / (1 - s);
            x = clamp(x);
            return (k + 1) * x / (k * std::abs(x) + 1);
        }
        case 1: {
            x = clamp((5 * drive + 1) * x);
            return x < 0 ? -(2 * -x - x * x) : 2 * x - x * x;
        }
        case 2: {
            x = clamp(6 * x);
            if (x > 0.320018) return 0.630035;
            if (x > -0.08905) return 3.9375 * x - 6.153 * x * x;
            const double t = -x - 0.032847;
            return -0.75 * (1 - std::pow(1 - t, 12) + t / 3) + 0.01;
        }
        default: {
            x = clamp(x);
            const int times = drive < 0.25 ? 0 : drive < 0.5 ? 1 : drive < 0.75 ? 2 : 3;
            for (int i = 0; i < times; ++i) x = x * (1.5 - 0.5 * x * x);
            return x;
        }
    }
}

// One channel through boost, function and oversampling.
inline std::vector<double> Tube(const std::vector<double>& input, double boost, int function, double drive,
                                int factor) {
    auto samples = factor == 1 ? input : Convert(input, factor, 1);
    for (double& sample : samples) sample = TubeShape(function, sample * boost, drive);
    return factor == 1 ? samples : Convert(samples, 1, factor);
}

}  // namespace Plain
