#include "DSP/Effects/Chorus/Chorus.h"

#include <algorithm>
#include <new>
#include <utility>

#include "DSP/Effects/Chorus/ChorusKernel.h"
#include "DSP/Effects/Chorus/ChorusPresets.h"
#include "DSP/Effects/Parameters/FixedPoint.h"
#include "DSP/Effects/Parameters/PairedWords.h"
#include "DSP/Effects/Parameters/ParameterTable.h"
#include "DSP/Effects/Parameters/ParameterText.h"
#include "DSP/Effects/Parameters/WordChunk.h"
#include "DSP/Parts/Decibels.h"
#include "DSP/Parts/SampleDispatch.h"
#include "Threads/SharedRecord.h"

namespace Corvo::DSP {
namespace {

using Props = ChorusPrivate::_transform_props;
using Sides = std::array<ChorusPrivate::Side, 2>;
using ChorusPresets::kPresets;

struct Row {
    const wchar_t *label, *unit;
    MP_TYPE type;
    FixedPoint map;
    double step;   // of the value shown, per unit of the word
    int decimals;  // 0: tenths of dB
    Props::Pair Props::*field;
    std::size_t side;
};

// clang-format off
constexpr std::array<Row, 10> kRows{{
    // label           unit   type       span      floor      step decimals  field              side
    {L"Delay L",       L"ms", MPT_INT,  {10000.0f,    0.0f},  0.1,  1, &Props::delay,     0},
    {L"Delay R",       L"ms", MPT_INT,  {10000.0f,    0.0f},  0.1,  1, &Props::delay,     1},
    {L"Frequency L",   L"Hz", MPT_INT,  {  300.0f,    0.0f},  0.01, 2, &Props::frequency, 0},
    {L"Frequency R",   L"Hz", MPT_INT,  {  300.0f,    0.0f},  0.01, 2, &Props::frequency, 1},
    {L"Depth L",       L"%",  MPT_INT,  { 1000.0f,    0.0f},  0.1,  1, &Props::depth,     0},
    {L"Depth R",       L"%",  MPT_INT,  { 1000.0f,    0.0f},  0.1,  1, &Props::depth,     1},
    {L"Wet level L",   L"dB", MPT_INT,  { 1060.0f, -960.0f},  0.1,  0, &Props::wet,       0},
    {L"Wet level R",   L"dB", MPT_INT,  { 1060.0f, -960.0f},  0.1,  0, &Props::wet,       1},
    {L"Dry level L",   L"dB", MPT_INT,  { 1060.0f, -960.0f},  0.1,  0, &Props::dry,       0},
    {L"Dry level R",   L"dB", MPT_INT,  { 1060.0f, -960.0f},  0.1,  0, &Props::dry,       1},
}};
// clang-format on

// Indices of the left sides; the right ones follow.
enum { kDelay, kFrequency = 2, kDepth = 4 };

// The editor's pads, each moving both sides: what shapes a sound of that kind.
struct Pad {
    const char* name;
    int x, y;
};
constexpr std::array kPads{
    Pad{"Default", kDelay, kDepth},
    Pad{"Choruses", kFrequency, kDepth},
    Pad{"Flangers", kDelay, kFrequency},
};

constexpr std::int32_t kSilent = -960;
constexpr double kRadiansPerStep = 0.06283185307179587;  // 2 pi / 100
constexpr int kFirstCapacity = 480000;                   // floats
constexpr double kLongestSeconds = 10.0;
constexpr double kFastestHz = 768e3;  // bounds the memory for formats that nobody has

using Words = PairedWords<kRows, kPresets>;

constexpr auto kVisitWords = [](auto&& visit, auto& s) {
    return visit(s.frequency) && visit(s.delay) && visit(s.wet) && visit(s.dry) && visit(s.depth) &&
           visit(s.reserved);
};
using SettingsChunk = WordChunk<Props, kVisitWords>;

}  // namespace

Chorus::Chorus()
    : m_sides(std::make_unique<Sides>()),
      m_ring(std::make_unique<float[]>(kFirstCapacity)),
      m_capacity(kFirstCapacity) {
    for (int channel : {0, 1}) (*m_sides)[static_cast<std::size_t>(channel)].channel = channel;
    SetPreset(0);
}
Chorus::~Chorus() = default;

int Chorus::Channels() const { return std::clamp<int>(m_format.nChannels, 1, MaxNumChannels); }

int Chorus::GetParamCountReal() { return Words::kCount; }
int Chorus::GetSettingsChunkSize() { return SettingsChunk::kSize; }
int Chorus::NumPresets() { return Words::kPresetCount; }
std::string Chorus::GetName() { return "Chorus"; }
std::string Chorus::GetImage() { return "builtinChorus.png"; }
std::string Chorus::GetPluginIconPath() { return "BuiltinPlugins/Chorus.png"; }
bool Chorus::WantsXySerialization() { return true; }

const MP_PARAMINFO* Chorus::GetParametersInfo() {
    static const auto records = MakeNormalisedTable(kRows, 1);
    return records.data();
}

bool Chorus::DoSetParam(int index, float normalised, bool) {
    Words::Set(m_settings, index, normalised);
    return true;
}

float Chorus::GetParamPlain(int index) const { return Words::Plain(m_settings, index); }
float Chorus::GetParam(int index) { return Words::Normalised(m_settings, index); }
float Chorus::GetParamFromProp(int index, int preset) { return Words::InPreset(index, preset); }

std::wstring Chorus::GetParameterFormattedText(int index, double value) {
    if (!Words::Has(index)) return {};
    const Row& row = Words::RowAt(index);
    const auto word = row.map.Word(static_cast<float>(value));
    return WithUnit(
        row.decimals > 0 ? FormatFixed(word * row.step, row.decimals) : FormatTenthsOfDb(word, kSilent),
        row.unit);
}

float Chorus::GetParamValueNormalizedFromText(int index, std::string text) {
    if (!Words::Has(index)) return -1.0f;
    const Row& row = Words::RowAt(index);
    return row.map.Normalised(row.decimals > 0 ? ParseSteps(text, row.step) : ParseTenthsOfDb(text, kSilent));
}

void Chorus::GetParamSectionInfo(int index, PluginParameterInfo& info) {
    if (!Words::Has(index)) return;
    info = {};
    info.param_index = index;
    info.label = Narrow(Words::RowAt(index).label);
}

void Chorus::InitializeXyEditingData(GenericUIData& data) {
    data.groups.clear();
    data.entries.clear();
    for (const auto& pad : kPads) {
        const auto index = static_cast<int>(data.groups.size());
        data.groups.push_back(MakeGroup(pad.name, index, {pad.x, pad.x + 1}, {pad.y, pad.y + 1}));
        data.entries.emplace_back(pad.name);
    }
}

std::string Chorus::GetPresetName(int preset) { return Words::PresetName(preset); }

void Chorus::SetPreset(int preset) {
    if (Words::TakePreset(m_settings, preset)) m_cook.store(true, std::memory_order_release);
}

void Chorus::GetSettingsChunk(std::vector<std::uint8_t>& chunk) {
    SettingsChunk::Write(chunk, m_chunk_tag, m_settings);
}

void Chorus::SetSettingsChunk(const std::vector<std::uint8_t>& chunk) {
    if (SettingsChunk::Read(chunk, m_chunk_tag, m_settings)) m_cook.store(true, std::memory_order_release);
}

bool Chorus::FitsOldChunk(const std::vector<std::uint8_t>& chunk) {
    const bool fits = SettingsChunk::ReadOld(chunk, m_chunk_tag, m_settings);
    if (fits) m_cook.store(true, std::memory_order_release);
    return fits;
}

void Chorus::CheckCookProperties(const tWAVEFORMATEX* format, bool force) {
    const bool changed =
        format->nChannels != m_format.nChannels || format->nSamplesPerSec != m_format.nSamplesPerSec;
    m_format = *format;
    if (force) MakeRing();
    if (m_cook.exchange(false, std::memory_order_acquire) || force || changed)
        InitState(Snapshot(m_settings), force || changed);
}

// Makes room for the longest delay of this format, and keeps what the ring holds.
bool Chorus::MakeRing() {
    const double hz = std::min(static_cast<double>(m_format.nSamplesPerSec), kFastestHz);
    const int wanted = Channels() * (static_cast<int>(hz * kLongestSeconds) + 1);
    if (m_ring && wanted <= m_capacity) return true;
    std::unique_ptr<float[]> grown(new (std::nothrow) float[static_cast<std::size_t>(wanted)]());
    if (!grown) return m_ring != nullptr;
    if (m_ring) std::copy_n(m_ring.get(), m_capacity, grown.get());
    m_ring = std::move(grown);
    m_capacity = wanted;
    return true;
}

bool Chorus::InitState(const Props& settings, bool reset) {
    InitEnvelopes(true);
    if (!m_ring && !MakeRing()) return false;
    const std::int64_t hz = std::max<std::int64_t>(m_format.nSamplesPerSec, 1);
    const int channels = Channels();
    // One frame stays free: the index may stand at the end of a ring that became shorter.
    const std::int64_t longest = m_capacity / channels - 1;
    int frames = 1;
    for (std::size_t i = 0; i < 2; ++i) {
        auto& side = (*m_sides)[i];
        side.oscillator.SetIncrement(kRadiansPerStep / static_cast<double>(hz) * settings.frequency[i]);
        side.wet = GainFromTenthsOfDb(settings.wet[i], kSilent);
        side.dry = GainFromTenthsOfDb(settings.dry[i], kSilent);
        const auto delay = std::clamp<std::int64_t>(settings.delay[i] * hz / 10000, 0, longest);
        const auto depth = std::clamp<std::int64_t>(settings.depth[i] * delay / 1000, 0, delay);
        side.base = static_cast<int>(delay - depth);
        side.amplitude = static_cast<int>(depth / 2);
        if (side.channel < channels) frames = std::max(frames, side.base + 2 * side.amplitude);
    }
    m_ring_length = frames * channels;
    for (std::size_t i = 0; i < 2; ++i) {
        auto& side = (*m_sides)[i];
        if (reset) side.oscillator.SetPhase(0.0);
        side.write = reset ? side.channel : std::min(side.write, m_ring_length);
    }
    return true;
}

void Chorus::InitResetProcessingLight(bool) {
    if (m_ring) std::fill_n(m_ring.get(), m_capacity, 0.0f);
}

void Chorus::Cleanup() {
    m_ring.reset();
    m_capacity = m_ring_length = 0;
    m_cook.store(true, std::memory_order_release);
}

void Chorus::ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format, ProcessFlags&) {
    CheckCookProperties(format, false);
    if (!m_ring || frames < 1 || format->nChannels == 0) return;
    const int channels = Channels();
    const bool restart = m_tail.TakeRestart();
    // Until the tail begins, all of it is left to ring out.
    if (restart || !m_tail.TailMode()) m_tail_left = {};
    for (std::size_t i = 0; i < static_cast<std::size_t>(channels); ++i) {
        auto& side = (*m_sides)[i];
        if (restart) side.write = side.channel;
        if (restart || !m_tail.TailMode()) m_tail_left[i] = side.base / channels;
    }
    const auto allowed = m_tail.Limit(frames, m_tail_left);
    const ChorusPrivate::Ring ring{m_ring.get(), m_ring_length, channels};
    WithSamples(buffer, *format, OtherWidths::AreFloat, [&](auto* samples) {
        for (std::size_t i = 0; i < static_cast<std::size_t>(channels); ++i)
            (*m_sides)[i].Run(samples + i, allowed[i], format->nChannels, ring);
    });
    for (auto& side : *m_sides) side.oscillator.ReducePhase();
}

}  // namespace Corvo::DSP
