#include "EqualiserEffect.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <cstring>
#include <stdexcept>

namespace Corvo::Plugins {
namespace {

using namespace DSP;

constexpr std::int32_t kChunkVersion = 1;

struct TypeRow {
    const char* name;
    EQFilterType type;
};
constexpr TypeRow kTypes[]{
    {"High-pass", EQ_HIGHPASS},
    {"Low shelf", EQ_LOWSHELF},
    {"Low shelf, Butterworth", EQ_LOWSHELF_BUTTERWORTH},
    {"Peak", EQ_PEAK},
    {"High shelf", EQ_HIGHSHELF},
    {"High shelf, Butterworth", EQ_HIGHSHELF_BUTTERWORTH},
    {"Low-pass", EQ_LOWPASS},
};
constexpr int kLastType = static_cast<int>(std::size(kTypes)) - 1;

// A kind of parameter, kept as a whole number.
struct KindRow {
    const wchar_t* name;
    const wchar_t* unit;
    std::int32_t least, most;
    bool byRatios;
    double step;  // number shown = what is kept * step
    int decimals;
};
// clang-format off
constexpr KindRow kKindRows[EqualiserEffect::kKinds]{
    {L"on",        L"",       0,         1, false, 1.0, 0},
    {L"type",      L"",       0, kLastType, false, 1.0, 0},
    {L"frequency", L"Hz",    10,     24000, true,  1.0, 0},
    {L"gain",      L"dB",  -240,       240, false, 0.1, 1},
    {L"Q",         L"",      10,      1000, true,  1.0, 0},
};

// What a new instance has: flat, from the lowest band to the highest.
constexpr std::int32_t kDefaults[EqualiserEffect::kBands][EqualiserEffect::kKinds]{
    // on, type, frequency, gain, Q
    {0, 0,    30, 0,  50},
    {1, 1,   100, 0,  50},
    {1, 3,   250, 0, 200},
    {1, 3,   600, 0, 200},
    {1, 3,  1500, 0, 200},
    {1, 3,  3500, 0, 200},
    {1, 4,  8000, 0,  50},
    {0, 6, 18000, 0,  50},
};
// clang-format on

const KindRow& KindRowOf(int index) { return kKindRows[index % EqualiserEffect::kKinds]; }

std::int32_t WordAt(int index, float position) {
    const auto& row = KindRowOf(index);
    const double n = position > 0.0f ? std::min(static_cast<double>(position), 1.0) : 0.0;
    const double least = row.least, most = row.most;
    return static_cast<std::int32_t>(
        std::lround(row.byRatios ? least * std::pow(most / least, n) : least + n * (most - least)));
}

float PositionOf(int index, double word) {
    const auto& row = KindRowOf(index);
    const double least = row.least, most = row.most;
    const double n = row.byRatios ? std::log(std::max(word, least) / least) / std::log(most / least)
                                  : (word - least) / (most - least);
    return static_cast<float>(std::clamp(n, 0.0, 1.0));
}

bool Exists(int index) { return index >= 0 && index < EqualiserEffect::kBands * EqualiserEffect::kKinds; }
int KindOf(int index) { return Exists(index) ? index % EqualiserEffect::kKinds : -1; }

}  // namespace

EqualiserEffect::EqualiserEffect() {
    for (int i = 0; i < kBands * kKinds; ++i)
        m_words[static_cast<std::size_t>(i)] = kDefaults[i / kKinds][i % kKinds];
    for (auto& record : m_records) record.numBands = kBands;
}

bool EqualiserEffect::DoSetParam(int index, float normalised, bool) {
    if (!Exists(index)) return false;
    m_words[static_cast<std::size_t>(index)] = WordAt(index, normalised);
    return true;
}

void EqualiserEffect::CheckCookProperties(const tWAVEFORMATEX* format, bool force) {
    const bool otherChannels = format->nChannels != m_format.nChannels;
    const auto cook = TakeCook(m_format, *format, force);
    if (!cook.due) return;
    for (std::size_t band = 0; band < kBands; ++band) {
        const auto* const words = &m_words[band * kKinds];
        const auto type = std::clamp(words[kType].load(), 0, kLastType);
        m_records[0].bands[band] = {kTypes[type].type | (words[kOn] != 0 ? 0 : _eq_data::kBypassBand),
                                    words[kFrequency], words[kGain], words[kQ]};
    }
    const auto rate = static_cast<int>(format->nSamplesPerSec);
    if (otherChannels)
        m_equaliser.Cook(false, false, m_records.data(), rate,
                         std::min<int>(format->nChannels, MaxNumChannels));
    else
        m_equaliser.CookBandsOnly(!cook.afresh, false, m_records[0], rate);
}

void EqualiserEffect::ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format,
                                      ProcessFlags& flags) {
    CheckCookProperties(format, flags.force_cook);
    const int channels = std::min<int>(format->nChannels, MaxNumChannels);
    for (int channel = 0; channel < channels; ++channel)
        if (format->wBitsPerSample == 64)
            m_equaliser.ProcessSingle(buffer, frames, format->nChannels, false, channel, m_records.data());
        else
            m_equaliser.ProcessSingle(reinterpret_cast<float*>(buffer), frames, format->nChannels, false,
                                      channel, m_records.data());
}

