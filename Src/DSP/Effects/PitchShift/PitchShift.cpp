#include "DSP/Effects/PitchShift/PitchShift.h"

#include <cmath>
#include <mutex>
#include <new>

#include "DSP/Effects/Parameters/FixedPoint.h"
#include "DSP/Effects/Parameters/ParameterTable.h"
#include "DSP/Effects/Parameters/ParameterText.h"
#include "DSP/Effects/Parameters/SettingsChunk.h"
#include "Threads/SharedRecord.h"

namespace Corvo::DSP {
namespace {

using PitchShiftPrivate::_transform_props;

struct Row {
    const wchar_t *label, *unit;
    MP_TYPE type;
};

constexpr std::array kRows{
    Row{L"Pitch L", L"semitones", MPT_FLOAT},
    Row{L"Pitch R", L"semitones", MPT_FLOAT},
};
constexpr FixedPoint kPitch{5990.0f, 10.0f};
constexpr std::int32_t kUnchanged = 3000, kHighest = 6000;

struct Preset {
    const char* name;
    std::int32_t pitch;
};

constexpr std::array kPresets{
    Preset{"(Default)", 3000},     Preset{"1 Octave Up", 6000},     Preset{"2 Semitones Up", 3367},
    Preset{"1 Semitone Up", 3178}, Preset{"1 Semitone Down", 2831}, Preset{"2 Semitones Down", 2672},
    Preset{"1 Octave Down", 1500},
};

constexpr _transform_props RecordOf(std::int32_t pitch) {
    return {.pitch = {pitch, pitch},
            .carried2 = {1000, 1000},
            .quality = 4,
            .carried5 = 4,
            .fftSize = 3,
            .carried7 = {3, 0, 0, -900, -900, 20, 20, 2000, 2000, -960, -960, 0, 0, 0},
            .backEnd = 1};
}

constexpr int kChunkSize = 4 + static_cast<int>(sizeof(_transform_props));
constexpr int kMostChannels = 16;  // of the "New" engine

// Semitones of a ratio, and the way back to a normalised value, in the single precision of saved projects.
constexpr float kSemitonesPerDecade = 39.863106f;
constexpr float kDecadesPerSemitone = 0.025085853f;
constexpr float kRatioPerWord = 0.00033333333f;
constexpr float kUnityNormalised = 0.50083476f, kFloorNormalised = 0.0016694491f;

bool VisitChunk(auto&& visit, auto& tag, auto& record) {
    return visit(tag) && visit(record.pitch) && visit(record.carried2) && visit(record.quality) &&
           visit(record.carried5) && visit(record.fftSize) && visit(record.carried7) && visit(record.backEnd);
}

// A record from a chunk may hold anything; beyond an octave up the engine would need more than real time.
double Factor(std::int32_t word) {
    if (word == kUnchanged) return 1.0;
    return std::clamp(word, 0, kHighest) * 0.0003333333333333333;
}

int BackEndIndex(const _transform_props& record) {
    return std::clamp(record.backEnd, 0, PitchAdapterInfo::kCount - 1);
}

}  // namespace

PitchShift::PitchShift() = default;
PitchShift::~PitchShift() = default;

std::string PitchShift::GetName() { return "Pitch Shift"; }
std::string PitchShift::GetImage() { return "builtinPitch.png"; }
std::string PitchShift::GetPluginIconPath() { return "BuiltinPlugins/PitchShift@3x.png"; }
int PitchShift::GetParamCountReal() { return static_cast<int>(kRows.size()); }
int PitchShift::SeparateLeftRightControls() { return 0; }
bool PitchShift::AllowChangeParamFromInputBox(int) { return true; }
int PitchShift::GetSettingsChunkSize() { return kChunkSize; }

const MP_PARAMINFO* PitchShift::GetParametersInfo() {
    static const auto records = MakeNormalisedTable(kRows, 1);
    return records.data();
}

int PitchShift::NumPresets() { return static_cast<int>(kPresets.size()); }

std::string PitchShift::GetPresetName(int preset) {
    return preset >= 0 && preset < NumPresets() ? kPresets[static_cast<std::size_t>(preset)].name : "";
}

_transform_props PitchShift::GetPresetData(int preset) {
    const int last = static_cast<int>(kPresets.size()) - 1;
    return RecordOf(kPresets[static_cast<std::size_t>(std::clamp(preset, 0, last))].pitch);
}

void PitchShift::SetPreset(int preset) {
    if (preset >= 0 && preset < NumPresets()) TakeRecord(GetPresetData(preset));
}

float PitchShift::GetParamFromProp(int index, int preset) {
    if (index < 0 || index > 1 || preset < 0 || preset >= NumPresets()) return -1.0f;
    return kPitch.Normalised(GetPresetData(preset).pitch[static_cast<std::size_t>(index)]);
}

// The index is external: it stands for a pair, of which the left side is shown.
float PitchShift::GetParam(int index) {
    return index == 0 ? kPitch.Normalised(LoadShared(m_record.pitch[0])) : 0.0f;
}

float PitchShift::GetParamPlain(int index) const {
    if (index != 0 && index != 1) return 0.0f;
    return static_cast<float>(LoadShared(m_record.pitch[static_cast<std::size_t>(index)]));
}

bool PitchShift::DoSetParam(int index, float normalised, bool fromAutomation) {
    if (index == 0 || index == 1)
        StoreShared(m_record.pitch[static_cast<std::size_t>(index)], kPitch.Word(normalised));
    // Automation runs on the audio thread, which may not wait.
    std::unique_lock lock(m_lock, std::defer_lock);
    if (fromAutomation ? lock.try_lock() : (lock.lock(), true))
        CookPitchShift(Snapshot(m_record), m_channel_count);
    else
        m_factors_pending.store(true, std::memory_order_release);
    return false;
}

std::wstring PitchShift::GetParameterFormattedText(int index, double value) {
    if (index != 0 && index != 1) return {};
    const float ratio = static_cast<float>(kPitch.Word(static_cast<float>(value))) * kRatioPerWord;
    float semitones = kSemitonesPerDecade * std::log10(ratio);
    if (semitones >= -0.01f && semitones <= 0.01f) semitones = 0.0f;
    return WithUnit(FormatFixed(semitones, 1), kRows[0].unit) + L" - " + FormatFixed(ratio * 100.0f, 1) +
           L"%";
}

float PitchShift::GetParamValueNormalizedFromText(int index, std::string text) {
    if (index != 0 && index != 1) return -1.0f;
    return std::pow(10.0f, ParseNumber(text) * kDecadesPerSemitone) * kUnityNormalised - kFloorNormalised;
}

void PitchShift::GetSettingsChunk(std::vector<std::uint8_t>& chunk) {
    auto record = Snapshot(m_record);
    VisitChunk(ChunkWriter(chunk, kChunkSize), m_chunk_tag, record);
}

void PitchShift::SetSettingsChunk(const std::vector<std::uint8_t>& chunk) {
    std::int32_t tag = 0;
    _transform_props record{};
    if (!VisitChunk(ChunkReader(chunk), tag, record)) return;
    m_chunk_tag = tag;
    TakeRecord(record);
}

bool PitchShift::FitsOldChunk(const std::vector<std::uint8_t>& chunk) {
    ChunkReader reader(chunk);
    const auto wide = [&](std::int32_t& word) { return reader(word) && reader.Skip(4); };
    std::array<std::int32_t, sizeof(_transform_props) / 4> words;
    if (!reader.Skip(4) || !std::ranges::all_of(words, wide)) return false;
    TakeRecord(std::bit_cast<_transform_props>(words));
    return true;
}

void PitchShift::TakeRecord(const _transform_props& record) {
    {
        const std::lock_guard lock(m_lock);
        const int wanted = BackEndIndex(record);
        if (m_back_end.index != wanted && m_spare.index != wanted)
            m_spare = {std::unique_ptr<PitchAdapter>(PitchAdapter::CreateAdapter(wanted)), wanted};
        Assign(m_record, record);  // last: a cook that reads it finds the back-end ready
    }
    m_cook.store(true, std::memory_order_release);
}

void PitchShift::Cleanup() {
    const std::lock_guard lock(m_lock);
    m_back_end = {};
    m_spare = {};
}

int PitchShift::GetLatency() {
    const std::lock_guard lock(m_lock);
    return m_back_end.adapter ? m_back_end.adapter->GetLatency() : 0;
}

void PitchShift::CheckCookProperties(const tWAVEFORMATEX* format, bool force) {
    const bool newFormat = format->nChannels != m_format.nChannels ||
                           format->nSamplesPerSec != m_format.nSamplesPerSec || !m_back_end.adapter;
    if (!m_cook.exchange(false, std::memory_order_acquire) && !force && !newFormat) return;
    // Held from before the record is read: an edit in between would reach the back-end first and be
    // overwritten.
    std::unique_lock lock(m_lock, std::defer_lock);
    if (force) lock.lock();
    if ((force || lock.try_lock()) && InitState(Snapshot(m_record), format, force))
        m_format = *format;
    else
        m_cook.store(true, std::memory_order_release);  // the next block tries again
}

bool PitchShift::InitState(const _transform_props& record, const tWAVEFORMATEX* format, bool force) {
    std::unique_lock lock(m_lock, std::defer_lock);
    if (force)
        lock.lock();
    else if (!lock.try_lock())
        return false;
    InitEnvelopes(true);
    m_channel_count = format->nChannels;
    try {
        ConfigureBackEnd(record, format);
    } catch (const std::bad_alloc&) {
        return false;  // the next block tries again
    }
    return true;
}

void PitchShift::ConfigureBackEnd(const _transform_props& record, const tWAVEFORMATEX* format) {
    const int wanted = BackEndIndex(record);
    if (m_back_end.index != wanted) std::swap(m_back_end, m_spare);
    if (m_back_end.index != wanted)
        m_back_end = {std::unique_ptr<PitchAdapter>(PitchAdapter::CreateAdapter(wanted)), wanted};
    if (m_channel_count < 1 || m_channel_count > kMostChannels) return;

    PitchAdapter& adapter = *m_back_end.adapter;
    adapter.SetChannelsNum(m_channel_count);
    adapter.SetSampleRate(static_cast<int>(format->nSamplesPerSec));
    CookPitchShift(record, m_channel_count);
    adapter.SetFFTSize(record.fftSize);
    adapter.SetQuality(record.quality);
    adapter.CookFactors();
}

void PitchShift::CookPitchShift(const _transform_props& record, int channels) {
    m_factors = {Factor(record.pitch[0]), Factor(record.pitch[1])};
    if (!m_back_end.adapter) return;
    for (int channel = 0; channel < std::min(channels, 2); ++channel)
        m_back_end.adapter->SetPitchFactor(channel,
                                           static_cast<float>(m_factors[static_cast<std::size_t>(channel)]));
}

void PitchShift::ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format, ProcessFlags&) {
    CheckCookProperties(format, false);
    if (m_factors_pending.load(std::memory_order_relaxed)) {
        const std::unique_lock lock(m_lock, std::try_to_lock);
        if (lock && m_factors_pending.exchange(false, std::memory_order_acquire))
            CookPitchShift(Snapshot(m_record), m_channel_count);
    }
    // A cook that has not come about yet leaves a back-end that knows other channels: skip the block.
    if (frames < 1 || !m_back_end.adapter || m_channel_count != format->nChannels || m_channel_count < 1 ||
        m_channel_count > kMostChannels)
        return;
    if (format->wBitsPerSample == 64)
        m_back_end.adapter->ProcessInPlace(buffer, frames);
    else
        m_back_end.adapter->ProcessInPlace(reinterpret_cast<float*>(buffer), frames);
}

}  // namespace Corvo::DSP
