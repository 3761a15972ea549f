#pragma once

#include <cstdint>
#include <optional>
#include <vector>

#include <sndfile.h>

#include "File.h"

namespace dsphost {

// WAV through a pipe: nothing can be looked up later, and sizes may be unknown until the end.

struct WavStreamHeader {
    int channels = 0, rate = 0;
    int subtype = 0;                          // libsndfile's
    std::optional<std::int64_t> sampleBytes;  // nothing: until the stream ends
};

// Reads up to the first sample. `bytes` receives everything that was read, for whoever must read it again
// when the result is nothing: not a WAV stream, or a coding that does not stream.
std::optional<WavStreamHeader> ReadWavStreamHeader(File& file, std::vector<unsigned char>& bytes);

// The header of a plain WAV file of little-endian PCM or floats; without a size it says "until the end", as
// streaming tools understand.
std::vector<unsigned char> MakeWavHeader(int channels, int rate, int subtype,
                                         std::optional<std::int64_t> sampleBytes);

// Bytes of one sample in a plain WAV file; 0 for other codings.
int WavSampleBytes(int subtype);

}  // namespace dsphost
