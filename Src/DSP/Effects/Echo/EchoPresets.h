#pragma once

#include <array>

#include "DSP/Effects/Echo/Echo.h"
#include "DSP/Effects/Echo/EchoDelay.h"
#include "DSP/Effects/Parameters/EffectTable.h"

namespace Corvo::DSP::EchoPresets {

// Both sides are alike in all of them.
struct Preset {
    const char* name;
    std::int32_t decay, mix, ms, delayGain, outGain;
    std::int32_t reserved;  // of the first revision, which had more settings; 0 where it was not in it

    constexpr EchoPrivate::_transform_props Settings() const {
        EchoPrivate::_transform_props props{.decay = {decay, decay},
                                            .mix = {mix, mix},
                                            .depth = {ms, ms},
                                            .delayGain = {delayGain, delayGain},
                                            .reserved = {},
                                            .outGain = {outGain, outGain},
                                            .reserved2 = {},
                                            .mode = EchoDelay::kLog,
                                            .modeCopy = EchoDelay::kLog};
        if (reserved != 0) props.reserved = {28, 28, -900, -900, 20, 20, reserved, reserved, -960, -960};
        return props;
    }
};

// clang-format off
constexpr std::array<Preset, 10> kPresets{{
    // name               decay   mix    ms  delay  out reserved
    {"Echo",               -70, 1000,  300, -300,  60, 2000},
    {"Single delay",      -300, 1000,  500,   -5,  60, 2000},
    {"Long Echo",          -70, 1000, 2000, -300,  60, 4000},
    {"Cosmic Feedback",    -19, 1238,  140, -153,   0, 0},
    {"Intergalactic",      -66, 1000,   30,  -23,   0, 0},
    {"Medium Echo Verb",  -148, 1000,  230, -165,  40, 0},
    {"Lightly Analogued", -149,  899,  230, -226,  40, 0},
    {"The Follower",      -180, 1000,  359, -112,  51, 0},
    {"Vamping Echo",       -75,  906,  280,  -63,   0, 0},
    {"Off",               -300, 1000,  500, -300,  60, 2000},
}};
// clang-format on
inline constexpr auto kPresetData = [] {
    std::array<EchoPrivate::_transform_props, kPresets.size()> data{};
    for (std::size_t i = 0; i < data.size(); ++i) data[i] = kPresets[i].Settings();
    return data;
}();

// What the presets stand for: their delays as words of their mode.
inline std::vector<PresetRow> AppliedPresets() {
    std::vector<PresetRow> rows;
    for (const auto& preset : kPresets) {
        auto props = preset.Settings();
        for (auto& depth : props.depth) depth = EchoDelay::Word(EchoDelay::kLog, depth);
        rows.push_back({preset.name, WordsOf(props)});
    }
    return rows;
}

}  // namespace Corvo::DSP::EchoPresets
