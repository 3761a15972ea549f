#pragma once

#include "DSP/Effects/Chorus/Chorus.h"

namespace Corvo::DSP::ChorusPresets {

struct Preset {
    const char* name;
    ChorusPrivate::_transform_props settings;
};

// What older versions kept in the words that nothing reads any more.
inline constexpr std::array<std::int32_t, 12> kUnused{}, kFilter{-900, -900, 20, 20, 2000, 2000, -960, -960};

// clang-format off
inline constexpr std::array kPresets{
    //     name                 frequency   delay         wet           dry           depth         reserved
    Preset{"Chorus",           {{ 80,  80}, { 400,  400}, { -44,  -44}, { -60,  -60}, {  30,   30}, kFilter}},
    Preset{"Flanger 1",        {{ 10,  10}, {  70,   70}, { -30,  -30}, { -30,  -30}, {1000, 1000}, kFilter}},
    Preset{"Flanger 2",        {{ 10,  10}, {  20,   20}, { -30,  -30}, { -30,  -30}, {1000, 1000}, kFilter}},
    Preset{"Stereo flanger",   {{ 39,  23}, {  20,   30}, { -30,  -30}, { -30,  -30}, {1000, 1000}, kFilter}},
    Preset{"13 Strings",       {{ 90,  90}, {  30,   30}, {   0,    0}, {   0,    0}, { 718,  718}, kUnused}},
    Preset{"ChOSCrus",         {{300, 300}, {  30,   30}, {   0,    0}, {   0,    0}, { 750,  750}, kUnused}},
    Preset{"Flange Bender",    {{203, 203}, {  30,   30}, { -39,  -39}, { -33,  -33}, {1000, 1000}, kUnused}},
    Preset{"Record Scratch",   {{200, 200}, {3750, 3750}, {   0,    0}, {-960, -960}, { 712,  712}, kUnused}},
    Preset{"The 4 Chorus Men", {{278, 278}, {  30,   30}, { -61,  -61}, {   0,    0}, {1000, 1000}, kUnused}},
    Preset{"Vintage Flange",   {{ 39,  39}, {  20,   20}, {   0,    0}, {   0,    0}, { 301,  301}, kUnused}},
    Preset{"Off",              {{ 10,  10}, {  70,   70}, {-960, -960}, {   0,    0}, {1000, 1000}, kFilter}},
};
// clang-format on

}  // namespace Corvo::DSP::ChorusPresets
