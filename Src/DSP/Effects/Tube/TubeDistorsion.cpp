#include "DSP/Effects/Tube/TubeDistorsion.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <utility>

#include "DSP/Effects/Parameters/ParameterTable.h"
#include "DSP/Effects/Parameters/ParameterText.h"
#include "DSP/Effects/Parameters/SettingsChunk.h"
#include "DSP/Effects/Tube/TubeOversampling.h"
#include "DSP/Effects/Tube/TubePresets.h"
#include "DSP/Effects/Tube/TubeRecentInput.h"
#include "DSP/Parts/SampleDispatch.h"
#include "Threads/LatestValue.h"
#include "Threads/SharedRecord.h"

namespace Corvo::DSP {
namespace {

using TubePresets::kPresets;

struct Row {
    const wchar_t *label, *unit;
    MP_TYPE type;
    std::array<const wchar_t*, 4> words;  // for the quarters of the control
};

// clang-format off
constexpr std::array<Row, VirtualTubeAmp::kParameters> kRows{{
    {L"Boost L",        L"Amount ", MPT_FLOAT, {L"None", L"Weak", L"Tiny", L"Strong"}},
    {L"Boost R",        L"Amount ", MPT_FLOAT, {L"None", L"Weak", L"Tiny", L"Strong"}},
    {L"Drive L",        L"Amount ", MPT_FLOAT, {L"Easy", L"Fast", L"Angry", L"Furious"}},
    {L"Drive R",        L"Amount ", MPT_FLOAT, {L"Easy", L"Fast", L"Angry", L"Furious"}},
    {L"Tone L",         L" ",       MPT_FLOAT, {L"Obscure", L"Cloudy", L"Bright", L"Holy"}},
    {L"Tone R",         L" ",       MPT_FLOAT, {L"Obscure", L"Cloudy", L"Bright", L"Holy"}},
    {L"Function L",     L"Type",    MPT_ENUM,  {L"Martens", L"Doidic S.", L"Doidic A.", L"Araya-S."}},
    {L"Function R",     L"Type",    MPT_ENUM,  {L"Martens", L"Doidic S.", L"Doidic A.", L"Araya-S."}},
    {L"Oversampling L", L"x ",      MPT_ENUM,  {}},
    {L"Oversampling R", L"x ",      MPT_ENUM,  {}},
}};
// clang-format on

constexpr int kFunctionLeft = 6, kOversamplingLeft = 8;
constexpr std::size_t kOversamplingRight = 9;
constexpr int kChunkSize = 4 + VirtualTubeAmp::kParameters * 4;

bool Has(int index) { return index >= 0 && index < static_cast<int>(kRows.size()); }
bool HasPreset(int preset) { return preset >= 0 && preset < static_cast<int>(kPresets.size()); }
const Row& RowAt(int index) { return kRows[static_cast<std::size_t>(index)]; }
float Limited(float normalised) { return normalised > 0.0f ? std::min(normalised, 1.0f) : 0.0f; }

VirtualTubeAmp::Values PresetValues(int preset) {
    VirtualTubeAmp::Values values;
    for (std::size_t i = 0; i < values.size(); ++i)
        values[i] = kPresets[static_cast<std::size_t>(preset)].values[i / 2];
    return values;
}

// "Weak | 33" and "33" both mean 33 percent.
float Percent(std::string_view text) {
    const auto bar = text.find('|');
    return ParseNumber(bar == text.npos ? text : text.substr(bar + 1)) / 100.0f;
}

float OversamplingFromNumber(float number) {
    constexpr struct {
        float factor, value;
    } kTyped[] = {{2.0f, 0.24f}, {4.0f, 0.48f}, {8.0f, 0.64f}, {12.0f, 0.76f}};
    for (const auto& typed : kTyped)
        if (number == typed.factor) return typed.value;
    return 0.9f;
}

}  // namespace

// What blocks are processed with. All of it is the audio thread's, but for the draft of the filters.
struct TubeDistorsion::Processing {
    LatestValue<TubeOversampling> filters;
    VirtualTubeAmp amp;
    TubeRecentInput recent;
    TubeBuffer buffer;
    tWAVEFORMATEX format{};
    Values cooked{};

    // Starts from silence.
    void Clear(int factor) {
        filters.Take();
        filters.Taken().Clear(factor);
        recent.Clear();
    }

