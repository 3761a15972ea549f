#pragma once

#include <array>
#include <cstdint>

namespace Corvo {

// 0xRRGGBB, from silence to full scale, at equal distances.
struct SonogramPalette {
    std::array<std::uint32_t, 4> stops;
};

// A scheme outside 0..6 has the colours of 0.
const SonogramPalette& SonogramPaletteOf(int scheme);

// 0xRRGGBB between the stops on either side of `share`, 0 silence .. 1 full scale, in proportion of their
// codes; beyond the ends the end's, and silence's for what is not a number.
std::uint32_t ColourAt(const SonogramPalette& palette, float share);

}  // namespace Corvo
