#pragma once

#include <cstdint>
#include <optional>
#include <vector>

#include <sndfile.h>

#include "File.h"

namespace dsphost {

// WAV headers read and written without looking ahead or back, so that they serve pipes too.

struct WavStreamHeader {
    int channels = 0, rate = 0;
    int subtype = 0;                          // libsndfile's
    std::optional<std::int64_t> sampleBytes;  // nothing: until the stream ends
};

// Reads up to the first sample. `bytes` receives everything that was read, for whoever must read it again
// when the result is nothing: not a WAV stream, or a coding that does not stream.
std::optional<WavStreamHeader> ReadWavStreamHeader(File& file, std::vector<unsigned char>& bytes);

// A WAV file of little-endian PCM or floats.
struct WavShape {
    int channels = 0, rate = 0;
    int subtype = 0;    // libsndfile's
    bool room = false;  // keep room to make it an RF64 should it pass 4 GiB
    bool rf64 = false;  // make it one in any case
};

// The header, of a length that depends on the shape alone. Without a size it says "until the end", as
// streaming tools understand.
std::vector<unsigned char> MakeWavHeader(const WavShape& shape, std::optional<std::int64_t> sampleBytes);
// The most that a WAV holds without being an RF64.
inline constexpr std::int64_t kLargestWavBytes = 0xFFFFFFFFll - 256;

// Bytes of one sample in a plain WAV file; 0 for other codings.
int WavSampleBytes(int subtype);

}  // namespace dsphost
