#pragma once

// tWAVEFORMATEX: the wave-format record that describes every block of audio.
#if defined(_WIN32)
#include "Platform/WindowsHeader.h"
// mmreg.h needs the types of windows.h, hence the gap.

#include <mmreg.h>
#else
#include <cstdint>

#pragma pack(push, 1)
// What a block of audio looks like. Effects read channels, rate and width only.
struct tWAVEFORMATEX {
    std::uint16_t wFormatTag;       // 3 for floats; not read
    std::uint16_t nChannels;        // per frame
    std::uint32_t nSamplesPerSec;   // frames per second, Hz
    std::uint32_t nAvgBytesPerSec;  // rate * nBlockAlign; not read
    std::uint16_t nBlockAlign;      // bytes of an interleaved frame; not read
    std::uint16_t wBitsPerSample;   // 32 for floats, 64 for doubles
    std::uint16_t cbSize;           // bytes behind the record; not read
};
#pragma pack(pop)
#endif

static_assert(sizeof(tWAVEFORMATEX) == 18);
