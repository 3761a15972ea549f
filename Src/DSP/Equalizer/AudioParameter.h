#pragma once

#include <algorithm>
#include <cmath>
#include <cstdint>

namespace Corvo::DSP {

// How a gliding value approaches its target, one step per sample: 0.09 % of the way first, then a tenth of
// that, growing to about 1.3 % a sample near the end, where the value snaps to the target.
struct AudioParameterProgressAlternate {
    static constexpr double kTiny = 1e-14f;       // of single precision: 9.9999998245167e-15
    static constexpr double kFirstRate = 0.0009;  // the share of the way that the first step covers
    static constexpr double kArrived = 0.01;      // with less than this share left the value snaps

    // The share of the remaining way that a step covers: 9e-5 * exp(5 * (1 - rel)), to 1.1e-11 relative for
    // `rel` in 0..1. The polynomial is the 64th root of that; squared six times it costs a fraction of a
    // library exponential, comes out the same on every machine and works in the lanes of a register.
    template <typename Value>
    static Value Rate(const Value& rel) {
        const Value square = rel * rel;
        const Value high = Value(-2.1804304592120065e-08) * rel + Value(1.4500166741204932e-06);
        const Value middle = Value(-7.428997425635657e-05) * rel + Value(0.0028527541301630716);
        const Value low = Value(-0.07303050872274937) * rel + Value(0.9347905117795469);
        Value root = (high * square + middle) * square + low;
        for (int i = 0; i < 6; ++i) root = root * root;
        return root;
    }

    // Moves the value by one step; false when it has arrived.
    static bool Step(double& value, double start, double target) {
        if (std::abs(target) < kTiny && std::abs(value) < kTiny) {
            value = 0.0;
            return false;
        }
        const double range = std::max(std::abs(start - target), kTiny);
        const double rel = std::abs(value - target) / range;
        const double k = rel >= 1.0 ? kFirstRate : Rate(rel);
        value = (1.0 - k) * value + k * target;
        if (!(rel < kArrived)) return true;
        value = target;
        return false;
    }
};

// A value that glides to its target.
template <typename T, typename Progress>
struct AudioParameter {
    T value{};            // in use now
    T start{};            // where the glide began
    T target{};           // where it leads
    bool moving = false;  // a glide is on its way

    // Begins a glide, even to where the value is already.
    void SetTarget(T newTarget) {
        start = value;
        target = newTarget;
        moving = true;
    }
    // Arrives at once.
    void Jump() {
        value = start = target;
        moving = false;
    }
    // One sample's progress.
    void Advance() {
        if (moving) moving = Progress::Step(value, start, target);
    }
};

// The same with a counter of the values that are on the move, shared by all values of one processor. Set
// the counter before anything else; it must outlive the value. It never falls below 0.
template <typename T, typename Progress>
struct AudioParameterManaged {
    T value{};                        // in use now
    T start{};                        // where the glide began
    T target{};                       // where it leads
    bool moving = false;              // a glide is on its way
    std::int32_t* counter = nullptr;  // the processor's; not owned

    // Begins a glide if the target is news.
    void SetTarget(T newTarget) {
        if (newTarget == target) return;
        start = value;
        target = newTarget;
        if (!moving) ++*counter;
        moving = true;
    }
    // Arrives at once.
    void Jump() {
        value = target;
        if (moving) Arrive();
    }
    // One sample's progress.
    void Advance() {
        if (moving && !Progress::Step(value, start, target)) Arrive();
    }

private:
    void Arrive() {
        moving = false;
        *counter = std::max(*counter - 1, 0);
    }
};

}  // namespace Corvo::DSP
