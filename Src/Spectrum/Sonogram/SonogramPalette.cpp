#include "Spectrum/Sonogram/SonogramPalette.h"

#include <algorithm>
#include <cstddef>
#include <iterator>

namespace Corvo {
namespace {

// clang-format off
constexpr SonogramPalette kPalettes[] = {
    {{0x000000, 0x1E00FF, 0xDC1400, 0xFFFFFF}},
    {{0x000000, 0x0000FF, 0x00FF32, 0xFFFFFF}},
    {{0x000000, 0xFF4500, 0xFFFF00, 0xFFFFFF}},
    {{0x000000, 0xFF0000, 0xFF0032, 0xFFFFFF}},
    {{0x000000, 0x00FF00, 0x00FF32, 0xFFFFFF}},
    {{0x000000, 0x0000FF, 0x0032FF, 0xFFFFFF}},
    {{0x000000, 0x404040, 0x919191, 0xFFFFFF}},
};
// clang-format on
constexpr int kSchemes = static_cast<int>(std::size(kPalettes));

}  // namespace

const SonogramPalette& SonogramPaletteOf(int scheme) {
    return kPalettes[scheme >= 0 && scheme < kSchemes ? scheme : 0];
}

std::uint32_t ColourAt(const SonogramPalette& palette, float share) {
    const float limited = share > 0.0f ? std::min(share, 1.0f) : 0.0f;
    const auto& stops = palette.stops;
    const float place = limited * static_cast<float>(stops.size() - 1);
    const std::size_t below = std::min(static_cast<std::size_t>(place), stops.size() - 2);
    const float between = place - static_cast<float>(below);
    std::uint32_t colour = 0;
    for (int shift = 0; shift < 24; shift += 8) {
        const auto from = static_cast<float>(stops[below] >> shift & 0xFF);
        const auto to = static_cast<float>(stops[below + 1] >> shift & 0xFF);
        colour |= static_cast<std::uint32_t>(from + (to - from) * between + 0.5f) << shift;
    }
    return colour;
}

}  // namespace Corvo
