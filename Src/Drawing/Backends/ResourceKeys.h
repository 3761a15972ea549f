#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <functional>
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

// A picture needs a few colours and widths; up to 220 texts on a display of 3840x2160, and there is room for
// two such pictures.
constexpr std::size_t kKeptInks = 32, kKeptStrokes = 32, kKeptTexts = 512;

inline std::size_t CombinedHash(std::size_t a, std::size_t b) { return a * 31 + b; }

}  // namespace Corvo

template <>
struct std::hash<Corvo::InkKey> {
    std::size_t operator()(const Corvo::InkKey& key) const {
        return Corvo::CombinedHash(key.ink.colour, key.ink.opacity);
    }
};

template <>
struct std::hash<Corvo::StrokeKey> {
    std::size_t operator()(const Corvo::StrokeKey& key) const {
        return Corvo::CombinedHash(std::hash<Corvo::InkKey>{}(key.ink), std::hash<float>{}(key.width));
    }
};

template <>
struct std::hash<Corvo::TextKey> {
    std::size_t operator()(const Corvo::TextKey& key) const {
        return Corvo::CombinedHash(std::hash<std::string_view>{}(key.text.data()),
                                   std::hash<float>{}(key.size));
    }
};
