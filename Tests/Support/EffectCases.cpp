#include "Support/EffectCases.h"

#include <array>

namespace TestSupport {
namespace {

constexpr std::array kEffects{
    EffectCase{.name = "Gain", .plainFloats = true, .textTruncates = true},
    EffectCase{.name = "Compressor", .linkedParameters = true, .shortestChunk = 16100},
    EffectCase{.name = "Tremolo", .cuts = Cuts::PhasePerBlock},
    EffectCase{.name = "Chorus", .cuts = Cuts::PhasePerBlock},
    EffectCase{.name = "Phaser", .phaseRunsOn = true},
    EffectCase{.name = "Echo", .mayGrow = true, .linkedParameters = true, .shortestChunk = 92},
    EffectCase{.name = "Tube distortion", .kind = "Valvex", .bounded = true},
    EffectCase{.name = "Pitch Shift",
               .cuts = Cuts::Exempt,
               .splices = true,
               .engineAllocates = "the engine is locked against edits and allocates for an automated pitch",
               .textTruncates = true},
    EffectCase{.name = "Reverb"},
    EffectCase{.name = "Denoiser", .splices = true, .bounded = true, .loadsOff = 1},
    EffectCase{.name = "Cantrix", .splices = true},
};

}  // namespace

std::span<const EffectCase> AllEffects() { return kEffects; }

}  // namespace TestSupport
