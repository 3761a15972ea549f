#pragma once

#include <cstdint>

namespace Corvo {

// A Windows colour reference: red in the low byte, then green, then blue.
using ColourReference = std::uint32_t;

// From 0xRRGGBB, and back: the same exchange of red and blue.
constexpr ColourReference ColourFromRgb(std::uint32_t rgb) {
    return (rgb & 0x0000FFu) << 16 | (rgb & 0x00FF00u) | (rgb & 0xFF0000u) >> 16;
}

// Each 0..255.
constexpr std::uint8_t RedOf(ColourReference colour) { return static_cast<std::uint8_t>(colour); }
constexpr std::uint8_t GreenOf(ColourReference colour) { return static_cast<std::uint8_t>(colour >> 8); }
constexpr std::uint8_t BlueOf(ColourReference colour) { return static_cast<std::uint8_t>(colour >> 16); }

}  // namespace Corvo
