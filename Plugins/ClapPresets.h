#pragma once

#include "ClapPresetRecords.h"
#include "Core.h"

namespace Corvo::Plugins {

// The presets of all plug-ins in this file, as CLAP lists them: each once, for one channel and for two. Null
// for another factory's id, and where no plug-in has any.
const ClapPresetFactory* FindClapPresetFactory(const char* id);

// The number of the core's preset with the key; -1 where there is none.
int PresetOfClapKey(Core& core, const char* key);

}  // namespace Corvo::Plugins
