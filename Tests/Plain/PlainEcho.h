#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <vector>

namespace Plain {

// The echo as its definition reads: one ring that the channels share, sample by sample.
struct Echo {
    struct Side {
        double feedback, echo, wet, output;
        int length;  // in samples, both channels counted
    };
    std::array<Side, 2> sides;
    std::vector<float> ring;
    std::array<std::size_t, 2> index{0, 1};

    // Clears the ring unless the longer side stays as long as it was.
    void SetSides(const std::array<Side, 2>& changed) {
        sides = changed;
        const auto longest = static_cast<std::size_t>(std::max(sides[0].length, sides[1].length));
        if (longest == ring.size()) return;
        ring.assign(longest, 0.0f);
        index = {0, 1};
    }

    template <typename Sample>
    void Run(Sample* samples, int frames, std::size_t channels) {
        for (std::size_t ch = 0; ch < channels; ++ch) {
            const Side& s = sides[ch];
            for (std::size_t i = 0; i < static_cast<std::size_t>(frames); ++i) {
                const double x = samples[i * channels + ch], d = ring[index[ch]], f = d * s.feedback;
                ring[index[ch]] = static_cast<float>(f + x);
                samples[i * channels + ch] =
                    static_cast<Sample>(((d * s.echo + f) * s.wet + x * (1.0 - s.wet)) * s.output);
                index[ch] += channels;
                if (index[ch] >= static_cast<std::size_t>(s.length)) index[ch] = ch;
            }
        }
    }
};

}  // namespace Plain
