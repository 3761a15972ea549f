#pragma once

#include <cstdint>

#include "C/Calls.h"
#include "Platform/WaveFormat.h"

namespace Corvo::C {

// The block format that a C host announces, checked.
inline tWAVEFORMATEX WaveFormat(const dsp_format& wanted) {
    Require(wanted.rate > 0, "the rate must be above 0");
    Require(wanted.channels == 1 || wanted.channels == 2, "there can be 1 or 2 channels");
    Require(wanted.sample == DSP_F32 || wanted.sample == DSP_F64, "samples can be DSP_F32 or DSP_F64");
    constexpr std::uint16_t kFloatTag = 3;
    tWAVEFORMATEX format{};
    format.wFormatTag = kFloatTag;
    format.nChannels = static_cast<std::uint16_t>(wanted.channels);
    format.nSamplesPerSec = static_cast<std::uint32_t>(wanted.rate);
    format.wBitsPerSample = wanted.sample == DSP_F64 ? 64 : 32;
    format.nBlockAlign = static_cast<std::uint16_t>(format.nChannels * format.wBitsPerSample / 8);
    format.nAvgBytesPerSec = format.nSamplesPerSec * format.nBlockAlign;
    return format;
}

}  // namespace Corvo::C
