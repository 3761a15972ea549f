#pragma once

#include "DSP/Effects/Phaser/Phaser.h"

namespace Corvo::DSP::PhaserPresets {

struct Preset {
    const char* name;
    PhaserSettings settings;
};

// clang-format off
inline constexpr std::array kPresets{
    //     name                    rate          feedback wet      maximum   minimum   width   stages
    Preset{"Moderate phasing",     {0.05f,        0.7f,   0.5f,    1600.0f,   440.0f,  0.25f,  0}},
    Preset{"Moderate uncolored",   {0.05f,        0.7f,   1.0f,    1600.0f,   440.0f,  0.25f,  0}},
    Preset{"Slow",                 {1.0f / 60.0f, 0.56f,  0.5f,    4170.0f,   440.0f,  0.1f,   0}},
    Preset{"Slow uncolored",       {1.0f / 60.0f, 0.56f,  1.0f,    4170.0f,   440.0f,  0.1f,   0}},
    Preset{"Fast",                 {1.0f / 3.0f,  0.56f,  0.5f,    4170.0f,   440.0f,  0.1f,   0}},
    Preset{"High feedback",        {0.05f,        0.97f,  0.5f,    1600.0f,   440.0f,  0.25f,  0}},
    Preset{"Engine",               {1.0f / 60.0f, 0.92f,  0.65f,   3020.0f,    60.0f,  0.065f, 0}},
    Preset{"Aliens",               {2.0f / 3.0f,  0.8f,   0.5f,    7900.0f,   160.0f,  0.5f,   0}},
    Preset{"21 Circuits Of Chaos", {0.168f,       0.685f, 0.303f,   680.0f,  4120.0f,  0.199f, 0}},
    Preset{"Phase 6",              {0.082f,       0.581f, 0.5f,     770.0f,  7610.0f,  0.25f,  0}},
    Preset{"Philter Faze",         {0.074f,       0.698f, 0.5f,    4410.0f,  4420.0f,  0.249f, 0}},
    Preset{"Eight Stones",         {0.096f,       0.411f, 0.5f,     210.0f,  6200.0f,  0.25f,  0}},
    Preset{"Medium Rare",          {0.151f,       0.296f, 0.5f,     210.0f,  1730.0f,  0.25f,  0}},
    Preset{"Down Low",             {0.041f,       0.824f, 0.5f,     170.0f,  1630.0f,  0.25f,  0}},
    Preset{"Lofi Phase",           {0.104f,       0.219f, 0.5f,     320.0f,  1320.0f,  0.249f, 0}},
};
// clang-format on

}  // namespace Corvo::DSP::PhaserPresets
