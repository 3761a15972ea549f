#pragma once

#include <cstdint>
#include <functional>
#include <optional>

#include "AudioReader.h"
#include "AudioWriter.h"
#include "Chain.h"

namespace dsphost {

struct RenderOptions {
    int precision = 64;                // bits of the samples that the chain processes: 32 or 64
    int block = 1024;                  // most frames per block
    bool planar = false;               // where elements support it
    std::optional<double> tail = 0.0;  // seconds after the input's end; nothing: until it has died away
};

// An automatic tail has died away when the output stayed below -120 dBFS for this long and for the longest
// gap between two echoes of the chain. The quiet end is not written.
inline constexpr double kTailQuietSeconds = 0.5;
inline constexpr double kTailThreshold = 1e-6;
inline constexpr double kLongestAutoTail = 60.0;

// Streams the input through the chain into the output, the chain's latency taken out: frame n of the output
// is what became of frame n of the input. `onProgress` gets the frames of input done.
void Render(AudioReader& input, Chain& chain, AudioWriter& output, const RenderOptions& options,
            const std::function<void(std::int64_t)>& onProgress);

tWAVEFORMATEX ChainFormat(int channels, int rate, int precision);

}  // namespace dsphost
