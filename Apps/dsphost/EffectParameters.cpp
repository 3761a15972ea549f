#include "EffectParameters.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <iterator>
#include <stdexcept>

#include "DSP/Effects/ParameterInput.h"
#include "Errors.h"
#include "Text.h"

namespace dsphost {
namespace {

using Corvo::EffectParameterType;

constexpr std::string_view kNormalisedMark = "n:";

std::vector<std::uint8_t> StateOf(Effect& effect) {
    std::vector<std::uint8_t> chunk;
    effect.GetSettingsChunk(chunk);
    return chunk;
}

using State = std::vector<std::uint8_t>;

std::uint32_t WordAt(const State& state, std::size_t place) {
    std::uint32_t word = 0;
    for (std::size_t i = 4; i-- > 0;) word = word << 8 | state[place + i];
    return word;
}

std::vector<State> PresetStates(const EffectKind& kind) {
    const auto effect = kind.make();
    std::vector<State> states;
    for (int i = 0; i < effect->NumPresets(); ++i) {
        effect->SetPreset(i);
        states.push_back(StateOf(*effect));
    }
    return states;
}

// Whether the words that the parameter sets, one for each side, lie between those of its ends or of presets,
// which may go beyond. Where it sets more it is no plain number, and the effect looks after it.
bool InRange(const EffectKind& kind, const EffectParameter& parameter, const State& state,
             std::vector<State> known) {
    constexpr int kSides = 2;
    const auto effect = kind.make();
    for (const float end : {0.0f, 1.0f}) {
        effect->SetParam(parameter.index, end, false);
        known.push_back(StateOf(*effect));
    }
    const State &low = known[known.size() - 2], &high = known.back();
    int set = 0, outside = 0;
    const std::size_t size = std::ranges::min(known, {}, &State::size).size();
    for (std::size_t place = 0; place + 4 <= std::min(size, state.size()); place += 4) {
        if (WordAt(low, place) == WordAt(high, place)) continue;
        // What parameters store as integers would be tiny as floats, or none.
        const auto isFloat = [&](const State& each) {
            return std::isnormal(std::bit_cast<float>(WordAt(each, place)));
        };
        const bool floats = isFloat(low) || isFloat(high);
        const auto number = [&](const State& each) {
            const auto word = WordAt(each, place);
            return floats ? static_cast<double>(std::bit_cast<float>(word)) : static_cast<std::int32_t>(word);
        };
        std::vector<double> numbers;
        std::ranges::transform(known, std::back_inserter(numbers), number);
        const auto [least, most] = std::ranges::minmax(numbers);
        ++set;
        outside += !(number(state) >= least && number(state) <= most);
    }
    return outside == 0 || set > kSides;
}

}  // namespace

void UseChunk(const EffectKind& kind, Effect& effect, const std::vector<std::uint8_t>& chunk,
              const std::string& name) {
    const auto before = StateOf(effect);
    const auto trial = kind.Copy(effect);
    trial->SetSettingsChunk(chunk);
    const auto state = StateOf(*trial);
    // Effects ignore what they cannot read, and what lies behind their settings, without a word.
    if (chunk.size() > state.size() || (state == before && chunk != before))
        throw UserError(name + ": " + std::to_string(chunk.size()) + " bytes are not settings of " +
                        effect.GetName() + ", which have " + std::to_string(before.size()));
    const auto presets = PresetStates(kind);
    for (const auto& parameter : DescribeParameters(kind))
        if (!InRange(kind, parameter, state, presets))
            throw UserError(name + ": is not settings of " + effect.GetName() + ": " + parameter.label +
                            " is out of range");
    effect.SetSettingsChunk(chunk);
}

std::vector<EffectParameter> DescribeParameters(const EffectKind& kind) {
    const auto effect = kind.MakeReady();
    std::vector<EffectParameter> parameters;
    for (int index = 0; index < effect->GetParamCount(); ++index)
        parameters.push_back({effect->Describe(index), index});
    return parameters;
}

std::string TextAt(Effect& effect, const EffectParameter& parameter, float normalised) {
    effect.SetParam(parameter.index, normalised, false);
    return Utf8(effect.GetParameterFormattedText(parameter.index, normalised));
}

std::string CurrentText(Effect& effect, const EffectParameter& parameter) {
    return Utf8(effect.GetParameterFormattedText(parameter.index, effect.GetParam(parameter.index)));
}

std::vector<const EffectParameter*> FindParameters(Effect& effect, const std::vector<EffectParameter>& all,
                                                   std::string_view label) {
    std::vector<const EffectParameter*> found;
    for (const int index : Corvo::DSP::FindParameters(effect, label))
        found.push_back(&all[static_cast<std::size_t>(index)]);
    if (!found.empty()) return found;
    std::vector<std::string> labels;
    for (const auto& parameter : all)
        for (const auto& name : {parameter.name, parameter.label})
            if (std::ranges::find(labels, name) == labels.end()) labels.push_back(name);
    const std::string shown = Shortened(Trimmed(label), kLongestQuote);
    throw UserError(effect.GetName() + " has no parameter \"" + shown + "\"; " + Suggestion(shown, labels));
}

float ParseValue(Effect& effect, const EffectParameter& parameter, std::string_view text,
                 std::string& warning) {
    text = Trimmed(text);
    const std::string asked =
        effect.GetName() + ": " + parameter.label + " cannot be \"" + Shortened(text, kLongestQuote) + "\"; ";
    if (text.starts_with(kNormalisedMark)) {
        const auto number = ToNumber(text.substr(kNormalisedMark.size()));
        if (!number || *number < 0.0 || *number > 1.0)
            throw UserError(asked + "n: takes a normalised value from 0 to 1, such as n:0.37");
        return static_cast<float>(*number);
    }
    try {
        const auto input = Corvo::DSP::ReadParameter(effect, parameter.index, text);
        if (input.limited)
            warning = effect.GetName() + ": " + parameter.label + "=" + std::string(text) +
                      " is beyond the range; " +
                      Corvo::DSP::TextAt(effect, parameter.index, input.normalised) + " is used";
        return input.normalised;
    } catch (const std::invalid_argument&) {
        throw UserError(asked + "accepted: " + Corvo::DSP::AcceptedTexts(effect, parameter.index) +
                        ", or a normalised value such as n:0.5");
    }
}

}  // namespace dsphost
