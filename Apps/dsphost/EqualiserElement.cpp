#include "EqualiserElement.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <utility>

#include "Errors.h"
#include "Text.h"

namespace dsphost {
namespace {

using namespace Corvo::DSP;

constexpr double kMostDecibels = 100.0;

struct TypeName {
    const char* name;
    EQFilterType type;
};
// clang-format off
constexpr std::array kTypes{
    TypeName{"highpass",              EQ_HIGHPASS},
    TypeName{"lowpass",               EQ_LOWPASS},
    TypeName{"peak",                  EQ_PEAK},
    TypeName{"lowshelf",              EQ_LOWSHELF},
    TypeName{"highshelf",             EQ_HIGHSHELF},
    TypeName{"lowshelf-butterworth",  EQ_LOWSHELF_BUTTERWORTH},
    TypeName{"highshelf-butterworth", EQ_HIGHSHELF_BUTTERWORTH},
};
// clang-format on

EQFilterType ParseType(std::string_view text) {
    return kTypes[FindName(text, FilterTypes(), "filter type")].type;
}

// The text up to `end`, which goes, too.
std::string_view TakeUntil(std::string_view& text, std::string_view ends) {
    const auto piece = text.substr(0, text.find_first_of(ends));
    text.remove_prefix(std::min(piece.size() + 1, text.size()));
    return piece;
}

std::string_view TakeWord(std::string_view& text) {
    text = Trimmed(text);
    return TakeUntil(text, " \t");
}

std::string Quoted(std::string_view text) {
    return std::string(1, '"').append(Shortened(text, kLongestQuote)).append(1, '"');
}

[[noreturn]] void Refuse(std::string_view band, const std::string& why) {
    throw UserError(std::string(EqualiserElement::kName) + ": " + Quoted(band) + ": " + why);
}

// A whole number of `unit`s from `least` to `most`.
int Whole(std::string_view band, std::string_view text, double unit, double least, double most,
          const char* accepted) {
    const auto number = ToNumber(text);
    const double units = number ? *number / unit : 0.0;
    if (!number || *number < least || *number > most || std::abs(units - std::round(units)) > 1e-6)
        Refuse(band, Quoted(text) + " cannot be used; accepted: " + accepted);
    return static_cast<int>(std::lround(units));
}

void AddBand(builtin_effects_data& data, std::string_view band) {
    constexpr double kMostHz = 1e6, kMostQ = 1e5;
    const int index = data.GetNumBands();
    if (index == builtin_effects_data::kMaxBands)
        Refuse(band, "there are more than " + std::to_string(index) + " bands");
    auto rest = band;
    const auto frequency = TakeWord(rest), type = TakeWord(rest);
    if (type.empty()) Refuse(band, "write FREQ TYPE [GAIN_DB] [q=Q], for example \"2500 peak -3 q=200\"");
    data.SetNumBands(index + 1);
    data.SetEqFreq(index, Whole(band, frequency, 1.0, 1.0, kMostHz, "whole Hz, 1 to 1000000"));
    data.SetEqType(index, ParseType(type));
    data.SetEqBoost(index, 0);
    data.SetDefaultQ(index);
    bool gained = false, shaped = false;
    for (auto word = TakeWord(rest); !word.empty(); word = TakeWord(rest)) {
        const bool isQ = StartsWithNoCase(word, "q=");
        if (std::exchange(isQ ? shaped : gained, true))
            Refuse(band, Quoted(word) + " is one too many; a band has one gain and one q=");
        if (isQ)
            data.SetEqQ(index, Whole(band, word.substr(2), 1.0, 1.0, kMostQ, "q=1 to q=100000, whole"));
        else
            data.SetEqBoost(index, Whole(band, word, 0.1, -kMostDecibels, kMostDecibels,
                                         "a gain of -100 to 100 dB in steps of 0.1"));
    }
}

}  // namespace

std::vector<std::string> FilterTypes() {
    std::vector<std::string> names;
    for (const auto& type : kTypes) names.emplace_back(type.name);
    return names;
}

builtin_effects_data ParseBands(std::string_view settings) {
    builtin_effects_data data;
    data.SetNumBands(0);
    while (!settings.empty())
        if (const auto band = Trimmed(TakeUntil(settings, ";")); !band.empty()) AddBand(data, band);
    if (data.GetNumBands() == 0)
        throw UserError(std::string(EqualiserElement::kName) +
                        ": has no bands; for example \"EQ: 80 highpass; 2500 peak -3 q=200\"");
    return data;
}

EqualiserElement::EqualiserElement(std::string_view settings) : m_records{ParseBands(settings)} {}
EqualiserElement::~EqualiserElement() = default;

bool EqualiserElement::Prepare(int, const tWAVEFORMATEX& format, bool) {
    m_format = format;
    m_records.resize(format.nChannels, builtin_effects_data(m_records.front()));
    m_eq.Cook(false, false, &m_records.front(), static_cast<int>(format.nSamplesPerSec), format.nChannels);
    return false;
}

void EqualiserElement::Process(double* samples, int frames, std::int64_t) {
    if (m_format.wBitsPerSample == 64)
        m_eq.Process(samples, frames, m_format.nChannels, false, m_records.data());
    else
        m_eq.Process(reinterpret_cast<float*>(samples), frames, m_format.nChannels, false, m_records.data());
}

}  // namespace dsphost
