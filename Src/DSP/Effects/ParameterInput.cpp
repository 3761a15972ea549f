#include "DSP/Effects/ParameterInput.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <limits>
#include <memory>
#include <optional>
#include <stdexcept>

#include "DSP/Effects/EffectKinds.h"
#include "DSP/Effects/Parameters/ParameterText.h"

namespace Corvo::DSP {
namespace {

bool SameNoCase(std::string_view a, std::string_view b) {
    return a.size() == b.size() && StartsWithNoCase(a, b);
}

std::string_view Piece(std::string_view text, std::size_t from) {
    return Trimmed(text.substr(std::min(from, text.size())));
}

// How many characters at the start are a decimal number; "inf" and "nan" are none.
std::size_t NumberLength(std::string_view text) {
    const std::size_t sign = text.starts_with('+') || text.starts_with('-') ? 1 : 0;
    if (text.find_first_of("0123456789.", sign) != sign) return 0;
    double value;
    const auto [end, error] = std::from_chars(text.data() + sign, text.data() + text.size(), value);
    return error == std::errc::invalid_argument ? 0 : static_cast<std::size_t>(end - text.data());
}

// Infinite or 0 where a double holds no such number.
std::optional<double> NumberOf(std::string_view text) {
    const std::string_view number = text.substr(0, NumberLength(text));
    if (number.empty()) return {};
    const std::size_t plus = number[0] == '+' ? 1 : 0;
    double value;
    if (std::from_chars(number.data() + plus, number.data() + number.size(), value).ec == std::errc{})
        return value;
    const auto exponent = number.find_first_of("eE");
    const bool tiny = exponent == number.npos ? number.find_first_of("123456789") > number.find('.')
                                              : number[exponent + 1] == '-';
    const double size = tiny ? 0.0 : std::numeric_limits<double>::infinity();
    return number[0] == '-' ? -size : size;
}

// "4 x" and "4" name the same choice when the unit is "x".
bool SameChoice(std::string_view shown, std::string_view text, std::string_view unit) {
    const auto bare = [unit](std::string_view whole) {
        whole = Trimmed(whole);
        const bool ends = !unit.empty() && whole.size() > unit.size() &&
                          SameNoCase(whole.substr(whole.size() - unit.size()), unit);
        return ends ? Trimmed(whole.substr(0, whole.size() - unit.size())) : whole;
    };
    return SameNoCase(bare(shown), bare(text));
}

// What stands behind the unit, without its digits: " - .%" of "semitones - 17.4%".
std::string BehindUnit(std::string_view text, std::string_view unit) {
    std::string behind(text.substr(unit.size()));
    std::erase_if(behind, [](char letter) { return letter >= '0' && letter <= '9'; });
    return behind;
}

// Parsers stop where they understand no more: words, and what follows a number, count when the effect shows
// them too. "-inf" for "-Inf. dB", "500 ms" for "499 ms", "1/4" for "1/4 (500 ms)". A second number behind
// the unit is the first one said in another way, rounded.
bool SaysTheSame(std::string_view shown, std::string_view text, std::string_view unit) {
    const std::size_t length = NumberLength(text);
    const std::string_view rest = Piece(text, length), shownRest = Piece(shown, NumberLength(shown));
    const auto hasUnit = [unit](std::string_view part) {
        return !unit.empty() && StartsWithNoCase(part, unit);
    };
    return StartsWithNoCase(shown, text) ||
           (length > 0 &&
            (rest.empty() || SameNoCase(rest, unit) || SameNoCase(rest, shownRest) ||
             (hasUnit(rest) && hasUnit(shownRest) && BehindUnit(rest, unit) == BehindUnit(shownRest, unit))));
}

bool BeyondRange(double number, float normalised, std::string_view shown) {
    if (normalised > 0.0f && normalised < 1.0f) return false;
    const auto end = NumberOf(shown);
    if (!end) return false;
    const double slack = 1e-3 * std::max(1.0, std::abs(*end));
    return normalised >= 1.0f ? number > *end + slack : number < *end - slack;
}

// -1 for what the effect's parser does not take. A number that no float holds is beyond the range on its
// side, or nothing.
float Parsed(CorvoEffectBase& effect, int index, std::string_view text) {
    try {
        return effect.GetParamValueNormalizedFromText(index, std::string(text));
    } catch (const std::invalid_argument&) {
        return -1.0f;
    } catch (const std::out_of_range&) {
        const double number = NumberOf(text).value_or(0.0);
        return number == 0.0  ? effect.GetParamValueNormalizedFromText(index, "0")
               : number > 0.0 ? 1.0f
                              : 0.0f;
    }
}

}  // namespace

std::vector<int> FindParameters(CorvoEffectBase& effect, std::string_view name) {
    name = Trimmed(name);
    std::vector<int> labelled, named;
    for (int index = 0; index < effect.GetParamCount(); ++index) {
        const ParameterDescription parameter = effect.Describe(index);
        if (SameNoCase(parameter.label, name)) labelled.push_back(index);
        if (SameNoCase(parameter.name, name)) named.push_back(index);
    }
    return labelled.empty() ? named : labelled;
}

std::string TextAt(CorvoEffectBase& effect, int index, float normalised) {
    // Some texts, such as a threshold's, are read from the settings as a whole.
    const auto* const kind = FindEffectKind(effect.GetName());
    const auto other = kind ? kind->Copy(effect) : nullptr;
    if (other) other->SetParam(index, normalised, false);
    const auto text =
        (other ? *other : effect).GetParameterFormattedText(index, static_cast<double>(normalised));
    return std::string(Trimmed(Narrow(text)));
}

std::string AcceptedTexts(CorvoEffectBase& effect, int index) {
    std::string all;
    for (const auto& choice : effect.Describe(index).choices) all += (all.empty() ? "" : ", ") + choice.text;
    return all.empty() ? TextAt(effect, index, 0.0f) + " to " + TextAt(effect, index, 1.0f) : all;
}

ParameterInput ReadParameter(CorvoEffectBase& effect, int index, std::string_view text) {
    const ParameterDescription parameter = effect.Describe(index);
    const std::string_view unit = Trimmed(parameter.unit);
    text = Trimmed(text);
    for (const auto& choice : parameter.choices)
        if (SameChoice(choice.text, text, unit)) return {choice.normalised, false};
    const std::size_t length = NumberLength(text);
    const bool onlyChoices =
        parameter.type == EffectParameterType::List || (!parameter.choices.empty() && length == 0);
    float value = text.empty() || onlyChoices ? -1.0f : Parsed(effect, index, text);
    // Beyond the range parsers limit, or say by how much.
    if (length > 0 && !onlyChoices && !std::isnan(value)) value = std::clamp(value, 0.0f, 1.0f);
    const bool understood = value >= 0.0f && value <= 1.0f;
    const std::string shown = understood ? TextAt(effect, index, value) : "";
    if (!understood || !SaysTheSame(shown, text, unit))
        throw std::invalid_argument(parameter.label + " cannot be \"" + std::string(text) +
                                    "\"; accepted: " + AcceptedTexts(effect, index));
    const auto number = NumberOf(text);
    return {value, number && BeyondRange(*number, value, shown)};
}

}  // namespace Corvo::DSP
