#pragma once

#include <array>
#include <cstdint>

// The ten colours of the host's generic editor. Which element each one paints is the host's affair.
struct PluginGenericUILookAndFeel {
    // 24 bits each; the top byte is 0.
    std::array<std::uint32_t, 10> colours{
        0x0022211E, 0x002B2A27, 0x007E7E7E, 0x0048443F, 0x00C8C8C8,
        0x00707070, 0x00757572, 0x00424140, 0x00373534, 0x009AFC9F,
    };
};
static_assert(sizeof(PluginGenericUILookAndFeel) == 40);
