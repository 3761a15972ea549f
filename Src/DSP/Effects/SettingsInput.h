#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "DSP/Effects/EffectKinds.h"
#include "Platform/Export.h"

// Settings chunks that come from a person's file. User-interface thread; everything is tried on instances
// made for the purpose, which takes up to a few milliseconds each. Throws std::bad_alloc.
namespace Corvo::DSP {

// Whether effects of this kind read `chunk`. SetSettingsChunk leaves everything as it was, without a word,
// when they do not.
DSP_API bool TakesSettings(const EffectKind& kind, const std::vector<std::uint8_t>& chunk);

// The label of the first parameter of `effect`, which is of this kind, whose stored value its control cannot
// give and neither a preset nor a new instance has; empty when there is none. Parameters without a
// GetParamPlain of their own are never out of range.
DSP_API std::string ParameterOutOfRange(const EffectKind& kind, CorvoEffectBase& effect);

}  // namespace Corvo::DSP