    // Takes what was prepared, and comes to `factor` by itself where nobody prepared it: automation asks for
    // it in the middle of a block.
    void FollowFactor(int factor) {
        const int channels = format.nChannels;
        if (channels < 1 || channels > MaxNumChannels) return;  // blocks pass unchanged
        const bool prepared = filters.Take() != nullptr;
        auto& live = filters.Taken();
        if (live.Factor() != factor)
            live.Clear(factor);
        else if (!prepared)
            return;
        auto warmUp = recent.Samples(channels);
        live.Process(amp, buffer, warmUp.data(), TubeRecentInput::kFrames, channels);
    }

    template <typename Sample>
    void Process(Sample* samples, int frames, int channels) {
        amp.FilterTone(samples, frames, channels);
        recent.Add(samples, frames, channels);
        filters.Taken().Process(amp, buffer, samples, frames, channels);
    }
};

TubeDistorsion::TubeDistorsion() : m_processing(std::make_unique<Processing>()) {
    SetPreset(GetDefaultPreset());
}
TubeDistorsion::~TubeDistorsion() = default;

int TubeDistorsion::GetSettingsChunkSize() { return kChunkSize; }
int TubeDistorsion::NumPresets() { return static_cast<int>(kPresets.size()); }
int TubeDistorsion::GetParamCountReal() { return static_cast<int>(kRows.size()); }
std::string TubeDistorsion::GetName() { return "Valvex"; }
bool TubeDistorsion::WantsXySerialization() { return true; }
std::string TubeDistorsion::GetImage() { return "builtinTube.png"; }
std::string TubeDistorsion::GetPluginIconPath() { return "BuiltinPlugins/valvex.png"; }
bool TubeDistorsion::AllowChangeParamFromInputBox(int index) { return Has(index); }

const MP_PARAMINFO* TubeDistorsion::GetParametersInfo() {
    static const auto records = MakeNormalisedTable(kRows, 1);
    return records.data();
}

std::string TubeDistorsion::GetPresetName(int preset) {
    return HasPreset(preset) ? kPresets[static_cast<std::size_t>(preset)].name : std::string();
}

float TubeDistorsion::GetParamFromProp(int index, int preset) {
    return Has(index) && HasPreset(preset) ? PresetValues(preset)[static_cast<std::size_t>(index)] : -1.0f;
}

float TubeDistorsion::GetParamPlain(int index) const {
    return Has(index) ? LoadShared(m_params[static_cast<std::size_t>(index)]) : 0.0f;
}

float TubeDistorsion::GetParam(int index) { return Limited(GetParamPlain(index)); }

int TubeDistorsion::WantedFactor() const {
    return VirtualTubeAmp::OversamplingFactor(LoadShared(m_params[kOversamplingRight]));
}

int TubeDistorsion::GetLatency() {
    const int factor = WantedFactor();
    return factor == 1 ? 0 : static_cast<int>(std::lround(TubeOversampling::Delay(factor)));
}

bool TubeDistorsion::DoSetParam(int index, float normalised, bool fromAutomation) {
    if (!Has(index)) return false;
    StoreShared(m_params[static_cast<std::size_t>(index)], normalised);
    if (static_cast<std::size_t>(index) == kOversamplingRight && !fromAutomation) PrepareOversampling();
    return true;
}

void TubeDistorsion::ApplyValues(const Values& values) {
    Assign(m_params, values);
    PrepareOversampling();
    m_cook.store(true, std::memory_order_release);
}

void TubeDistorsion::SetPreset(int preset) {
    if (HasPreset(preset)) ApplyValues(PresetValues(preset));
}

void TubeDistorsion::GetSettingsChunk(std::vector<std::uint8_t>& chunk) {
    ChunkWriter write(chunk, kChunkSize);
    write(m_chunk_tag) && write(Snapshot(m_params));
}

void TubeDistorsion::SetSettingsChunk(const std::vector<std::uint8_t>& chunk) {
    ChunkReader read(chunk);
    std::int32_t tag;
    Values values;
    if (!read(tag) || !read(values)) return;
    m_chunk_tag = tag;
    ApplyValues(values);
}

std::wstring TubeDistorsion::GetParameterFormattedText(int index, double value) {
    if (!Has(index)) return {};
    const Row& row = RowAt(index);
    const float normalised = Limited(static_cast<float>(value));
    if (index >= kOversamplingLeft)
        return WithUnit(FormatInteger(VirtualTubeAmp::OversamplingFactor(normalised)), row.unit);
    if (index >= kFunctionLeft)
        return row.words[static_cast<std::size_t>(VirtualTubeAmp::FunctionIndex(normalised))];
    // The word follows the number shown, so that a text read back shows the same word.
    const auto percent = std::lround(static_cast<double>(normalised) * 100.0);
    return row.words[static_cast<std::size_t>(std::min(percent / 25, 3l))] + std::wstring(L" | ") +
           FormatInteger(percent);
}

float TubeDistorsion::GetParamValueNormalizedFromText(int index, std::string text) {
    if (!Has(index)) return -1.0f;
    if (index >= kOversamplingLeft) return OversamplingFromNumber(ParseNumber(text));
    if (index < kFunctionLeft) return Limited(Percent(text));
    const auto names = GetParameterAvailableValues(index);
    const std::vector<std::string_view> views(names.begin(), names.end());
    const int found = FindName(text, views);
    return found < 0 ? -1.0f : (static_cast<float>(found) + 0.5f) / static_cast<float>(views.size());
}

std::vector<std::string> TubeDistorsion::GetParameterAvailableValues(int index) {
    if (!Has(index) || index < kFunctionLeft) return {};
    if (index >= kOversamplingLeft) return {"1", "2", "4", "8", "12", "16"};
    std::vector<std::string> names;
    for (const wchar_t* word : RowAt(index).words) names.push_back(Narrow(word));
    return names;
}

void TubeDistorsion::GetParamSectionInfo(int index, PluginParameterInfo& info) {
    if (!Has(index)) return;
    info = {};
    info.param_index = index;
    info.values = GetParameterAvailableValues(index);
    info.label = Narrow(GetParamName(index));
}

void TubeDistorsion::InitializeXyEditingData(GenericUIData& data) {
    data = {};
    for (std::size_t i = 0; i < TubePresets::kGroupNames.size(); ++i)
        data.groups.push_back(MakeGroup(TubePresets::kGroupNames[i], static_cast<int>(i), {0, 1}, {2, 3}));
    for (const auto& preset : kPresets) data.entries.push_back(TubePresets::kGroupNames[preset.group]);
}

void TubeDistorsion::PrepareOversampling() {
    const int factor = WantedFactor();
    if (factor == m_prepared_factor) return;
    m_prepared_factor = factor;
    m_processing->filters.Draft().Clear(factor);
    m_processing->filters.Publish();
}

void TubeDistorsion::SetMaximumFramesPerBuffer(int frames) { m_max_frames = frames; }
void TubeDistorsion::AllocateBuffers() { m_processing->buffer.Prepare(m_max_frames); }
void TubeDistorsion::FreeBuffers() { m_processing->buffer.Free(); }

void TubeDistorsion::Cleanup() {
    FreeBuffers();
    m_processing->Clear(WantedFactor());
    m_processing->amp.ClearMemories();
}

void TubeDistorsion::CheckCookProperties(const tWAVEFORMATEX* format, bool force) {
    const tWAVEFORMATEX before = std::exchange(m_processing->format, *format);
    const bool stale = m_cook.exchange(false, std::memory_order_acquire);
    const bool fromSilence = force || format->nChannels != before.nChannels;
    if (force) AllocateBuffers();
    if (stale || fromSilence || format->nSamplesPerSec != before.nSamplesPerSec) InitState(fromSilence);
}

void TubeDistorsion::InitState(bool fromSilence) {
    InitEnvelopes(true);
    const auto values = Snapshot(m_params);
    auto& amp = m_processing->amp;
    const int factor = VirtualTubeAmp::OversamplingFactor(values[kOversamplingRight]);
    if (fromSilence) {
        m_processing->Clear(factor);
        amp.SetParameter(values, VirtualTubeAmp::kAllParameters);
    }
    using Bits = std::array<std::uint32_t, std::tuple_size_v<Values>>;
    const auto now = std::bit_cast<Bits>(values), before = std::bit_cast<Bits>(m_processing->cooked);
    for (std::size_t i = 0; i < now.size(); ++i)
        if (now[i] != before[i]) amp.SetParameter(values, static_cast<int>(i));
    m_processing->cooked = values;
    if (!fromSilence) m_processing->FollowFactor(factor);
}

void TubeDistorsion::ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format, ProcessFlags&) {
    CheckCookProperties(format, false);
    const int channels = format->nChannels;
    if (frames < 1 || channels < 1 || channels > MaxNumChannels) return;
    WithSamples(buffer, *format, OtherWidths::AreFloat,
                [&](auto* samples) { m_processing->Process(samples, frames, channels); });
}

}  // namespace Corvo::DSP
