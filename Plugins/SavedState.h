#pragma once

#include <algorithm>
#include <cstdint>
#include <vector>

#include "Core.h"

namespace Corvo::Plugins {

// What CLAP and VST3 hosts keep of a plug-in: whether it is bypassed, the values of all ports, which may be
// finer than what an effect stores, and its settings chunk. Not on the audio thread; throw std::bad_alloc.
std::vector<std::uint8_t> SaveState(Core& core);
// False, with nothing changed, for bytes that are no such state of this effect.
bool LoadState(Core& core, const std::vector<std::uint8_t>& bytes);

// Through a host's stream, which may move fewer bytes at a time than it is asked to: write(data, count) and
// read(data, count) return how many, 0 at the end and less than that after an error. False after one.
template <typename Write>
bool WriteAll(std::vector<std::uint8_t> bytes, Write write) {
    for (std::size_t done = 0; done < bytes.size();) {
        const std::int64_t count = write(bytes.data() + done, bytes.size() - done);
        if (count <= 0) return false;
        done += static_cast<std::size_t>(count);
    }
    return true;
}
template <typename Read>
bool ReadAll(std::vector<std::uint8_t>& bytes, Read read) {
    std::uint8_t buffer[4096];
    for (;;) {
        const std::int64_t count = read(buffer, sizeof buffer);
        if (count <= 0) return count == 0;
        bytes.insert(bytes.end(), buffer,
                     buffer + std::min<std::size_t>(static_cast<std::size_t>(count), sizeof buffer));
    }
}

}  // namespace Corvo::Plugins
