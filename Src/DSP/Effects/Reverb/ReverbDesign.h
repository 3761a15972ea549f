#pragma once

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdint>

#include "DSP/Effects/Reverb/Reverb.h"
#include "DSP/Parts/Decibels.h"

namespace Corvo::DSP {

// What the reverb derives from its settings and the sampling rate: delays in samples, linear gains.
struct ReverbDesign {
    static constexpr std::size_t kTaps = 19, kCombs = 6;
    static constexpr double kAllPassGain = 0.7;

    struct Reflection {
        double seconds, gain;
    };
    // clang-format off
    static constexpr std::array<Reflection, kTaps> kReflections{{
        {0.0000, 0.850}, {0.0043, 0.841}, {0.0215, 0.504}, {0.0225, 0.491}, {0.0268, 0.379},
        {0.0270, 0.380}, {0.0298, 0.346}, {0.0458, 0.289}, {0.0485, 0.272}, {0.0572, 0.192},
        {0.0587, 0.193}, {0.0595, 0.217}, {0.0612, 0.181}, {0.0707, 0.180}, {0.0708, 0.181},
        {0.0726, 0.176}, {0.0741, 0.142}, {0.0753, 0.167}, {0.0797, 0.134},
    }};
    // clang-format on

    struct Channel {
        std::array<int, kTaps> taps{};
        std::array<int, kCombs> combs{};
        std::array<double, kCombs> feedback{};
        // Positive: the tail waits so many samples, so that it starts with the last reflection at the
        // earliest; negative: the reflections wait.
        int offset = 0;
        double reflections = 0.0, tail = 0.0, wet = 0.0, dry = 0.0;
    };
    std::array<Channel, 2> channels;
    std::array<double, kCombs> damping{};
    int longestTap = 0;  // of both channels; 0 for no reflections at all
    int allPass = 1;
    bool filtersInput = true;

    // Settings from anywhere: words that size a buffer or a loop, and levels, are brought into their ranges.
    ReverbDesign(const ReverbPrivate::_transform_props& s, double rate) {
        constexpr std::array<double, kCombs> kDamping{0.46, 0.48, 0.5, 0.52, 0.53, 0.55};
        // The left side's damping serves both: the right one is kept and shown only.
        const double word = std::max(s.damping[0], 0);
        for (std::size_t i = 0; i < kCombs; ++i)
            damping[i] = std::min(word * kDamping[i] * rate * 2e-8, 0.999);
        for (std::size_t c = 0; c < channels.size(); ++c) Derive(s, c, rate);
        for (const auto& channel : channels)
            longestTap = std::max(longestTap, *std::ranges::max_element(channel.taps));
        allPass = std::max(static_cast<int>(rate * 0.006), 1);
        filtersInput = s.filterOff == 0;
    }

    // The longest of every delay at a rate.
    static constexpr int kPreDelayTop = 2000, kReflectionsTop = 5000, kRoomTop = 4000;
    static ReverbDesign Largest(double rate) {
        ReverbPrivate::_transform_props s{};
        s.preDelay = {kPreDelayTop, kPreDelayTop};
        s.reflections = {kReflectionsTop, kReflectionsTop};
        s.room = {kRoomTop, kRoomTop};
        return {s, rate};
    }

private:
    void Derive(const ReverbPrivate::_transform_props& s, std::size_t side, double rate) {
        constexpr std::int32_t kSilent = -450, kLoudest = 100, kMixTop = 2000;
        constexpr std::array<int, kCombs> kBase{4, 7, 15, 29, 31, 34};
        constexpr std::array<double, kCombs> kSeconds{0.05, 0.056, 0.061, 0.068, 0.072, 0.078};
        constexpr double kLeast = 1e-5, kMost = 0.9999;

        auto& channel = channels[side];
        const double preDelay = std::clamp(s.preDelay[side], 0, kPreDelayTop) * 0.0001 * rate;
        const double size = std::clamp(s.reflections[side], 0, kReflectionsTop) * 0.001;
        for (std::size_t i = 0; i < kTaps; ++i)
            channel.taps[i] = static_cast<int>(std::trunc(size * kReflections[i].seconds * rate) + preDelay);

        const double room = std::clamp(s.room[side], 1, kRoomTop);
        for (std::size_t i = 0; i < kCombs; ++i)
            channel.combs[i] = kBase[i] - static_cast<int>(-0.001 * room * kSeconds[i] * rate);
        channel.offset = *std::ranges::max_element(channel.taps) - channel.taps[0] -
                         *std::ranges::min_element(channel.combs);

        // A length of 0 divides to infinity, which ends at the least ratio.
        const double ratio = std::clamp(1.0 - 0.366 / (s.length[side] * 0.001), kLeast, kMost);
        for (std::size_t i = 0; i < kCombs; ++i) channel.feedback[i] = (1.0 - damping[i]) * ratio;

        channel.reflections = std::clamp(s.mix[side], 0, kMixTop) * 0.0005;
        channel.tail = (1.0 - channel.reflections) * 0.16666667;
        channel.wet = GainFromTenthsOfDb(s.wet[side], kSilent, kLoudest);
        channel.dry = GainFromTenthsOfDb(s.dry[side], kSilent, kLoudest);
    }
};

}  // namespace Corvo::DSP
