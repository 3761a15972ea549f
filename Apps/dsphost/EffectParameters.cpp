#include "EffectParameters.h"

#include <algorithm>
#include <cmath>
#include <optional>
#include <stdexcept>

#include "DSP/Effects/Framework/CorvoEffect.h"
#include "Errors.h"
#include "Text.h"

namespace dsphost {
namespace {

using Corvo::EffectParameterType;
using Corvo::DSP::CorvoEffect;

constexpr std::string_view kNormalisedMark = "n:";
// Fine enough for the narrowest choice of any list.
constexpr int kScanSteps = 1000;

std::string_view WithoutSide(std::string_view label) {
    const bool sided = label.size() >= 3 && (label.ends_with(" L") || label.ends_with(" R"));
    return sided ? label.substr(0, label.size() - 2) : label;
}

const MP_PARAMINFO* Table(Effect& effect) {
    auto* const described = dynamic_cast<CorvoEffect*>(&effect);
    return described ? described->GetParametersInfo() : nullptr;
}

std::string Label(const MP_PARAMINFO& record) {
    const std::wstring_view field(record.szLabel, std::size(record.szLabel));
    return Utf8(field.substr(0, field.find(L'\0')));
}

// The record behind each external parameter. Some effects show their table in reverse; which way round it is
// can be read off the names.
std::vector<const MP_PARAMINFO*> Records(Effect& effect) {
    const MP_PARAMINFO* const table = Table(effect);
    const int count = effect.GetParamCount(), real = effect.GetParamCountReal();
    if (!table || count != real) return {};
    const auto order = [&](bool reversed) {
        std::vector<const MP_PARAMINFO*> records;
        for (int i = 0; i < count; ++i) records.push_back(&table[reversed ? real - i - 1 : i]);
        return records;
    };
    const auto fits = [&](const std::vector<const MP_PARAMINFO*>& records) {
        for (int i = 0; i < count; ++i)
            if (WithoutSide(Label(*records[static_cast<std::size_t>(i)])) != Utf8(effect.GetParamName(i)))
                return false;
        return true;
    };
    for (const bool reversed : {false, true})
        if (auto records = order(reversed); fits(records)) return records;
    return {};
}

// The normalised value at which a parameter has its neutral plain value. Most are linear; a curve is
// searched.
float Neutral(Effect& effect, int index, const MP_PARAMINFO& record) {
    const float linear =
        (record.mpdNeutralValue - record.mpdMinValue) / (record.mpdMaxValue - record.mpdMinValue);
    if (record.mpdMinValue == 0.0f && record.mpdMaxValue == 1.0f) return linear;
    const auto plain = [&](float n) {
        effect.SetParam(index, n, false);
        return effect.GetParamPlain(index);
    };
    if (plain(linear) == record.mpdNeutralValue) return linear;
    float low = 0.0f, high = 1.0f;
    for (int i = 0; i < 30; ++i) {
        const float middle = 0.5f * (low + high);
        const float value = plain(middle);
        if (value == record.mpdNeutralValue) return middle;
        (value < record.mpdNeutralValue ? low : high) = middle;
    }
    return low;
}

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

// The normalised value of the choice that the effect shows as `choice`: the evenly spaced one where that is
// right, else the middle of the values that show it.
std::optional<float> ValueOfChoice(Effect& scratch, const EffectParameter& parameter, std::string_view choice,
                                   std::size_t position, std::size_t count) {
    const auto shows = [&](float n) {
        return SameChoice(TextAt(scratch, parameter, n), choice, parameter.unit);
    };
    if (count > 1) {
        const float even = static_cast<float>(position) / static_cast<float>(count - 1);
        if (shows(even)) return even;
    }
    int first = -1, last = -1;
    for (int step = 0; step <= kScanSteps; ++step) {
        if (!shows(static_cast<float>(step) / kScanSteps)) {
            if (first >= 0) break;
            continue;
        }
        if (first < 0) first = step;
        last = step;
    }
    if (first < 0) return {};
    return static_cast<float>(first + last) / (2.0f * kScanSteps);
}

std::vector<std::string> Choices(Effect& scratch, const EffectParameter& parameter) {
    if (!parameter.values.empty()) return parameter.values;
    if (parameter.type == EffectParameterType::Switch)
        return {std::string(Trimmed(TextAt(scratch, parameter, 0.0f))),
                std::string(Trimmed(TextAt(scratch, parameter, 1.0f)))};
    return {};
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

}  // namespace

std::string_view EffectParameter::Stem() const { return WithoutSide(label); }

std::unique_ptr<Effect> MakeEffect(EffectFactory factory) {
    auto effect = factory();
    if (effect->NumPresets() > 0) effect->SetPreset(effect->GetDefaultPreset());
    return effect;
}

std::unique_ptr<Effect> CopyEffect(EffectFactory factory, Effect& effect) {
    std::vector<std::uint8_t> chunk;
    effect.GetSettingsChunk(chunk);
    auto copy = factory();
    copy->SetSettingsChunk(chunk);
    return copy;
}

std::vector<EffectParameter> DescribeParameters(EffectFactory factory) {
    const auto effect = MakeEffect(factory);
    const auto records = Records(*effect);
    std::vector<EffectParameter> parameters(static_cast<std::size_t>(std::max(effect->GetParamCount(), 0)));
    for (std::size_t i = 0; i < parameters.size(); ++i) {
        auto& parameter = parameters[i];
        parameter.index = static_cast<int>(i);
        parameter.label = records.empty() ? Utf8(effect->GetParamName(parameter.index)) : Label(*records[i]);
        parameter.unit = Utf8(effect->GetParamUnitsText(parameter.index));
        parameter.type = effect->GetParameterTypeAutomatable(parameter.index);
        parameter.values = effect->GetParameterAvailableValues(parameter.index);
        if (!records.empty()) parameter.neutral = Neutral(*factory(), parameter.index, *records[i]);
    }
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
            if (SameNoCase(parameter.Stem(), label)) found.push_back(&parameter);
    if (!found.empty()) return found;
    std::vector<std::string> labels;
    for (const auto& parameter : all)
        for (const auto& name : {std::string(parameter.Stem()), parameter.label})
            if (std::ranges::find(labels, name) == labels.end()) labels.push_back(name);
    throw UserError(effectName + " has no parameter \"" + std::string(label) + "\"; " +
                    Suggestion(label, labels));
}

float ParseValue(EffectFactory factory, Effect& effect, const EffectParameter& parameter,
                 std::string_view text, std::string& warning) {
    text = Trimmed(text);
    const std::string asked =
        effect.GetName() + ": " + parameter.label + " cannot be \"" + std::string(text) + "\"; ";
    if (text.starts_with(kNormalisedMark)) {
        const auto number = ToNumber(text.substr(kNormalisedMark.size()));
        if (!number || *number < 0.0 || *number > 1.0)
            throw UserError(asked + "n: takes a normalised value from 0 to 1, such as n:0.37");
        return static_cast<float>(*number);
    }
    const auto scratch = CopyEffect(factory, effect);
    const auto choices = Choices(*scratch, parameter);
    for (std::size_t i = 0; i < choices.size(); ++i)
        if (SameChoice(choices[i], text, parameter.unit))
            if (const auto value = ValueOfChoice(*scratch, parameter, choices[i], i, choices.size()))
                return *value;

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
