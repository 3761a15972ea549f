#pragma once

// tWAVEFORMATEX: the wave-format record that describes every block of audio.
#if defined(_WIN32)
#include "Platform/WindowsHeader.h"
// mmreg.h needs the types of windows.h, hence the gap.

#include <mmreg.h>
#else
#include <cstdint>

#pragma pack(push, 1)
struct tWAVEFORMATEX {
    std::uint16_t wFormatTag;
    std::uint16_t nChannels;
    std::uint32_t nSamplesPerSec;
    std::uint32_t nAvgBytesPerSec;
    std::uint16_t nBlockAlign;
    std::uint16_t wBitsPerSample;
    std::uint16_t cbSize;
};
#pragma pack(pop)
#endif

static_assert(sizeof(tWAVEFORMATEX) == 18);
