#pragma once

#include <array>
#include <cstdint>

#include "DSP/Effects/Framework/MemoryFile.h"
#include "DSP/Effects/Parameters/LittleEndian.h"

namespace KivFiles {

// Single values in a file, little-endian. Both throw where the file ends too early.
template <typename T>
void WriteValue(CFileBase& file, T value) {
    const auto bytes = Corvo::DSP::LittleEndianBytes(value);
    if (file.Write(bytes.data(), sizeof(T)) != sizeof(T)) throw Corvo::CorvoException("Error writing data");
}

template <typename T>
T ReadValue(CFileBase& file) {
    std::array<std::uint8_t, sizeof(T)> bytes;
    if (file.Read(bytes.data(), sizeof(T)) != sizeof(T)) throw Corvo::CorvoException("Error reading data");
    return Corvo::DSP::LittleEndianValue<T>(bytes);
}

}  // namespace KivFiles
