#pragma once

#include <array>
#include <bit>
#include <cstddef>
#include <cstdint>
#include <numeric>
#include <span>
#include <string>

#include "DSP/Effects/Parameters/FixedPoint.h"
#include "Platform/MediaParams.h"

namespace Corvo::DSP {

struct ParameterRow;

// Within 0..limit; NaN counts as 0.
constexpr float Limited(float value, float limit = 1.0f) {
    return value > 0.0f ? (value < limit ? value : limit) : 0.0f;
}

// How the normalised value of a parameter is kept in a 32-bit word of the settings. Linear ones use `map`.
struct Storage {
    using Store = std::uint32_t (*)(const Storage&, float normalised);
    using Plain = float (*)(std::uint32_t word);
    using Normalised = float (*)(const Storage&, std::uint32_t word);

    // An integer by FixedPoint: what most parameters are.
    constexpr Storage(float span, float floor);
    constexpr Storage(Store storing, Plain asPlain, Normalised asNormalised, float span = 1.0f)
        : store(storing), plain(asPlain), normalised(asNormalised), map{span, 0.0f} {}

    Store store;
    Plain plain;
    Normalised normalised;
    FixedPoint map;
};

constexpr float PlainOfInteger(std::uint32_t word) {
    return static_cast<float>(static_cast<std::int32_t>(word));
}
constexpr float PlainOfReal(std::uint32_t word) { return std::bit_cast<float>(word); }

constexpr Storage::Storage(float span, float floor)
    : store([](const Storage& s, float n) { return static_cast<std::uint32_t>(s.map.Word(n)); }),
      plain(PlainOfInteger),
      normalised([](const Storage& s, std::uint32_t word) {
          return s.map.Normalised(static_cast<std::int32_t>(word));
      }),
      map{span, floor} {}

// A normalised value n close to `guess` with map(n, span) == wanted: the division that gave the guess may
// have rounded to its neighbour.
float Inverse(float (*map)(float n, float span), float span, float wanted, float guess);

// A float: n * span.
constexpr Storage RealWord(float span) {
    return {[](const Storage& s, float n) { return std::bit_cast<std::uint32_t>(Limited(n) * s.map.span); },
            PlainOfReal,
            [](const Storage& s, std::uint32_t word) {
                const float value = std::bit_cast<float>(word);
                return Inverse([](float n, float limit) { return n * limit; }, s.map.span, value,
                               value / s.map.span);
            },
            span};
}

// An integer: 1 from 0.5 up, else 0.
constexpr Storage SwitchWord() {
    return {[](const Storage&, float n) { return std::uint32_t{n >= 0.5f}; }, PlainOfInteger,
            [](const Storage&, std::uint32_t word) { return word != 0 ? 1.0f : 0.0f; }};
}

// One entry of a list: its text, and the normalised value that chooses it.
struct Choice {
    const char* text;
    float value;
};

// How a normalised value is shown, and read back; reading throws like ParseNumber, or gives -1 for what it
// does not understand.
struct Shown {
    std::wstring (*text)(const ParameterRow&, double normalised);
    float (*read)(const ParameterRow&, const std::string& text);
    double step = 1.0;  // number shown = stored value * step
    int decimals = 0;
    std::int32_t silent = 0;  // "-Inf." at or below so many tenths of a decibel
    std::span<const Choice> choices{};
};

// The range of a host's generic controls, in plain values.
struct PlainRange {
    float minimum = 0.0f, maximum = 1.0f, neutral = 0.5f;
};

// For a parameter that is not one word of the settings.
constexpr std::size_t kNoWord = SIZE_MAX;

// One parameter. The texts live as long as the library.
struct ParameterRow {
    const wchar_t *label, *unit;
    MP_TYPE type;
    Storage storage;
    Shown shown;
    std::size_t word = kNoWord;  // which word of the settings record
    int section = 0;
    PlainRange range{};
};

// The place of the word that holds a field, or one side of a pair: word i of a numbered record is i.
template <typename Record>
consteval Record Numbered() {
    std::array<std::int32_t, sizeof(Record) / 4> words;
    std::iota(words.begin(), words.end(), 0);
    return std::bit_cast<Record>(words);
}
template <typename Record, typename Word, std::size_t N>
consteval std::size_t WordAt(std::array<Word, N> Record::*pair, std::size_t side) {
    return std::bit_cast<std::uint32_t>((Numbered<Record>().*pair)[side]);
}
template <typename Record, typename Word>
consteval std::size_t WordAt(Word Record::*field) {
    return std::bit_cast<std::uint32_t>(Numbered<Record>().*field);
}

namespace ParameterTexts {
std::wstring Number(const ParameterRow& row, double normalised);
std::wstring Decibels(const ParameterRow& row, double normalised);
std::wstring Choice(const ParameterRow& row, double normalised);
float ReadInteger(const ParameterRow& row, const std::string& text);
float ReadReal(const ParameterRow& row, const std::string& text);
float ReadDecibels(const ParameterRow& row, const std::string& text);
float ReadChoice(const ParameterRow& row, const std::string& text);
std::wstring OnOff(const ParameterRow& row, double normalised);
float ReadOnOff(const ParameterRow& row, const std::string& text);
}  // namespace ParameterTexts

// An integer times `step`, with so many decimals, then the unit if there is one.
constexpr Shown Steps(double step, int decimals = 1) {
    return {ParameterTexts::Number, ParameterTexts::ReadInteger, step, decimals};
}
// A float times `factor`, likewise.
constexpr Shown Scaled(double factor, int decimals) {
    return {ParameterTexts::Number, ParameterTexts::ReadReal, factor, decimals};
}
// An integer in tenths, "-Inf." at `silent`, then the unit.
constexpr Shown TenthsOfDb(std::int32_t silent) {
    return {ParameterTexts::Decibels, ParameterTexts::ReadDecibels, 0.1, 1, silent};
}
// The text of the choice whose place in the list is stored.
constexpr Shown OneOf(std::span<const Choice> choices) {
    return {ParameterTexts::Choice, ParameterTexts::ReadChoice, 1.0, 0, 0, choices};
}

// "On" and "Off", then the unit.
constexpr Shown OnOff() { return {ParameterTexts::OnOff, ParameterTexts::ReadOnOff}; }

}  // namespace Corvo::DSP
