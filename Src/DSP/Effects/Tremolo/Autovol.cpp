#include "DSP/Effects/Tremolo/Autovol.h"

#include <algorithm>
#include <string_view>
#include <utility>

#include "DSP/Effects/Parameters/FixedPoint.h"
#include "DSP/Effects/Parameters/PairedWords.h"
#include "DSP/Effects/Parameters/ParameterTable.h"
#include "DSP/Effects/Parameters/ParameterText.h"
#include "DSP/Effects/Parameters/WordChunk.h"
#include "DSP/Effects/Tremolo/AutovolPresets.h"
#include "DSP/Parts/Decibels.h"
#include "DSP/Parts/SampleDispatch.h"
#include "DSP/Parts/SineOscillator.h"
#include "Threads/SharedRecord.h"

namespace Corvo::DSP {

namespace AutovolPrivate {

// What one side does to its samples: sample * (amplitude * sine + offset).
struct Side {
    SineOscillator oscillator;
    double amplitude = 0.0, offset = 0.0;

    // The factors of the next `frames`, at most a piece of the oscillator.
    void TakeFactors(double* factors, int frames) {
        oscillator.StepAndTakeSines(factors, frames);
        for (int i = 0; i < frames; ++i) factors[i] = amplitude * factors[i] + offset;
    }
};

}  // namespace AutovolPrivate

namespace {

using Props = AutovolPrivate::_transform_props;
using Sides = std::array<AutovolPrivate::Side, 2>;
using AutovolPresets::kPresets;

enum class Show { Steps, TenthsOfDb, Choice };

struct Row {
    const wchar_t *label, *unit;
    MP_TYPE type;
    FixedPoint map;
    Show show;
    double step;  // of the value shown, per unit of the word
    Props::Pair Props::*field;
    std::size_t side;
};

// clang-format off
constexpr std::array<Row, 10> kRows{{
    // label             unit   type        span      floor     shown as          step  field            side
    {L"Depth L",         L"%",  MPT_FLOAT, {1000.0f,    0.0f}, Show::Steps,      0.1,  &Props::depth,   0},
    {L"Depth R",         L"%",  MPT_FLOAT, {1000.0f,    0.0f}, Show::Steps,      0.1,  &Props::depth,   1},
    {L"Frequency L",     L"Hz", MPT_FLOAT, {3000.0f,    0.0f}, Show::Steps,      0.01, &Props::rate,    0},
    {L"Frequency R",     L"Hz", MPT_FLOAT, {3000.0f,    0.0f}, Show::Steps,      0.01, &Props::rate,    1},
    {L"Mix L",           L"%",  MPT_FLOAT, {1000.0f,    0.0f}, Show::Steps,      0.1,  &Props::mix,     0},
    {L"Mix R",           L"%",  MPT_FLOAT, {1000.0f,    0.0f}, Show::Steps,      0.1,  &Props::mix,     1},
    {L"Out gain L",      L"dB", MPT_FLOAT, {1160.0f, -960.0f}, Show::TenthsOfDb, 0.1,  &Props::outGain, 0},
    {L"Out gain R",      L"dB", MPT_FLOAT, {1160.0f, -960.0f}, Show::TenthsOfDb, 0.1,  &Props::outGain, 1},
    {L"Invert Phase L",  L"",   MPT_ENUM,  {   1.0f,    0.0f}, Show::Choice,     1.0,  &Props::invert,  0},
    {L"Invert Phase R",  L"",   MPT_ENUM,  {   1.0f,    0.0f}, Show::Choice,     1.0,  &Props::invert,  1},
}};
// clang-format on

constexpr std::array<std::string_view, 2> kChoices{"Disabled", "Enabled"};
constexpr std::int32_t kSilent = -960;
constexpr std::int32_t kLoudest = 200, kWhole = 1000;
constexpr double kPerMille = 0.001;
constexpr double kRadiansPerRateStep = 0.06283185307179587;  // 2 pi / 100

using Words = PairedWords<kRows, kPresets>;

constexpr auto kVisitWords = [](auto&& visit, auto& s) {
    return visit(s.depth) && visit(s.mix) && visit(s.rate) && visit(s.ringMod) && visit(s.invert) &&
           visit(s.reserved) && visit(s.outGain) && visit(s.reserved2);
};
using SettingsChunk = WordChunk<Props, kVisitWords>;

template <typename Sample>
void Modulate(Sample* samples, double factor) {
    *samples = static_cast<Sample>(*samples * factor);
}

template <typename Sample>
void RunPair(Sides& sides, Sample* samples, int frames) {
    constexpr int kPiece = SineOscillator::kPiece;
    std::array<double, kPiece> left, right;
    std::array<double, 2 * kPiece> factors;
    for (int run; frames > 0; frames -= run, samples += 2 * run) {
        run = std::min(frames, kPiece);
        sides[0].TakeFactors(left.data(), run);
        sides[1].TakeFactors(right.data(), run);
        for (std::size_t i = 0; i < static_cast<std::size_t>(run); ++i) {
            factors[2 * i] = left[i];
            factors[2 * i + 1] = right[i];
        }
        for (std::size_t i = 0; i < 2 * static_cast<std::size_t>(run); ++i) Modulate(samples + i, factors[i]);
    }
}

template <typename Sample>
void RunSide(AutovolPrivate::Side& side, Sample* samples, int frames, int stride) {
    std::array<double, SineOscillator::kPiece> factors;
    for (int run; frames > 0; frames -= run) {
        run = std::min(frames, SineOscillator::kPiece);
        side.TakeFactors(factors.data(), run);
        for (std::size_t i = 0; i < static_cast<std::size_t>(run); ++i, samples += stride)
            Modulate(samples, factors[i]);
    }
}

}  // namespace

Autovol::Autovol() : m_sides(std::make_unique<Sides>()) { SetPreset(0); }
Autovol::~Autovol() = default;

int Autovol::GetParamCountReal() { return Words::kCount; }
int Autovol::GetSettingsChunkSize() { return SettingsChunk::kSize; }
int Autovol::NumPresets() { return Words::kPresetCount; }
std::string Autovol::GetName() { return "Tremolo"; }
std::string Autovol::GetImage() { return "builtinTremolo.png"; }
std::string Autovol::GetPluginIconPath() { return "BuiltinPlugins/Tremolo@3x.png"; }
bool Autovol::WantsXySerialization() { return true; }

const MP_PARAMINFO* Autovol::GetParametersInfo() {
    static const auto records = [] {
        auto table = MakeNormalisedTable(kRows, 1);
        for (auto& record : table)
            if (record.mpType == MPT_ENUM) record.mpdNeutralValue = 0.0f;
        return table;
    }();
    return records.data();
}

bool Autovol::DoSetParam(int index, float normalised, bool) {
    return Words::Set(m_settings, index, normalised);
}

float Autovol::GetParamPlain(int index) const { return Words::Plain(m_settings, index); }
float Autovol::GetParam(int index) { return Words::Normalised(m_settings, index); }
float Autovol::GetParamFromProp(int index, int preset) { return Words::InPreset(index, preset); }

std::wstring Autovol::GetParameterFormattedText(int index, double value) {
    if (!Words::Has(index)) return {};
    const Row& row = Words::RowAt(index);
    const auto word = row.map.Word(static_cast<float>(value));
    switch (row.show) {
        case Show::Steps:
            return WithUnit(FormatFixed(word * row.step, 1), row.unit);
        case Show::TenthsOfDb:
            return WithUnit(FormatTenthsOfDb(word, kSilent), row.unit);
        case Show::Choice:
            break;
    }
    // Anything off the end of the knob reads "Enabled", though only its other end enables.
    return WithUnit(Widen(kChoices[value == 0.0 ? 0 : 1]), row.unit);
}

float Autovol::GetParamValueNormalizedFromText(int index, std::string text) {
    if (!Words::Has(index)) return -1.0f;
    const Row& row = Words::RowAt(index);
    switch (row.show) {
        case Show::Steps:
            return row.map.Normalised(ParseSteps(text, row.step));
        case Show::TenthsOfDb:
            return row.map.Normalised(ParseTenthsOfDb(text, kSilent));
        case Show::Choice:
            break;
    }
    return static_cast<float>(FindName(text, kChoices));
}

std::vector<std::string> Autovol::GetParameterAvailableValues(int index) {
    if (!Words::Has(index) || Words::RowAt(index).show != Show::Choice) return {};
    return {kChoices.begin(), kChoices.end()};
}

void Autovol::GetParamSectionInfo(int index, PluginParameterInfo& info) {
    if (!Words::Has(index)) return;
    info = {};
    info.param_index = index;
    info.values = GetParameterAvailableValues(index);
    info.label = Narrow(Words::RowAt(index).label);
}

void Autovol::InitializeXyEditingData(GenericUIData& data) {
    enum { kDepth, kRate = 2, kMix = 4, kOutGain = 6 };
    data.groups.clear();
    for (const int side : {0, 1})
        data.groups.push_back(
            MakeGroup("Default", side, {kDepth + side, kRate + side}, {kMix + side, kOutGain + side}));
    data.entries = {"Default"};
}

std::string Autovol::GetPresetName(int preset) { return Words::PresetName(preset); }

void Autovol::SetPreset(int preset) {
    if (Words::TakePreset(m_settings, preset)) m_cook.store(true, std::memory_order_release);
}

void Autovol::GetSettingsChunk(std::vector<std::uint8_t>& chunk) {
    SettingsChunk::Write(chunk, m_chunk_tag, m_settings);
}

void Autovol::SetSettingsChunk(const std::vector<std::uint8_t>& chunk) {
    if (SettingsChunk::Read(chunk, m_chunk_tag, m_settings)) m_cook.store(true, std::memory_order_release);
}

bool Autovol::FitsOldChunk(const std::vector<std::uint8_t>& chunk) {
    const bool fits = SettingsChunk::ReadOld(chunk, m_chunk_tag, m_settings);
    if (fits) m_cook.store(true, std::memory_order_release);
    return fits;
}

void Autovol::CheckCookProperties(const tWAVEFORMATEX* format, bool force) {
    const bool changed =
        format->nChannels != m_format.nChannels || format->nSamplesPerSec != m_format.nSamplesPerSec;
    m_format = *format;
    if (m_cook.exchange(false, std::memory_order_acquire) || force || changed)
        InitState(Snapshot(m_settings), *format, force);
}

void Autovol::InitState(const Props& settings, const tWAVEFORMATEX& format, bool force) {
    InitEnvelopes(true);
    const double hz = std::max<std::uint32_t>(format.nSamplesPerSec, 1);
    for (std::size_t i = 0; i < 2; ++i) {
        auto& side = (*m_sides)[i];
        if (force) side.oscillator.SetPhase(0.0);
        side.oscillator.SetIncrement(kRadiansPerRateStep * settings.rate[i] / hz);
        // Words of a chunk may be anything; they sound like the nearest that the knobs reach.
        const double gain = GainFromTenthsOfDb(std::min(settings.outGain[i], kLoudest), kSilent);
        const double signedGain = settings.invert[i] == 1 ? -gain : gain;
        const double depth = std::clamp(settings.depth[i], 0, kWhole) * kPerMille;
        const double mix = std::clamp(settings.mix[i], 0, kWhole) * kPerMille;
        if (settings.ringMod[i] == 1) {
            side.amplitude = mix * signedGain;
            side.offset = (1.0 - mix) * signedGain;
        } else {
            const double scale = 1.0 / (1.0 + depth);
            side.amplitude = depth * scale * signedGain;
            side.offset = scale * signedGain;
        }
    }
}

void Autovol::ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format, ProcessFlags&) {
    CheckCookProperties(format, false);
    if (frames < 1) return;
    const int channels = format->nChannels;
    WithSamples(buffer, *format, OtherWidths::AreFloat, [&](auto* samples) {
        if (channels == 2) return RunPair(*m_sides, samples, frames);
        for (int side = 0; side < std::min(channels, MaxNumChannels); ++side)
            RunSide((*m_sides)[static_cast<std::size_t>(side)], samples + side, frames, channels);
    });
    for (auto& side : *m_sides) side.oscillator.ReducePhase();
}

}  // namespace Corvo::DSP
