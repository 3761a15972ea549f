#pragma once

#include <functional>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "DSP/Effects/EffectKinds.h"

namespace docs {

using Corvo::DSP::CorvoEffectBase;
using Corvo::DSP::EffectKind;

// An effect prepared for stereo blocks of doubles, with settings as dsphost takes them:
// "preset=Long Echo, Mix=40 %". Throws std::invalid_argument for what the effect does not have.
std::unique_ptr<CorvoEffectBase> Prepared(const EffectKind& kind, std::string_view settings, int rate);

// Draws what an effect does to a test signal at 48 kHz. The first line says how it is measured, each further
// one is a curve, "label: settings":
//   impulse SECONDS     level of what follows an impulse, over time
//   level               level of a steady sound, out over in
//   transfer            sample out over sample in
//   response            gain over frequency; for settings at which the effect does not move
//   gain SECONDS        gain over time, of both sides
//   sweep PARAMETER     gain over the parameter's range, of both sides
// Throws std::invalid_argument for anything else.
std::string DrawMeasurement(const EffectKind& kind, std::string_view text);

// Nanoseconds that a frame of stereo floats takes here, in blocks of 512 of noise: with settings as above,
// and for whatever processes `frames` frames of them.
double NanosecondsPerFrame(const EffectKind& kind, std::string_view settings);
double NanosecondsPerFrame(const std::function<void(float* samples, int frames)>& process);

}  // namespace docs
