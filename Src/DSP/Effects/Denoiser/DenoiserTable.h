#pragma once

#include "DSP/Effects/Denoiser/DenoiserEngine.h"
#include "DSP/Effects/Denoiser/DenoiserProcessor.h"
#include "DSP/Effects/Parameters/EffectTable.h"

namespace Corvo::DSP::Denoising {

using DenoiserPrivate::Settings;

// Names, texts, presets; the chunk is the effect's own.
const EffectTable& Table();
// Between words of the settings and the values that a chunk holds; a value out of range becomes the nearest.
double PlainValue(const ParameterRow& row, std::int32_t word);
std::int32_t WordOf(const ParameterRow& row, double plain);
// Words out of range act like the nearest.
EngineSettings EngineSettingsOf(const Settings& settings);

}  // namespace Corvo::DSP::Denoising
