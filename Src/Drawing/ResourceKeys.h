#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <string_view>

#include "Drawing/DrawTarget.h"

namespace Corvo {

// What a back-end finds its brushes, pens and laid-out texts by.

struct InkKey {
    Ink ink{};
    bool operator==(const InkKey& other) const {
        return ink.colour == other.ink.colour && ink.opacity == other.ink.opacity;
    }
};

struct StrokeKey {
    InkKey ink;
    float width = 0.0f;
    bool operator==(const StrokeKey&) const = default;
};

struct TextKey {
    static constexpr std::size_t kMostBytes = 95;

    std::array<char, kMostBytes + 1> text{};
    float size = 0.0f;

    TextKey() = default;
    // A longer text is cut, between two characters.
    TextKey(std::string_view whole, float emSize) : size(emSize) {
        std::size_t length = std::min(whole.size(), kMostBytes);
        const auto continues = [&](std::size_t at) { return (whole[at] & 0xC0) == 0x80; };
        if (length < whole.size())
            while (length > 0 && continues(length)) --length;
        std::copy_n(whole.begin(), length, text.begin());
    }
    bool operator==(const TextKey&) const = default;
};

}  // namespace Corvo
