#pragma once

#include <array>
#include <cmath>
#include <numbers>
#include <span>

namespace Corvo::DSP::Denoising {

// The inner values of a Hann window, without the zeros at its ends, as weights of a mean; 64 at most. Values
// more than `ahead` after the middle are 0.
inline void HannWeights(std::span<float> weights, std::size_t ahead) {
    std::array<double, 64> values;
    double sum = 0.0;
    const std::size_t last = weights.size() / 2 + ahead;
    const auto value = [&](std::size_t i) {
        return i > last ? 0.0
                        : 0.5 - 0.5 * std::cos(2.0 * std::numbers::pi * static_cast<double>(i + 1) /
                                               static_cast<double>(weights.size() + 1));
    };
    for (std::size_t i = 0; i < weights.size(); ++i) sum += values[i] = value(i);
    for (std::size_t i = 0; i < weights.size(); ++i) weights[i] = static_cast<float>(values[i] / sum);
}
inline void HannWeights(std::span<float> weights) { HannWeights(weights, weights.size()); }

}  // namespace Corvo::DSP::Denoising
