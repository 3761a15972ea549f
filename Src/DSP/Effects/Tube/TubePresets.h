#pragma once

#include <array>

namespace Corvo::DSP::TubePresets {

enum Group : int { kGuitar, kClean, kHeavy, kHeavier, kDrums, kVocal };

constexpr std::array kGroupNames{"Guitar",           "Guitar - Clean", "Guitar - Heavy",
                                 "Guitar - Heavier", "Drums",          "Vocal"};

// Normalised; both sides are alike in all of them.
struct Preset {
    const char* name;
    std::array<float, 5> values;  // boost, drive, tone, function, oversampling
    Group group;                  // where the XY editor shows it
};

// clang-format off
constexpr std::array<Preset, 24> kPresets{{
    // name                          boost   drive   tone    function oversampling
    {"(Default)",                   {0.0f,   0.0f,   1.0f,   0.0f,   0.0f},   kGuitar},
    {"Tube Distortion",             {0.5f,   0.3f,   1.0f,   0.0f,   0.0f},   kGuitar},
    {"Oversampled Distortion",      {0.5f,   0.3f,   1.0f,   0.0f,   0.3f},   kGuitar},
    {"70s Muff",                    {0.591f, 0.774f, 0.0f,   0.545f, 0.442f}, kHeavier},
    {"BRMC Bass Fuzz",              {0.335f, 0.526f, 0.0f,   0.0f,   0.199f}, kHeavy},
    {"Bass Overdrive",              {0.128f, 0.437f, 0.245f, 0.0f,   0.321f}, kGuitar},
    {"Blues Drive",                 {0.2f,   0.363f, 0.756f, 0.848f, 0.243f}, kGuitar},
    {"Classic Stratortion",         {0.0f,   0.007f, 0.819f, 0.526f, 0.583f}, kGuitar},
    {"Clean Boost",                 {0.899f, 0.0f,   1.0f,   1.0f,   0.0f},   kClean},
    {"Country Crunch",              {0.036f, 0.162f, 0.497f, 0.0f,   0.0f},   kClean},
    {"DI Bass",                     {0.0f,   0.929f, 0.0f,   0.453f, 0.0f},   kGuitar},
    {"Drum Kit Warmer",             {0.116f, 0.176f, 1.0f,   0.0f,   0.0f},   kDrums},
    {"Fuzz Box",                    {0.276f, 0.924f, 0.0f,   0.0f,   0.0f},   kHeavier},
    {"Marlo Fuzz",                  {0.26f,  0.542f, 0.512f, 0.526f, 0.0f},   kHeavier},
    {"Lofi Drum Kit Amp",           {0.059f, 0.872f, 0.061f, 0.342f, 0.738f}, kDrums},
    {"NY Vocal Grit",               {0.081f, 0.444f, 1.0f,   0.302f, 0.0f},   kVocal},
    {"Overstellar Tele Drive",      {0.311f, 0.124f, 0.756f, 0.0f,   0.0f},   kGuitar},
    {"Riffstortion",                {0.965f, 0.003f, 0.704f, 0.763f, 0.49f},  kHeavy},
    {"Slide Guitar Drive",          {0.738f, 0.25f,  0.276f, 0.142f, 0.0f},   kGuitar},
    {"Snare Warmth",                {0.092f, 0.224f, 1.0f,   0.21f,  0.0f},   kDrums},
    {"Strata Boost",                {0.859f, 0.0f,   0.829f, 0.555f, 0.726f}, kClean},
    {"Studio Vocal Howl",           {0.44f,  0.056f, 1.0f,   1.0f,   0.0f},   kVocal},
    {"Vocal Boost",                 {0.409f, 0.0f,   1.0f,   0.512f, 0.0f},   kVocal},
    {"Rage Oversampled Distorsion", {0.5f,   0.8f,   1.0f,   0.0f,   0.6f},   kHeavier},
}};
// clang-format on

}  // namespace Corvo::DSP::TubePresets
