#pragma once

#include <array>
#include <cmath>
#include <cstddef>

namespace Plain {

// One channel of the phaser as its definition reads: a library sine and stage after stage for every sample.
struct Phaser {
    static constexpr double kCycle = 6.283180236816406;
    double increment, minimum, maximum, feedback, wet, dry;
    std::size_t stages;
    double phase = 0.0, last = 0.0;
    std::array<double, 30> memories{};

    Phaser(int rate, float speed, float feedbackGain, float mix, double minHz, double maxHz,
           std::size_t count)
        : increment(static_cast<double>(speed) * 6 / rate * kCycle),
          minimum(minHz / (rate * 0.5)),
          maximum(maxHz / (rate * 0.5)),
          feedback(feedbackGain),
          stages(count) {
        const double level = 1.0 - static_cast<float>(2.0 * std::abs(mix - 0.5)) + 1.0;
        wet = level * mix;
        dry = level * (1.0 - mix);
    }

    template <typename Sample>
    void Run(Sample* samples, int frames, std::ptrdiff_t stride) {
        for (; frames > 0; --frames, samples += stride) {
            const auto w = static_cast<float>((std::sin(phase) + 1.0) * 0.5 * (maximum - minimum) + minimum);
            phase += increment;
            if (phase >= kCycle) phase -= kCycle;
            const double a = (1.0f - w) / (1.0f + w), x = *samples;
            double u = x + feedback * last;
            for (std::size_t i = 0; i < stages; ++i) {
                const double y = memories[i] - a * u;
                memories[i] = a * y + u;
                u = static_cast<Sample>(y);
            }
            last = u;
            *samples = static_cast<Sample>(u * wet + x * dry);
        }
    }
};

}  // namespace Plain
