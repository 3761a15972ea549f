#pragma once

#include <array>
#include <cmath>

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
};

}  // namespace Corvo::DSP
