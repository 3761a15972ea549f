#pragma once

#include <string>

#include "DSP/Effects/EffectKinds.h"

namespace docs {

// An effect's name as a part of file names and addresses: "Pitch Shift" is "pitch-shift".
std::string FileName(const std::string& effect);
// The effect's page in Markdown: what a person wrote about it in `textPath`, and what its tables and
// measurements say. Throws for a text that does not fit the effect.
std::string EffectPage(const Corvo::DSP::EffectKind& kind, const std::string& textPath);

}  // namespace docs
