#pragma once

#include <span>
#include <string>
#include <vector>

#include "ChainElement.h"
#include "DSP/Effects/EffectKinds.h"

namespace dsphost {

using Effect = Corvo::DSP::CorvoEffectBase;
using Corvo::DSP::EffectKind;
using Corvo::DSP::EffectKinds;

// The names of the library's effects, in its order.
std::span<const std::string> EffectNames();

// Everything that --fx can name: the effects, and what else can stand in a chain.
std::span<const ElementKind> ElementKinds();

}  // namespace dsphost
