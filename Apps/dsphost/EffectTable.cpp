#include "EffectTable.h"

#include <algorithm>
#include <iterator>

#include "DSP/Effects/Chorus/Chorus.h"
#include "DSP/Effects/Compressor/Compressor.h"
#include "DSP/Effects/Echo/Echo.h"
#include "DSP/Effects/Gain/GainEfx.h"
#include "DSP/Effects/Phaser/Phaser.h"
#include "DSP/Effects/PitchDoctor/PitchDoctor.h"
#include "DSP/Effects/PitchShift/PitchShift.h"
#include "DSP/Effects/Reverb/Reverb.h"
#include "DSP/Effects/Tremolo/Autovol.h"
#include "DSP/Effects/Tube/TubeDistorsion.h"
#include "EffectElement.h"
#include "EqualiserElement.h"

namespace dsphost {
namespace {

template <typename T>
std::unique_ptr<Effect> Make() {
    return std::make_unique<T>();
}

// One line registers an effect; it goes by its GetName().
// clang-format off
constexpr EffectFactory kEffects[]{
    Make<Corvo::DSP::GainEfx::GainEfx>,
    Make<Corvo::DSP::Autovol>,
    Make<Corvo::DSP::Chorus>,
    Make<Corvo::DSP::Echo>,
    Make<Corvo::DSP::TubeDistorsion>,
    Make<Corvo::DSP::Phaser>,
    Make<Corvo::DSP::PitchShift>,
    Make<Corvo::DSP::PitchDoctor>,
    Make<Corvo::DSP::Compressor>,
    Make<Corvo::DSP::Reverb>,
};
// clang-format on

}  // namespace

std::span<const EffectFactory> EffectFactories() { return kEffects; }

std::span<const std::string> EffectNames() {
    static const auto names = [] {
        std::vector<std::string> all;
        for (const auto make : kEffects) all.push_back(make()->GetName());
        return all;
    }();
    return names;
}

std::span<const ElementKind> ElementKinds() {
    static const auto kinds = [] {
        std::vector<ElementKind> all;
        for (const auto make : kEffects)
            all.push_back({make()->GetName(), [make](std::string_view settings) {
                               return std::make_unique<EffectElement>(make, settings);
                           }});
        // What is no effect but can stand in a chain: one line each.
        all.push_back({EqualiserElement::kName, std::make_unique<EqualiserElement, std::string_view>});
        return all;
    }();
    return kinds;
}

}  // namespace dsphost
