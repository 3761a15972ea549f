#include "EffectParameters.h"

#include <algorithm>
#include <stdexcept>

#include "DSP/Effects/ParameterInput.h"
#include "DSP/Effects/SettingsInput.h"
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

}  // namespace

void UseChunk(const EffectKind& kind, Effect& effect, const std::vector<std::uint8_t>& chunk,
              const std::string& name) {
    const auto trial = kind.make();
    trial->SetSettingsChunk(chunk);
    // Effects do not read what lies behind their settings.
    const bool longer = chunk.size() > StateOf(*trial).size();
    if (longer || !Corvo::DSP::TakesSettings(kind, chunk))
        throw UserError(name + ": " + std::to_string(chunk.size()) + " bytes are not settings of " +
                        effect.GetName() + ", which have " + std::to_string(StateOf(effect).size()));
    if (const auto label = Corvo::DSP::ParameterOutOfRange(kind, *trial); !label.empty())
        throw UserError(name + ": these are not settings of " + effect.GetName() + ": " + label +
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
