#pragma once

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <vector>

namespace Plain {

// The chorus as its definition reads: a library sine and one step through the shared ring for every sample.
struct Chorus {
    struct Settings {
        std::array<int, 2> frequency, delay, wet, dry, depth;
    };
    struct Side {
        double increment, wet, dry;
        int base, amplitude;
        double phase = 0.0;
        int index = 0;
    };
    std::array<Side, 2> sides{};
    std::vector<float> ring = std::vector<float>(1 << 22);
    int length = 0, channels = 2;

    void Cook(const Settings& s, int rate, int channelCount, bool reset) {
        channels = channelCount;
        length = 0;
        for (std::size_t c = 0; c < 2; ++c) {
            Side& side = sides[c];
            const auto gain = [](int tenths) { return tenths > -960 ? std::pow(10.0, tenths * 0.005) : 0.0; };
            side.increment = 0.06283185307179587 / rate * s.frequency[c];
            side.wet = gain(s.wet[c]);
            side.dry = gain(s.dry[c]);
            const auto delay = static_cast<int>(std::int64_t{s.delay[c]} * rate / 10000);
            const auto depth = static_cast<int>(std::int64_t{s.depth[c]} * delay / 1000);
            side.base = delay - depth;
            side.amplitude = depth / 2;
            if (static_cast<int>(c) < channels)
                length = std::max(length, channels * (side.base + 2 * side.amplitude));
        }
        for (std::size_t c = 0; c < 2; ++c) {
            if (reset) sides[c].phase = 0.0;
            sides[c].index = reset ? static_cast<int>(c) : std::min(sides[c].index, length);
        }
    }

    template <typename Sample>
    void Run(Sample* samples, int frames) {
        const auto wrapped = [this](int at) {
            return at < 0 ? at + length : at >= length ? at - length : at;
        };
        for (int c = 0; c < channels; ++c) {
            Side& s = sides[static_cast<std::size_t>(c)];
            for (int i = 0; i < frames; ++i) {
                Sample& sample = samples[i * channels + c];
                const double x = sample, dry = x * s.dry;
                s.phase += s.increment;
                const double m = (std::sin(s.phase) + 1.0) * s.amplitude;
                const auto p = static_cast<int>(m);
                const double fraction = m - p;
                const int at = wrapped(s.index + channels * (p - s.base));
                const int next = wrapped(at + (fraction > 0.0 ? channels : -channels));
                const double here = ring[static_cast<std::size_t>(at)];
                const double y = (ring[static_cast<std::size_t>(next)] - here) * fraction + here;
                ring[static_cast<std::size_t>(s.index)] = static_cast<float>(x);
                sample = static_cast<Sample>(y * s.wet + dry);
                s.index += channels;
                if (s.index >= length) s.index = c;
            }
            s.phase = std::fmod(s.phase, 6.283185307179586);
        }
    }
};

}  // namespace Plain
