#pragma once

#include "DSP/Effects/Denoiser/DenoiserProcessor.h"

namespace Corvo::DSP::DenoiserPresets {

using DenoiserPrivate::Settings;

enum : std::int32_t { kLearned, kFollowing, kAdaptive };
enum : std::int32_t { kThreeSizes, kTwoSizes, k2048, k1024 };
enum : std::int32_t { kSpeech, kMusic };
enum : std::int32_t { kOutput, kResidue };
constexpr std::int32_t kMaskedOff = 300;
constexpr Settings::Bands kNoGain{}, kWhole{600, 600, 600, 600, 600, 600, 600, 600};

struct Preset {
    const char* name;
    Settings settings;
};

// clang-format off
inline constexpr std::array kPresets{
    //                               profile     learn clear reduction sensitivity detail whitening masked     fftSize      material listen    mix   gains    ranges
    Preset{"(Default)",             {kAdaptive,  0, 0, 250,  7, 120,   0, kMaskedOff, kThreeSizes, kSpeech, kOutput,  1000, kNoGain, kWhole}},
    Preset{"Voice, gentle",         {kAdaptive,  0, 0, 120,  7,  90,   0, kMaskedOff, kThreeSizes, kSpeech, kOutput,  1000, kNoGain, kWhole}},
    Preset{"Voice, strong",         {kAdaptive,  0, 0, 300, 20, 120,   0, kMaskedOff, kThreeSizes, kSpeech, kOutput,  1000, kNoGain, kWhole}},
    Preset{"Live voice",            {kAdaptive,  0, 0, 180,  7, 120,   0, kMaskedOff, k1024,       kSpeech, kOutput,  1000, kNoGain, kWhole}},
    Preset{"Music, gentle",         {kAdaptive,  0, 0, 100,  7, 120,   0, kMaskedOff, kThreeSizes, kMusic,  kOutput,  1000, kNoGain, kWhole}},
    Preset{"Tape hiss",             {kLearned,   0, 0, 250,  7, 120,   0, kMaskedOff, kThreeSizes, kMusic,  kOutput,  1000,
                                     {0, 0, 0, 0, 0, 0, 20, 20}, {200, 200, 200, 600, 600, 600, 600, 600}}},
    Preset{"Hum and buzz",          {kAdaptive,  0, 0, 350,  7, 120,   0, kMaskedOff, kThreeSizes, kMusic,  kOutput,  1000, kNoGain, kWhole}},
    Preset{"Air and fan",           {kFollowing, 0, 0, 250,  7, 120,   0, kMaskedOff, kThreeSizes, kSpeech, kOutput,  1000, kNoGain, kWhole}},
    Preset{"Film: even background", {kAdaptive,  0, 0, 150,  7, 120, 400, kMaskedOff, kThreeSizes, kSpeech, kOutput,  1000, kNoGain, kWhole}},
    Preset{"Check what is lost",    {kAdaptive,  0, 0, 250,  7, 120,   0, kMaskedOff, kThreeSizes, kSpeech, kResidue, 1000, kNoGain, kWhole}},
};
// clang-format on

}  // namespace Corvo::DSP::DenoiserPresets
