#pragma once

#include <cmath>
#include <cstddef>

namespace Plain {

// The tremolo of one channel as its definition reads, a library sine for every frame.
struct Tremolo {
    double depth, offset, scale, bias, gain, increment;
    double phase = 0.0;

    template <typename Sample>
    void Run(Sample* samples, int frames, std::ptrdiff_t stride) {
        for (; frames > 0; --frames, samples += stride) {
            phase += increment;
            *samples =
                static_cast<Sample>(*samples * (((depth * std::sin(phase) + offset) * scale + bias) * gain));
        }
        phase = std::fmod(phase, 6.283185307179586);
    }
};

}  // namespace Plain
