#pragma once

#include "DSP/Effects/Tremolo/Autovol.h"

namespace Corvo::DSP::AutovolPresets {

struct Preset {
    const char* name;
    AutovolPrivate::_transform_props settings;
};

// What older versions kept in the words that nothing reads any more.
inline constexpr std::array<std::int32_t, 8> kUnused{}, kSoft{-900, -900, 20, 20, 2000, 2000, -960, -960},
    kLoud{-300, -300, 20, 20, 4000, 4000, -960, -960};

// clang-format off
inline constexpr std::array kPresets{
    //     name                   depth         mix           rate        ring mod invert  reserved out gain  reserved
    Preset{"AutoVol",             {{1000, 1000}, {1000, 1000}, {600, 600}, {0, 0}, {0, 0}, kSoft,   { 0,  0}, {0, 0}}},
    Preset{"Left phase shift",    {{   0,    0}, {1000, 1000}, { 50,  50}, {0, 0}, {1, 0}, kSoft,   { 0,  0}, {0, 0}}},
    Preset{"Fast Tremolo",        {{1000, 1000}, { 509,  509}, {831, 831}, {0, 0}, {0, 0}, kUnused, { 0,  0}, {0, 0}}},
    Preset{"Hard Pan",            {{ 671,  671}, { 500,  500}, {144, 144}, {0, 0}, {0, 0}, kUnused, { 0,  0}, {0, 0}}},
    Preset{"Shimmering",          {{ 500,  500}, { 500,  500}, {584, 584}, {0, 0}, {0, 0}, kUnused, { 0,  0}, {0, 0}}},
    Preset{"Bad Ring Mod",        {{1000, 1000}, {1000, 1000}, {368, 368}, {0, 0}, {0, 0}, kUnused, {-8, -8}, {0, 0}}},
    Preset{"Broken Volume Pedal", {{1000, 1000}, {1000, 1000}, {  0,   0}, {0, 0}, {0, 0}, kUnused, { 0,  0}, {0, 0}}},
    Preset{"Robot",               {{1000, 1000}, {1000, 1000}, {600, 600}, {1, 1}, {0, 0}, kLoud,   { 0,  0}, {0, 0}}},
};
// clang-format on

}  // namespace Corvo::DSP::AutovolPresets
