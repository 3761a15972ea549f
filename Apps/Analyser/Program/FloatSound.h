#pragma once

#include <SDL.h>

namespace analyser {

// What a device is asked for: floats of the processor's own byte order, so many frames at a time.
inline SDL_AudioSpec FloatSound(int rate, int channels, int frames) {
    SDL_AudioSpec spec{};
    spec.freq = rate;
    spec.format = AUDIO_F32SYS;
    spec.channels = static_cast<Uint8>(channels);
    spec.samples = static_cast<Uint16>(frames);
    return spec;
}

}  // namespace analyser
