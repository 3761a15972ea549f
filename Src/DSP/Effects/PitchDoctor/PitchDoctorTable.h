#pragma once

#include <cstddef>

#include "DSP/Effects/Parameters/EffectTable.h"
#include "DSP/Effects/PitchDoctor/PitchDoctor.h"
#include "DSP/Effects/PitchDoctor/PitchDoctorEngine.h"

namespace Corvo::DSP {

constexpr std::array<float, 4> kLowestPitches{55.0f, 75.0f, 110.0f, 160.0f};
constexpr int kLowestPitchParameter = 25;

const EffectTable& PitchDoctorTable();

// The settings with every value within its range.
PitchDoctorSettings WithinRanges(const PitchDoctorSettings& settings);
// What settings within their ranges mean.
PitchDoctorVoice VoiceOf(const PitchDoctorSettings& settings);
// Place of the lowest pitch among kLowestPitches.
std::size_t LowestPitchOf(const PitchDoctorSettings& settings);

}  // namespace Corvo::DSP
