#include "EffectParameters.h"

#include <algorithm>
#include <cmath>
#include <stdexcept>

#include "Errors.h"
#include "Text.h"

namespace dsphost {
namespace {

using Corvo::EffectParameterType;

constexpr std::string_view kNormalisedMark = "n:";

// "4 x" and "4" name the same choice when the unit is "x".
bool SameChoice(std::string_view shown, std::string_view text, std::string_view unit) {
    shown = Trimmed(shown), text = Trimmed(text), unit = Trimmed(unit);
    const auto bare = [&](std::string_view whole) {
        const bool ends = !unit.empty() && whole.size() > unit.size() &&
                          SameNoCase(whole.substr(whole.size() - unit.size()), unit);
        return ends ? Trimmed(whole.substr(0, whole.size() - unit.size())) : whole;
    };
    return SameNoCase(bare(shown), bare(text));
}

// Both ends as numbers, when the effect shows plain numbers there.
std::string RangeText(Effect& scratch, const EffectParameter& parameter) {
    const std::string low = TextAt(scratch, parameter, 0.0f), high = TextAt(scratch, parameter, 1.0f);
    return std::string(Trimmed(low)) + " to " + std::string(Trimmed(high));
}

// Parsers stop where they understand no more: words, and what follows a number, count when the effect shows
// them too. "-inf" for "-Inf. dB", "500 ms" for "499 ms", "1/4" for "1/4 (500 ms)".
bool SaysTheSame(std::string_view shown, std::string_view text, std::string_view unit) {
    shown = Trimmed(shown);
    const std::size_t length = NumberLength(text);
    const std::string_view rest = Trimmed(text.substr(length));
    return StartsWithNoCase(shown, text) ||
           (length > 0 && (rest.empty() || SameNoCase(rest, Trimmed(unit)) ||
                           SameNoCase(rest, Trimmed(shown.substr(NumberLength(shown))))));
}

bool BeyondRange(Effect& scratch, const EffectParameter& parameter, double number, float normalised) {
    if (normalised > 0.0f && normalised < 1.0f) return false;
    const std::string text = TextAt(scratch, parameter, normalised);
    const auto length = NumberLength(Trimmed(text));
    const auto end = ToNumber(Trimmed(text).substr(0, length));
    const double slack = end ? 1e-3 * std::max(1.0, std::abs(*end)) : 0.0;
    if (!end) return false;
    return normalised >= 1.0f ? number > *end + slack : number < *end - slack;
}

std::vector<std::uint8_t> StateOf(Effect& effect) {
    std::vector<std::uint8_t> chunk;
    effect.GetSettingsChunk(chunk);
    return chunk;
}

}  // namespace

std::unique_ptr<Effect> MakeEffect(EffectFactory factory) {
    auto effect = factory();
    if (effect->NumPresets() > 0) effect->SetPreset(effect->GetDefaultPreset());
    return effect;
}

std::unique_ptr<Effect> CopyEffect(EffectFactory factory, Effect& effect) {
    auto copy = factory();
    copy->SetSettingsChunk(StateOf(effect));
    return copy;
}

void UseChunk(EffectFactory factory, Effect& effect, const std::vector<std::uint8_t>& chunk,
              const std::string& name) {
    const auto before = StateOf(effect);
    if (chunk.size() <= before.size()) effect.SetSettingsChunk(chunk);
    // Effects ignore what they cannot read without a word.
    if (chunk.size() > before.size() || (StateOf(effect) == before && chunk != before))
        throw UserError(name + ": " + std::to_string(chunk.size()) + " bytes are not settings of " +
                        effect.GetName() + ", which have " + std::to_string(before.size()));
    // A value that a parameter can have stays what it is when it is set again.
    const auto copy = CopyEffect(factory, effect);
    for (const auto& parameter : DescribeParameters(factory)) {
        const float value = copy->GetParam(parameter.index);
        if (value >= 0.0f && value <= 1.0f) copy->SetParam(parameter.index, value, false);
        if (!(value >= 0.0f && value <= 1.0f) || StateOf(*copy) != StateOf(effect))
            throw UserError(name + ": is not settings of " + effect.GetName() + ": " + parameter.label +
                            " is out of range");
    }
}

std::vector<EffectParameter> DescribeParameters(EffectFactory factory) {
    const auto effect = MakeEffect(factory);
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

std::vector<const EffectParameter*> FindParameters(const std::vector<EffectParameter>& all,
                                                   std::string_view label, const std::string& effectName) {
    label = Trimmed(label);
    std::vector<const EffectParameter*> found;
    for (const auto& parameter : all)
        if (SameNoCase(parameter.label, label)) found.push_back(&parameter);
    if (found.empty())
        for (const auto& parameter : all)
            if (SameNoCase(parameter.name, label)) found.push_back(&parameter);
    if (!found.empty()) return found;
    std::vector<std::string> labels;
    for (const auto& parameter : all)
        for (const auto& name : {parameter.name, parameter.label})
            if (std::ranges::find(labels, name) == labels.end()) labels.push_back(name);
    const std::string shown = Shortened(label, kLongestQuote);
    throw UserError(effectName + " has no parameter \"" + shown + "\"; " + Suggestion(shown, labels));
}

float ParseValue(EffectFactory factory, Effect& effect, const EffectParameter& parameter,
                 std::string_view text, std::string& warning) {
    text = Trimmed(text);
    const std::string asked =
        effect.GetName() + ": " + parameter.label + " cannot be \"" + Shortened(text, kLongestQuote) + "\"; ";
    if (text.starts_with(kNormalisedMark)) {
        const auto number = ToNumber(text.substr(kNormalisedMark.size()));
        if (!number || *number < 0.0 || *number > 1.0)
            throw UserError(asked + "n: takes a normalised value from 0 to 1, such as n:0.37");
        return static_cast<float>(*number);
    }
    const auto scratch = CopyEffect(factory, effect);
    std::vector<std::string> choices;
    for (const auto& choice : parameter.choices) {
        if (SameChoice(choice.text, text, parameter.unit)) return choice.normalised;
        choices.push_back(choice.text);
    }
    const std::string accepted = (choices.empty() ? "accepted: " + RangeText(*scratch, parameter)
                                                  : "accepted: " + Joined(choices, ", ")) +
                                 ", or a normalised value such as n:0.5";
    const std::size_t length = NumberLength(text);
    const bool list = parameter.type == EffectParameterType::List;
    if (text.empty() || (!choices.empty() && (list || length == 0))) throw UserError(asked + accepted);
    float value = -1.0f;
    try {
        value = effect.GetParamValueNormalizedFromText(parameter.index, std::string(text));
    } catch (const std::invalid_argument&) {
        throw UserError(asked + accepted);
    } catch (const std::out_of_range&) {
        throw UserError(asked + accepted);
    }
    // Beyond the range parsers limit, or say by how much.
    if (length > 0 && std::isfinite(value)) value = std::clamp(value, 0.0f, 1.0f);
    if (!(value >= 0.0f && value <= 1.0f) ||
        !SaysTheSame(TextAt(*scratch, parameter, value), text, parameter.unit))
        throw UserError(asked + accepted);
    if (const auto number = ToNumber(text.substr(0, length));
        number && BeyondRange(*scratch, parameter, *number, value))
        warning = effect.GetName() + ": " + parameter.label + "=" + std::string(text) +
                  " is beyond the range; " + std::string(Trimmed(TextAt(*scratch, parameter, value))) +
                  " is used";
    return value;
}

}  // namespace dsphost
