#include "DSP/Effects/Parameters/ParameterText.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <cmath>
#include <cstdlib>
#include <limits>
#include <stdexcept>

namespace Corvo::DSP {
namespace {

// Large enough for any double in fixed notation with a few decimals.
using NumberBuffer = std::array<char, 400>;

char Lower(char c) { return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c; }

constexpr float kFarOut = 1e8f;  // keeps conversions to integers defined

bool IsBlank(char c) { return c == ' ' || (c >= '\t' && c <= '\r'); }

}  // namespace

std::wstring FormatFixed(double value, int decimals, int width) {
    NumberBuffer buffer;
    const auto [end, error] = std::to_chars(buffer.data(), buffer.data() + buffer.size(), value,
                                            std::chars_format::fixed, decimals);
    if (error != std::errc{}) return {};
    std::wstring text(buffer.data(), end);
    if (const auto wanted = static_cast<std::size_t>(std::max(width, 0)); text.size() < wanted)
        text.insert(0, wanted - text.size(), L' ');
    return text;
}

std::wstring FormatInteger(std::int64_t value) { return std::to_wstring(value); }

std::wstring FormatTenthsOfDb(std::int32_t tenths, std::int32_t floor) {
    if (tenths <= floor) return L"-Inf.";
    const std::int64_t size = std::abs(static_cast<std::int64_t>(tenths));
    return (tenths < 0 ? L"-" : L"") + std::to_wstring(size / 10) + L"." + std::to_wstring(size % 10);
}

std::wstring FormatSwitch(bool on) { return on ? L"On" : L"Off"; }

std::wstring WithUnit(std::wstring text, std::wstring_view unit) {
    text += L' ';
    text += unit;
    return text;
}

float ParseNumber(std::string_view text) {
    text = Trimmed(text);
    if (text.starts_with('+') && !text.starts_with("+-")) text.remove_prefix(1);
    double value = 0.0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), value);
    if (error == std::errc::invalid_argument) throw std::invalid_argument("invalid stof argument");
    const bool finiteText = std::isfinite(value);
    const auto number = static_cast<float>(value);
    if (error != std::errc{} || (finiteText && !std::isfinite(number)))
        throw std::out_of_range("stof argument out of range");
    return number;
}

std::int32_t ParseSteps(std::string_view text, double step) {
    const double steps = ParseNumber(text) / step;
    return static_cast<std::int32_t>(std::lround(steps > 0.0 ? std::min<double>(steps, kFarOut) : 0.0));
}

std::int32_t ParseTenthsOfDb(std::string_view text, std::int32_t floor) {
    const float tenths = ParseNumber(text) * 10.0f;
    if (!(tenths > static_cast<float>(floor))) return floor;
    return static_cast<std::int32_t>(std::lround(std::min(tenths, kFarOut)));
}

float ParseSwitch(std::string_view text) {
    text = Trimmed(text);
    if (StartsWithNoCase(text, "on")) return 1.0f;
    if (StartsWithNoCase(text, "off")) return 0.0f;
    return ParseNumber(text) >= 0.5f ? 1.0f : 0.0f;
}

int FindName(std::string_view text, std::span<const std::string_view> names) {
    text = Trimmed(text);
    int found = -1;
    std::size_t length = 0;
    for (std::size_t i = 0; i < names.size(); ++i)
        if (names[i].size() > length && StartsWithNoCase(text, names[i])) {
            found = static_cast<int>(i);
            length = names[i].size();
        }
    return found;
}

std::string_view Trimmed(std::string_view text) {
    while (!text.empty() && IsBlank(text.front())) text.remove_prefix(1);
    while (!text.empty() && IsBlank(text.back())) text.remove_suffix(1);
    return text;
}

bool StartsWithNoCase(std::string_view text, std::string_view start) {
    return text.size() >= start.size() && std::equal(start.begin(), start.end(), text.begin(),
                                                     [](char a, char b) { return Lower(a) == Lower(b); });
}

std::wstring Widen(std::string_view text) { return {text.begin(), text.end()}; }

std::string Narrow(std::wstring_view text) {
    std::string narrow;
    narrow.reserve(text.size());
    for (const wchar_t c : text) narrow += static_cast<char>(c);
    return narrow;
}

}  // namespace Corvo::DSP
