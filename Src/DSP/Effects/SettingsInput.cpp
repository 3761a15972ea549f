#include "DSP/Effects/SettingsInput.h"

#include <algorithm>
#include <memory>

namespace Corvo::DSP {
namespace {

std::unique_ptr<CorvoEffectBase> MakeAt(const EffectKind& kind, float normalised) {
    auto effect = kind.make();
    // Again: a list may have moved what was set before it.
    for (int pass = 0; pass < 2; ++pass)
        for (int i = 0; i < effect->GetParamCount(); ++i) effect->SetParam(i, normalised, false);
    return effect;
}

std::vector<std::uint8_t> StateOf(CorvoEffectBase& effect) {
    std::vector<std::uint8_t> state;
    effect.GetSettingsChunk(state);
    return state;
}

// The stored values of the real parameters.
std::vector<float> PlainValues(const CorvoEffectBase& effect, std::size_t count) {
    std::vector<float> values;
    while (values.size() < count) values.push_back(effect.GetParamPlain(static_cast<int>(values.size())));
    return values;
}

}  // namespace

bool TakesSettings(const EffectKind& kind, const std::vector<std::uint8_t>& chunk) {
    // A chunk that is read cannot leave both as they were: they differ.
    return std::ranges::any_of(std::vector{0.0f, 1.0f}, [&](float normalised) {
        const auto effect = MakeAt(kind, normalised);
        const auto before = StateOf(*effect);
        effect->SetSettingsChunk(chunk);
        return StateOf(*effect) != before;
    });
}

std::string ParameterOutOfRange(const EffectKind& kind, CorvoEffectBase& effect) {
    const auto count = static_cast<std::size_t>(effect.GetParamCountReal());
    // Presets and new instances may go beyond what controls can give.
    const auto other = kind.make();
    std::vector known{PlainValues(*MakeAt(kind, 0.0f), count), PlainValues(*MakeAt(kind, 1.0f), count),
                      PlainValues(*other, count)};
    for (int preset = 0; preset < other->NumPresets(); ++preset) {
        other->SetPreset(preset);
        known.push_back(PlainValues(*other, count));
    }
    const auto values = PlainValues(effect, count);
    const int sides = effect.SeparateLeftRightControls() == 0 ? 2 : 1;
    for (int i = 0; i < effect.GetParamCount(); ++i) {
        const auto parameter = effect.Describe(i);
        for (int side = 0; side < sides; ++side) {
            const auto real = static_cast<std::size_t>(parameter.real + side);
            const auto [least, most] =
                std::ranges::minmax(known, {}, [real](const auto& each) { return each[real]; });
            if (!(values[real] >= least[real] && values[real] <= most[real])) return parameter.label;
        }
    }
    return "";
}

}  // namespace Corvo::DSP
