#pragma once

#include "Platform/WaveFormat.h"

namespace Corvo::DSP {

// What an effect does with sample widths other than 32 and 64 bits.
enum class OtherWidths { Skip, AreFloat };

// Calls `call` with a pointer to what the block's samples really are: the one place where the host's
// double* is reinterpreted.
template <typename Call>
void WithSamples(double* buffer, const tWAVEFORMATEX& format, OtherWidths rule, Call&& call) {
    if (format.wBitsPerSample == 64)
        call(buffer);
    else if (format.wBitsPerSample == 32 || rule == OtherWidths::AreFloat)
        call(reinterpret_cast<float*>(buffer));
}

// The same for planar blocks; `call` gets a pointer to the channels' pointers.
template <typename Call>
void WithChannels(double* const* channels, const tWAVEFORMATEX& format, OtherWidths rule, Call&& call) {
    if (format.wBitsPerSample == 64)
        call(channels);
    else if (format.wBitsPerSample == 32 || rule == OtherWidths::AreFloat)
        call(reinterpret_cast<float* const*>(channels));
}

}  // namespace Corvo::DSP
