#include "Support/EffectCases.h"

#include <algorithm>
#include <array>
#include <stdexcept>

#include "DSP/Effects/Chorus/Chorus.h"
#include "DSP/Effects/Compressor/Compressor.h"
#include "DSP/Effects/Echo/Echo.h"
#include "DSP/Effects/Gain/GainEfx.h"
#include "DSP/Effects/Phaser/Phaser.h"
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
    EffectCase{.name = "Gain",
               .make = Make<GainEfx::GainEfx>,
               .otherBuild = OtherBuild::Relative,
               .otherBuildReason = "sine and cosine of the pan law",
               .plainFloats = true,
               .textTruncates = true},
    EffectCase{.name = "Compressor",
               .make = Make<Compressor>,
               .otherBuild = OtherBuild::Relative,
               .otherBuildReason = "powers behind the curve and the coefficients",
               .linkedParameters = true,
               .shortestChunk = 16100},
    EffectCase{.name = "Tremolo",
               .make = Make<Autovol>,
               .cuts = Cuts::PhasePerBlock,
               .otherBuild = OtherBuild::Relative,
               .otherBuildReason = "the oscillator's sine and the gain's power"},
    EffectCase{.name = "Chorus",
               .make = Make<Chorus>,
               .cuts = Cuts::PhasePerBlock,
               .otherBuild = OtherBuild::Relative,
               .otherBuildReason = "the oscillator's sine and the levels' powers"},
    EffectCase{.name = "Phaser",
               .make = Make<Phaser>,
               .otherBuild = OtherBuild::Relative,
               .otherBuildReason = "the oscillator's sine"},
    EffectCase{.name = "Echo",
               .make = Make<Echo>,
               .otherBuild = OtherBuild::Relative,
               .otherBuildReason = "powers of the gains",
               .mayGrow = true,
               .linkedParameters = true,
               .shortestChunk = 92},
    EffectCase{.name = "Tube distortion",
               .make = Make<TubeDistorsion>,
               .otherBuild = OtherBuild::Relative,
               .otherBuildReason = "tangents and sines of the filters and of the shape"},
    EffectCase{.name = "Pitch Shift",
               .make = Make<PitchShift>,
               .cuts = Cuts::Exempt,
               .otherBuild = OtherBuild::Character,
               .otherBuildReason = "the engine's splices are choices between near equals",
               .engineAllocates = "the engine grows its own buffers and is locked against edits",
               .startsBlank = true,
               .textTruncates = true},
    EffectCase{.name = "Reverb",
               .make = Make<Reverb>,
               .otherBuild = OtherBuild::Relative,
               .otherBuildReason = "powers of the gains, the input filter's design"},
};

}  // namespace

std::span<const EffectCase> AllEffects() { return kEffects; }

const EffectCase& FindEffect(const std::string& name) {
    const auto found = std::ranges::find(kEffects, name, &EffectCase::name);
    if (found == kEffects.end()) throw std::invalid_argument("no effect is called " + name);
    return *found;
}

}  // namespace TestSupport
