#include "DSP/Effects/Reverb/Reverb.h"

#include <algorithm>
#include <cmath>
#include <utility>

#include "DSP/Effects/Parameters/FixedPoint.h"
#include "DSP/Effects/Parameters/PairedWords.h"
#include "DSP/Effects/Parameters/ParameterTable.h"
#include "DSP/Effects/Parameters/ParameterText.h"
#include "DSP/Effects/Parameters/WordChunk.h"
#include "DSP/Effects/Reverb/ReverbDesign.h"
#include "DSP/Effects/Reverb/ReverbEngine.h"
#include "DSP/Effects/Reverb/ReverbPresets.h"
#include "DSP/Parts/SampleDispatch.h"
#include "Threads/SharedRecord.h"

namespace Corvo::DSP {
namespace {

using Props = ReverbPrivate::_transform_props;
using ReverbPresets::kPresets;

struct Row {
    const wchar_t *label, *unit;
    MP_TYPE type;
    FixedPoint map;
    double shownStep;  // 0: tenths of dB
    int decimals;
    Props::Pair Props::*field;
    std::size_t side;
};

// The unit of the mix is an old slip that hosts show by now.
// clang-format off
constexpr std::array<Row, 16> kRows{{
    // label                           unit   type       span      floor     step   decimals field             side
    {L"Pre-delay L",                   L"ms", MPT_INT, { 2000.0f,    0.0f}, 0.1,   1, &Props::preDelay,    0},
    {L"Pre-delay R",                   L"ms", MPT_INT, { 2000.0f,    0.0f}, 0.1,   1, &Props::preDelay,    1},
    {L"Mix with early reflections L",  L"dB", MPT_INT, { 2000.0f,    0.0f}, 0.05,  1, &Props::mix,         0},
    {L"Mix with early reflections R",  L"dB", MPT_INT, { 2000.0f,    0.0f}, 0.05,  1, &Props::mix,         1},
    {L"Length L",                      L"ms", MPT_INT, {10000.0f,    0.0f}, 1.0,   0, &Props::length,      0},
    {L"Length R",                      L"ms", MPT_INT, {10000.0f,    0.0f}, 1.0,   0, &Props::length,      1},
    {L"Damping L",                     L"%",  MPT_INT, { 2500.0f,    0.0f}, 0.04,  1, &Props::damping,     0},
    {L"Damping R",                     L"%",  MPT_INT, { 2500.0f,    0.0f}, 0.04,  1, &Props::damping,     1},
    {L"Early reflections L",           L"",   MPT_INT, { 5000.0f,    0.0f}, 0.001, 2, &Props::reflections, 0},
    {L"Early reflections R",           L"",   MPT_INT, { 5000.0f,    0.0f}, 0.001, 2, &Props::reflections, 1},
    {L"Room size L",                   L"",   MPT_INT, { 3999.0f,    1.0f}, 0.001, 2, &Props::room,        0},
    {L"Room size R",                   L"",   MPT_INT, { 3999.0f,    1.0f}, 0.001, 2, &Props::room,        1},
    {L"Wet level L",                   L"dB", MPT_INT, {  550.0f, -450.0f}, 0.0,   1, &Props::wet,         0},
    {L"Wet level R",                   L"dB", MPT_INT, {  550.0f, -450.0f}, 0.0,   1, &Props::wet,         1},
    {L"Dry level L",                   L"dB", MPT_INT, {  550.0f, -450.0f}, 0.0,   1, &Props::dry,         0},
    {L"Dry level R",                   L"dB", MPT_INT, {  550.0f, -450.0f}, 0.0,   1, &Props::dry,         1},
}};
// clang-format on

constexpr std::int32_t kSilentTenths = -450;
constexpr double kFastestHz = 768e3;  // bounds the memory for formats that nobody has

using Words = PairedWords<kRows, kPresets>;
// External indices run backwards, and so does this map the other way.
int Real(int external) { return Words::kCount - 1 - external; }

int Sides(const tWAVEFORMATEX& format) {
    return std::min<int>(format.nChannels, CorvoEffectBase::MaxNumChannels);
}
double Rate(const tWAVEFORMATEX& format) {
    return std::min(static_cast<double>(format.nSamplesPerSec), kFastestHz);
}

constexpr auto kVisitWords = [](auto&& visit, auto& s) {
    return visit(s.preDelay) && visit(s.mix) && visit(s.length) && visit(s.wet) && visit(s.dry) &&
           visit(s.damping) && visit(s.reflections) && visit(s.room) && visit(s.reserved) &&
           visit(s.filterOff);
};
using SettingsChunk = WordChunk<Props, kVisitWords>;

}  // namespace

struct Reverb::Engines {
    ReverbEngine<float> single;
    ReverbEngine<double> twofold;

