#include "DSP/Effects/Parameters/ParameterRow.h"

#include <cmath>
#include <vector>

#include "DSP/Effects/Parameters/ParameterText.h"

namespace Corvo::DSP {

float Inverse(float (*map)(float n, float span), float span, float wanted, float guess) {
    guess = Limited(guess);
    for (float below = guess, above = guess, step = 0; step < 4; ++step) {
        if (map(below, span) == wanted) return below;
        if (map(above, span) == wanted) return above;
        below = Limited(std::nextafter(below, 0.0f));
        above = Limited(std::nextafter(above, 1.0f));
    }
    return guess;
}

namespace ParameterTexts {
namespace {

std::uint32_t Stored(const ParameterRow& row, double normalised) {
    return row.storage.store(row.storage, static_cast<float>(normalised));
}

float Normalised(const ParameterRow& row, std::int32_t word) {
    return row.storage.normalised(row.storage, static_cast<std::uint32_t>(word));
}

}  // namespace

std::wstring Number(const ParameterRow& row, double normalised) {
    const double value = row.storage.plain(Stored(row, normalised));
    const auto number = FormatFixed(value * row.shown.step, row.shown.decimals);
    return *row.unit ? WithUnit(number, row.unit) : number;
}

std::wstring Decibels(const ParameterRow& row, double normalised) {
    const auto tenths = static_cast<std::int32_t>(Stored(row, normalised));
    return WithUnit(FormatTenthsOfDb(tenths, row.shown.silent), row.unit);
}

std::wstring Choice(const ParameterRow& row, double normalised) {
    return Widen(row.shown.choices[Stored(row, normalised)].text);
}

float ReadInteger(const ParameterRow& row, const std::string& text) {
    return Normalised(row, ParseSteps(text, row.shown.step));
}

float ReadReal(const ParameterRow& row, const std::string& text) {
    return Limited(static_cast<float>(ParseNumber(text) / (row.shown.step * row.storage.map.span)));
}

float ReadDecibels(const ParameterRow& row, const std::string& text) {
    return Normalised(row, ParseTenthsOfDb(text, row.shown.silent));
}

float ReadChoice(const ParameterRow& row, const std::string& text) {
    const auto& choices = row.shown.choices;
    std::vector<std::string_view> names;
    for (const auto& choice : choices) names.emplace_back(choice.text);
    const int found = FindName(text, names);
    return found < 0 ? -1.0f : choices[static_cast<std::size_t>(found)].value;
}

std::wstring OnOff(const ParameterRow& row, double normalised) {
    return WithUnit(FormatSwitch(normalised >= 0.5), row.unit);
}

float ReadOnOff(const ParameterRow&, const std::string& text) { return ParseSwitch(text); }

}  // namespace ParameterTexts

}  // namespace Corvo::DSP
