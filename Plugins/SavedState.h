#pragma once

#include <cstdint>
#include <vector>

#include "Core.h"

namespace Corvo::Plugins {

// What CLAP and VST3 hosts keep of a plug-in: whether it is bypassed, the values of all ports, which may be
// finer than what an effect stores, and its settings chunk. Not on the audio thread; throw std::bad_alloc.
std::vector<std::uint8_t> SaveState(Core& core);
// False, with nothing changed, for bytes that are no such state of this effect.
bool LoadState(Core& core, const std::vector<std::uint8_t>& bytes);

}  // namespace Corvo::Plugins