void EqualiserEffect::Cleanup() { MarkStale(); }

int EqualiserEffect::GetSettingsChunkSize() { return 4 * (1 + kBands * kKinds); }

void EqualiserEffect::GetSettingsChunk(std::vector<std::uint8_t>& chunk) {
    chunk.clear();
    const auto write = [&chunk](std::int32_t word) {
        for (int shift = 0; shift < 32; shift += 8)
            chunk.push_back(static_cast<std::uint8_t>(static_cast<std::uint32_t>(word) >> shift));
    };
    write(kChunkVersion);
    for (const auto& word : m_words) write(word);
}

void EqualiserEffect::SetSettingsChunk(const std::vector<std::uint8_t>& chunk) {
    if (chunk.size() < static_cast<std::size_t>(GetSettingsChunkSize())) return;
    for (std::size_t i = 0; i < m_words.size(); ++i) {
        std::uint32_t word = 0;
        for (std::size_t byte = 4; byte-- > 0;) word = word << 8 | chunk[4 * (i + 1) + byte];
        const auto& row = KindRowOf(static_cast<int>(i));
        m_words[i] = std::clamp(static_cast<std::int32_t>(word), row.least, row.most);
    }
    MarkStale();
}

float EqualiserEffect::GetParam(int index) {
    return Exists(index) ? PositionOf(index, m_words[static_cast<std::size_t>(index)]) : 0.0f;
}
float EqualiserEffect::GetParamPlain(int index) const {
    return Exists(index) ? static_cast<float>(m_words[static_cast<std::size_t>(index)]) : 0.0f;
}

std::wstring EqualiserEffect::GetParamName(int index) {
    return Exists(index) ? L"Band " + std::to_wstring(index / kKinds + 1) + L" " + KindRowOf(index).name
                         : L"";
}
std::wstring EqualiserEffect::GetParamUnitsText(int index) {
    return Exists(index) ? KindRowOf(index).unit : L"";
}

EffectParameterType EqualiserEffect::GetParameterTypeAutomatable(int index) {
    const int kind = KindOf(index);
    return kind == kOn     ? EffectParameterType::Switch
           : kind == kType ? EffectParameterType::List
                           : EffectParameterType::Continuous;
}

std::vector<std::string> EqualiserEffect::GetParameterAvailableValues(int index) {
    if (KindOf(index) == kOn) return {"Off", "On"};
    std::vector<std::string> names;
    if (KindOf(index) == kType)
        for (const auto& type : kTypes) names.emplace_back(type.name);
    return names;
}

std::wstring EqualiserEffect::GetParameterFormattedText(int index, double value) {
    if (!Exists(index)) return L"";
    const auto word = WordAt(index, static_cast<float>(value));
    const auto texts = GetParameterAvailableValues(index);
    if (!texts.empty()) {
        const auto& text = texts[static_cast<std::size_t>(word)];
        return {text.begin(), text.end()};
    }
    const auto& row = KindRowOf(index);
    char digits[32];
    const auto end = std::to_chars(std::begin(digits), std::end(digits), word * row.step,
                                   std::chars_format::fixed, row.decimals)
                         .ptr;
    std::wstring text(std::begin(digits), end);
    return *row.unit ? text + L" " + row.unit : text;
}

float EqualiserEffect::GetParamValueNormalizedFromText(int index, std::string text) {
    if (!Exists(index)) return -1.0f;
    const auto texts = GetParameterAvailableValues(index);
    if (const auto found = std::ranges::find(texts, text); found != texts.end())
        return PositionOf(index, static_cast<double>(found - texts.begin()));
    const auto first = text.find_first_not_of(" +");
    double number = 0.0;
    if (first == text.npos ||
        std::from_chars(text.data() + first, text.data() + text.size(), number).ec != std::errc{})
        throw std::invalid_argument("no number");
    return texts.empty() ? PositionOf(index, std::round(number / KindRowOf(index).step)) : -1.0f;
}

std::vector<std::string> EqualiserEffect::GetParamUiSections() {
    std::vector<std::string> sections;
    for (int band = 1; band <= kBands; ++band) sections.push_back("Band " + std::to_string(band));
    return sections;
}

void EqualiserEffect::GetParamSectionInfo(int index, PluginParameterInfo& info) {
    if (!Exists(index)) return;
    info = {};
    info.param_index = index;
    info.layout_group = index / kKinds;
    info.values = GetParameterAvailableValues(index);
}

}  // namespace Corvo::Plugins
