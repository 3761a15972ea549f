#pragma once

#include <array>
#include <cmath>
#include <cstddef>

#include "DSP/Parts/SineOscillator.h"

namespace Corvo::DSP {

// One channel's chain and sweep.
struct PhaserImpl {
    static constexpr int kMaxStages = 30;
    // A little short of 2 pi: the cycle by which the sweep is timed and wrapped.
    static constexpr double kCycle = 6.283180236816406;

    SineOscillator oscillator;
    double minimum = 0.0, maximum = 0.0;  // of the sweep, as fractions of half the sample rate
    double feedback = 0.0, wet = 0.0, dry = 0.0;
    int stages = 0;
    std::array<double, kMaxStages> memories{};
    double last = 0.0;  // the chain's last output
    int uncertain = 0;  // how many pieces more are rounded the slow way

    void Clear() {
        memories.fill(0.0);
        last = 0.0;
    }
    // With a feedback of 100 % the chain can overflow, and would stay so. Whatever the stage, that shows at
    // the end of the chain within a frame. Without stages it may hold a number from a block of doubles that
    // is none for floats.
    template <typename Sample>
    void ClearUnlessFinite() {
        if (!std::isfinite(static_cast<Sample>(last))) Clear();
    }

    // The all-passes' coefficients in the next frames, at most a piece of the oscillator. They are the
    // floats that the library's sines give, to the bit: where the oscillator's may round to another one, the
    // library is asked.
    void TakeCoefficients(double* coefficients, int frames) {
        std::array<double, SineOscillator::kPiece> sines;
        for (int taken; frames > 0; frames -= taken, coefficients += taken) {
            double phase = oscillator.Phase();
            taken = oscillator.TakeSinesAndStep(sines.data(), frames, kCycle);
            if (Convert(sines.data(), coefficients, taken)) continue;
            for (int i = 0; i < taken; ++i, phase += oscillator.Increment())
                sines[static_cast<std::size_t>(i)] = std::sin(phase);
            Convert(sines.data(), coefficients, taken);
        }
    }

private:
    // False when an error of the sines would show in the coefficients.
    bool Convert(const double* sines, double* coefficients, int count) const {
        const double range = maximum - minimum;
        const double doubt = 1e-13 * std::abs(range) + 1e-15 * (maximum + minimum);
        int doubtful = 0;
        for (int i = 0; i < count; ++i) {
            const double w = (sines[i] + 1.0) * 0.5 * range + minimum;
            const auto narrow = static_cast<float>(w);
            doubtful += static_cast<float>(w - doubt) != static_cast<float>(w + doubt);
            coefficients[i] = (1.0f - narrow) / (1.0f + narrow);
        }
        return doubtful == 0;
    }
};

}  // namespace Corvo::DSP
