#include "DSP/Effects/EffectKinds.h"

#include <algorithm>
#include <cstdint>
#include <vector>

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

namespace Corvo::DSP {
namespace {

template <typename Effect>
std::unique_ptr<CorvoEffectBase> Make() {
    return std::make_unique<Effect>();
}

// One line registers an effect with every front-end.
// clang-format off
constexpr EffectKind kKinds[]{
    {"Gain",        Make<GainEfx::GainEfx>},
    {"Tremolo",     Make<Autovol>},
    {"Chorus",      Make<Chorus>},
    {"Echo",        Make<Echo>},
    {"Valvex",      Make<TubeDistorsion>},
    {"Phaser",      Make<Phaser>},
    {"Pitch Shift", Make<PitchShift>},
    {"Compressor",  Make<Compressor>},
    {"Reverb",      Make<Reverb>},
    {"Denoiser",    Make<DenoiserProcessor>},
    {"Cantrix",     Make<PitchDoctor>},
};
// clang-format on

char Lower(char letter) {
    return letter >= 'A' && letter <= 'Z' ? static_cast<char>(letter - 'A' + 'a') : letter;
}

}  // namespace

std::unique_ptr<CorvoEffectBase> EffectKind::MakeReady() const {
    auto effect = make();
    if (effect->NumPresets() > 0) effect->SetPreset(effect->GetDefaultPreset());
    return effect;
}

std::unique_ptr<CorvoEffectBase> EffectKind::Copy(CorvoEffectBase& effect) const {
    std::vector<std::uint8_t> chunk;
    effect.GetSettingsChunk(chunk);
    auto copy = make();
    copy->SetSettingsChunk(chunk);
    copy->SetHostCallback(effect.GetHostCallback());
    return copy;
}

std::span<const EffectKind> EffectKinds() { return kKinds; }

const EffectKind* FindEffectKind(std::string_view name) {
    const auto* const found = std::ranges::find_if(kKinds, [name](const EffectKind& kind) {
        return std::ranges::equal(std::string_view(kind.name), name, {}, Lower, Lower);
    });
    return found == std::end(kKinds) ? nullptr : found;
}

}  // namespace Corvo::DSP
