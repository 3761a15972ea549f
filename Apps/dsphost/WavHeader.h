#pragma once

#include <cstdint>
#include <functional>
#include <optional>
#include <string_view>
#include <vector>

#include <sndfile.h>

namespace dsphost {

// WAV headers read and written without looking ahead or back, so that they serve pipes too.

struct WavStreamHeader {
    int channels = 0, rate = 0;
    int subtype = 0;                          // libsndfile's
    std::optional<std::int64_t> sampleBytes;  // nothing: until the stream ends
    // A size that stands for "unknown", but may be meant: if a chunk starts behind it, the samples end there.
    std::optional<std::int64_t> doubtfulBytes;
};

// Reads up to so many bytes of a stream and returns how many there were: fewer at its end only.
using ByteSource = std::function<std::size_t(void* bytes, std::size_t count)>;

// Reads up to the first sample. `bytes` receives everything that was read, for whoever must read it again
// when the result is nothing: not a WAV stream, a coding that does not stream, or no samples within
// kLongestWavHeader bytes, of which then all were read.
std::optional<WavStreamHeader> ReadWavStreamHeader(const ByteSource& source,
                                                   std::vector<unsigned char>& bytes);
inline constexpr std::size_t kLongestWavHeader = 1 << 20;

// Whether these first bytes behind samples of `sampleBytes` are a chunk that WAV files have there.
bool StartsChunk(std::string_view bytes, std::int64_t sampleBytes);
inline constexpr std::size_t kChunkStart = 5;  // bytes that it needs to see

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
