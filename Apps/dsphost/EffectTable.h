#pragma once

#include <memory>
#include <span>
#include <string>
#include <vector>

#include "ChainElement.h"
#include "DSP/Effects/Framework/CorvoEffectBase.h"

namespace dsphost {

using Effect = Corvo::DSP::CorvoEffectBase;
using EffectFactory = std::unique_ptr<Effect> (*)();

// Every effect of the library, in the order that `dsphost effects` shows.
std::span<const EffectFactory> EffectFactories();
// Their names, in the same order.
std::span<const std::string> EffectNames();

// Everything that --fx can name: the effects, and what else can stand in a chain.
std::span<const ElementKind> ElementKinds();

}  // namespace dsphost
