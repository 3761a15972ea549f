#pragma once

#include <algorithm>
#include <array>
#include <bit>
#include <concepts>
#include <cstdint>

namespace Corvo::DSP {

// Integers and floats to and from little-endian bytes, whatever the machine's own order.
template <typename T>
concept ChunkField = std::integral<T> || std::floating_point<T>;

template <ChunkField T>
std::array<std::uint8_t, sizeof(T)> LittleEndianBytes(T value) {
    auto bytes = std::bit_cast<std::array<std::uint8_t, sizeof(T)>>(value);
    if constexpr (std::endian::native == std::endian::big) std::ranges::reverse(bytes);
    return bytes;
}

template <ChunkField T>
T LittleEndianValue(std::array<std::uint8_t, sizeof(T)> bytes) {
    if constexpr (std::endian::native == std::endian::big) std::ranges::reverse(bytes);
    return std::bit_cast<T>(bytes);
}

}  // namespace Corvo::DSP
