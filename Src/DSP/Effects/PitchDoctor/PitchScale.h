#pragma once

#include <array>
#include <cmath>
#include <cstddef>

namespace Corvo::DSP {

// The notes that a voice may be corrected to. Pitches are in cents: 100 times the MIDI note number in equal
// temperament, so that 6900 is the concert pitch.
struct PitchScale {
    double concertHz = 440.0;
    std::array<double, 12> cents{0, 100, 200, 300, 400, 500, 600, 700, 800, 900, 1000, 1100};  // from C up
    std::array<bool, 12> allowed{};

    struct Note {
        int number = -1;  // MIDI; -1: none is allowed
        double cents = 0.0;
    };

    // The note where the scale has it now; number -1 when it is not allowed.
    Note Find(int number) const {
        if (number < 0 || !allowed[static_cast<std::size_t>(number % 12)]) return {};
        return {number, 1200.0 * (number / 12) + cents[static_cast<std::size_t>(number % 12)]};
    }

    double CentsOf(double hz) const { return 6900.0 + 1200.0 * std::log2(hz / concertHz); }

    Note Nearest(double at) const {
        Note nearest;
        const int octave = static_cast<int>(std::floor(at / 1200.0));
        for (int o = octave - 1; o <= octave + 1; ++o)
            for (int n = 0; n < 12; ++n) {
                const auto i = static_cast<std::size_t>(n);
                const double there = 1200.0 * o + cents[i];
                if (!allowed[i] ||
                    (nearest.number >= 0 && std::abs(there - at) >= std::abs(nearest.cents - at)))
                    continue;
                nearest = {12 * o + n, there};
            }
        return nearest;
    }
};

}  // namespace Corvo::DSP
