#pragma once

#include <cstddef>
#include <span>
#include <vector>

#include "DSP/Effects/Parameters/LittleEndian.h"

namespace Corvo::DSP {

// Reads and writes settings chunks. Both are called like functions with one field or one array of fields,
// so that an effect names its layout once, as a visitor, for both directions.
class ChunkReader {
public:
    explicit ChunkReader(std::span<const std::uint8_t> bytes) : m_rest(bytes) {}

    // False, with `value` untouched, when the bytes run out; every later read fails too.
    template <ChunkField T>
    bool operator()(T& value) {
        std::array<std::uint8_t, sizeof(T)> bytes;
        if (m_rest.size() < bytes.size()) {
            m_rest = {};
            return false;
        }
        std::copy_n(m_rest.begin(), bytes.size(), bytes.begin());
        value = LittleEndianValue<T>(bytes);
        m_rest = m_rest.subspan(bytes.size());
        return true;
    }
    template <typename T, std::size_t N>
    bool operator()(std::array<T, N>& values) {
        return std::ranges::all_of(values, [this](T& value) { return (*this)(value); });
    }
    bool Skip(std::size_t bytes) {
        const bool enough = bytes <= m_rest.size();
        m_rest = enough ? m_rest.subspan(bytes) : std::span<const std::uint8_t>{};
        return enough;
    }

private:
    std::span<const std::uint8_t> m_rest;
};

// Writes from the start of `chunk`, which is first made exactly `size` bytes long (growth is zeroed).
class ChunkWriter {
public:
    ChunkWriter(std::vector<std::uint8_t>& chunk, std::size_t size) : m_rest((chunk.resize(size), chunk)) {}

    // False, with nothing written, when the field does not fit.
    template <ChunkField T>
    bool operator()(const T& value) {
        const auto bytes = LittleEndianBytes(value);
        if (m_rest.size() < bytes.size()) return false;
        std::ranges::copy(bytes, m_rest.begin());
        m_rest = m_rest.subspan(bytes.size());
        return true;
    }
    template <typename T, std::size_t N>
    bool operator()(const std::array<T, N>& values) {
        return std::ranges::all_of(values, [this](const T& value) { return (*this)(value); });
    }

private:
    std::span<std::uint8_t> m_rest;
};

}  // namespace Corvo::DSP