    ReverbEngine<float>& For(float*) { return single; }
    ReverbEngine<double>& For(double*) { return twofold; }
};

Reverb::Reverb() : m_engines(std::make_unique<Engines>()) {
    m_reverse_param_order = true;
    SetPreset(GetDefaultPreset());
}
Reverb::~Reverb() = default;

bool Reverb::SupportsNoninterleaved() { return true; }
int Reverb::GetParamCountReal() { return Words::kCount; }
int Reverb::GetSettingsChunkSize() { return SettingsChunk::kSize; }
int Reverb::NumPresets() { return Words::kPresetCount; }
std::string Reverb::GetName() { return "Reverb"; }
std::string Reverb::GetImage() { return "builtinReverb.png"; }
std::string Reverb::GetPluginIconPath() { return "BuiltinPlugins/Reverb@3x.png"; }

const MP_PARAMINFO* Reverb::GetParametersInfo() {
    static const auto records = MakeNormalisedTable(kRows, 1);
    return records.data();
}

bool Reverb::DoSetParam(int index, float normalised, bool) {
    Words::Set(m_settings, index, normalised);
    return true;
}

float Reverb::GetParamPlain(int index) const { return Words::Plain(m_settings, index); }
float Reverb::GetParam(int index) {
    return Words::Has(index) ? Words::Normalised(m_settings, Real(index)) : 0.0f;
}
float Reverb::GetParamFromProp(int index, int preset) { return Words::InPreset(index, preset); }

std::wstring Reverb::GetParameterFormattedText(int index, double value) {
    if (!Words::Has(index)) return {};
    const Row& row = Words::RowAt(Real(index));
    const auto word = row.map.Word(static_cast<float>(value));
    return WithUnit(row.shownStep > 0.0 ? FormatFixed(word * row.shownStep, row.decimals)
                                        : FormatTenthsOfDb(word, kSilentTenths),
                    row.unit);
}

float Reverb::GetParamValueNormalizedFromText(int index, std::string text) {
    if (!Words::Has(index)) return -1.0f;
    const Row& row = Words::RowAt(Real(index));
    if (!(row.shownStep > 0.0)) return row.map.Normalised(ParseTenthsOfDb(text, kSilentTenths));
    const double word = ParseNumber(text) / row.shownStep;
    return row.map.Normalised(static_cast<std::int32_t>(std::lround(word > 0.0 ? std::min(word, 1e6) : 0.0)));
}

void Reverb::GetParamSectionInfo(int index, PluginParameterInfo& info) {
    if (!Words::Has(index)) return;
    info = {};
    info.param_index = Real(index);
    info.label = Narrow(GetParamName(index));
}

std::string Reverb::GetPresetName(int preset) { return Words::PresetName(preset); }

void Reverb::SetPreset(int preset) {
    if (Words::TakePreset(m_settings, preset)) m_cook.store(true, std::memory_order_release);
}

void Reverb::GetSettingsChunk(std::vector<std::uint8_t>& chunk) {
    SettingsChunk::Write(chunk, m_chunk_tag, m_settings);
}

void Reverb::SetSettingsChunk(const std::vector<std::uint8_t>& chunk) {
    if (SettingsChunk::Read(chunk, m_chunk_tag, m_settings)) m_cook.store(true, std::memory_order_release);
}

bool Reverb::FitsOldChunk(const std::vector<std::uint8_t>& chunk) {
    const bool fits = SettingsChunk::ReadOld(chunk, m_chunk_tag, m_settings);
    if (fits) m_cook.store(true, std::memory_order_release);
    return fits;
}

void Reverb::CheckCookProperties(const tWAVEFORMATEX* format, bool force) {
    const bool changed = format->nChannels != m_format.nChannels ||
                         format->nSamplesPerSec != m_format.nSamplesPerSec ||
                         format->wBitsPerSample != m_format.wBitsPerSample;
    m_format = *format;
    // The announced format is the only one that needs memory.
    if (force && format->wBitsPerSample != 32) m_engines->single.Free();
    if (force && format->wBitsPerSample != 64) m_engines->twofold.Free();
    if (m_cook.exchange(false, std::memory_order_acquire) || force || changed) InitState(force || changed);
}

void Reverb::InitState(bool reset) {
    InitEnvelopes(true);
    if (m_format.nChannels == 0) return;
    const double rate = Rate(m_format);
    const ReverbDesign design(Snapshot(m_settings), rate);
    const auto cook = [&](auto& engine) {
        if ((reset || !engine.IsReady()) && !engine.Prepare(rate, Sides(m_format))) return;
        engine.Cook(design, rate);
    };
    if (m_format.wBitsPerSample == 32) cook(m_engines->single);
    if (m_format.wBitsPerSample == 64) cook(m_engines->twofold);
}

void Reverb::ClearMemory() {
    m_engines->single.Clear();
    m_engines->twofold.Clear();
}

void Reverb::Cleanup() {
    m_engines->single.Free();
    m_engines->twofold.Free();
    m_cook.store(true, std::memory_order_release);
}

void Reverb::ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format, ProcessFlags&) {
    CheckCookProperties(format, false);
    if (format->nChannels == 0) return;
    WithSamples(buffer, *format, OtherWidths::Skip, [&](auto* samples) {
        auto& engine = m_engines->For(samples);
        if (engine.IsReady()) engine.Run({samples, samples + 1}, format->nChannels, frames);
    });
}

void Reverb::ProcessInternalNoninterleaved(double* const* channels, int frames, const tWAVEFORMATEX* format,
                                           ProcessFlags&) {
    CheckCookProperties(format, false);
    if (format->nChannels == 0) return;
    WithChannels(channels, *format, OtherWidths::Skip, [&](auto* const* samples) {
        auto& engine = m_engines->For(samples[0]);
        if (engine.IsReady()) engine.Run({samples[0], Sides(*format) == 2 ? samples[1] : nullptr}, 1, frames);
    });
}

}  // namespace Corvo::DSP
