#include "Support/EffectCases.h"

#include <array>

#include "DSP/Effects/Chorus/Chorus.h"
#include "DSP/Effects/Compressor/Compressor.h"
#include "DSP/Effects/Denoiser/DenoiserProcessor.h"
#include "DSP/Effects/Echo/Echo.h"
#include "DSP/Effects/Gain/GainEfx.h"
#include "DSP/Effects/Phaser/Phaser.h"
#include "DSP/Effects/PitchDoctor/PitchDoctor.h"
#include "DSP/Effects/PitchShift/PitchShift.h"
#include "DSP/Effects/Reverb/Reverb.h"
#include "DSP/Effects/Tremolo/Autovol.h"
#include "DSP/Effects/Tube/TubeDistorsion.h"

namespace TestSupport {
namespace {

using namespace Corvo::DSP;

template <typename Effect>
std::unique_ptr<CorvoEffectBase> Make() {
    return std::make_unique<Effect>();
}

constexpr std::array kEffects{
    EffectCase{.name = "Gain", .make = Make<GainEfx::GainEfx>, .plainFloats = true, .textTruncates = true},
    EffectCase{
        .name = "Compressor", .make = Make<Compressor>, .linkedParameters = true, .shortestChunk = 16100},
    EffectCase{.name = "Tremolo", .make = Make<Autovol>, .cuts = Cuts::PhasePerBlock},
    EffectCase{.name = "Chorus", .make = Make<Chorus>, .cuts = Cuts::PhasePerBlock},
    EffectCase{.name = "Phaser", .make = Make<Phaser>, .phaseRunsOn = true},
    EffectCase{
        .name = "Echo", .make = Make<Echo>, .mayGrow = true, .linkedParameters = true, .shortestChunk = 92},
    EffectCase{.name = "Tube distortion", .make = Make<TubeDistorsion>, .bounded = true},
    EffectCase{.name = "Pitch Shift",
               .make = Make<PitchShift>,
               .cuts = Cuts::Exempt,
               .splices = true,
               .engineAllocates = "the engine is locked against edits and allocates for an automated pitch",
               .textTruncates = true},
    EffectCase{.name = "Reverb", .make = Make<Reverb>},
    EffectCase{
        .name = "Denoiser", .make = Make<DenoiserProcessor>, .splices = true, .bounded = true, .loadsOff = 1},
    EffectCase{.name = "Cantrix", .make = Make<PitchDoctor>, .splices = true},
};

}  // namespace

std::span<const EffectCase> AllEffects() { return kEffects; }

}  // namespace TestSupport
