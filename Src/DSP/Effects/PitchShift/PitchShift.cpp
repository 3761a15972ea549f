#include "DSP/Effects/PitchShift/PitchShift.h"

#include <cmath>
#include <new>
#include <optional>
#include <utility>

#include "DSP/Effects/Parameters/EffectTable.h"
#include "DSP/Effects/Parameters/ParameterText.h"
#include "DSP/Pitch/PitchAdapter.h"
#include "Threads/LatestValue.h"
#include "Threads/SharedRecord.h"

namespace Corvo::DSP {
namespace {

using PitchShiftPrivate::_transform_props;

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

constexpr _transform_props SettingsOf(std::int32_t pitch) {
    return {.pitch = {pitch, pitch},
            .carried2 = {1000, 1000},
            .quality = 4,
            .carried5 = 4,
            .fftSize = 3,
            .carried7 = {3, 0, 0, -900, -900, 20, 20, 2000, 2000, -960, -960, 0, 0, 0},
            .backEnd = 1};
}

constexpr int kMostEngineChannels = 16, kQualityOfANewEngine = 5;  // of the "New" back-end

// Semitones of a ratio, and the way back to a normalised value, in the single precision of saved projects.
constexpr float kSemitonesPerDecade = 39.863106f;
constexpr float kDecadesPerSemitone = 0.025085853f;
constexpr float kRatioPerWord = 0.00033333333f;
constexpr float kUnityNormalised = 0.50083476f, kFloorNormalised = 0.0016694491f;

constexpr Shown kSemitones{
    [](const ParameterRow& row, double value) {
        const float ratio =
            static_cast<float>(row.storage.map.Word(static_cast<float>(value))) * kRatioPerWord;
        float semitones = kSemitonesPerDecade * std::log10(ratio);
        if (semitones >= -0.01f && semitones <= 0.01f) semitones = 0.0f;
        return WithUnit(FormatFixed(semitones, 1), row.unit) + L" - " + FormatFixed(ratio * 100.0f, 1) + L"%";
    },
    [](const ParameterRow&, const std::string& text) {
        return std::pow(10.0f, ParseNumber(text) * kDecadesPerSemitone) * kUnityNormalised - kFloorNormalised;
    }};

// clang-format off
constexpr std::array<ParameterRow, 2> kRows{{
    // label      unit          type       span     floor   shown as    word of the settings
    {L"Pitch L", L"semitones", MPT_FLOAT, {5990.0f, 10.0f}, kSemitones, WordAt(&_transform_props::pitch, 0)},
    {L"Pitch R", L"semitones", MPT_FLOAT, {5990.0f, 10.0f}, kSemitones, WordAt(&_transform_props::pitch, 1)},
}};
// clang-format on

const EffectTable& Table() {
    static const EffectTable table = [] {
        EffectTable made{
            .name = "Pitch Shift",
            .image = "builtinPitch.png",
            .icon = "BuiltinPlugins/PitchShift@3x.png",
            .rows = kRows,
            .chunk = {.words = kWordsOf<_transform_props>, .wideWords = kWordsOf<_transform_props>},
            .sectionLabel = SectionLabel::None,
            .inputGuard = InputGuard::None};  // the back-ends have their own
        for (const auto& preset : kPresets)
            made.presets.push_back({preset.name, WordsOf(SettingsOf(preset.pitch))});
        return made;
    }();
    return table;
}

// A record from a chunk may hold anything; beyond an octave up the engine would need more than real time.
double Factor(std::int32_t word) {
    if (word == kUnchanged) return 1.0;
    return std::clamp(word, 0, kHighest) * 0.0003333333333333333;
}

int BackEndIndex(const _transform_props& record) {
    return std::clamp(record.backEnd, 0, PitchAdapterInfo::kCount - 1);
}

void SendFactors(PitchAdapter& adapter, const std::array<std::int32_t, 2>& pitch, int channels) {
    for (int channel = 0; channel < std::min(channels, 2); ++channel)
        adapter.SetPitchFactor(channel, static_cast<float>(Factor(pitch[static_cast<std::size_t>(channel)])));
}

// All that a back-end is told.
struct Setup {
    std::array<std::int32_t, 2> pitch;
    std::int32_t fftSize, quality;
    int channels, rate;
    bool operator==(const Setup&) const = default;

    static Setup Of(const _transform_props& record, int channels, int rate) {
        return {record.pitch, record.fftSize, record.quality, channels, rate};
    }
    // To one that was told before, `afresh` makes it sound like a new one: how much silence the engine starts
    // with comes from the quality that it had. May throw std::bad_alloc.
    void Tell(PitchAdapter& adapter, bool afresh) const {
        if (channels < 1 || channels > kMostEngineChannels) return;
        if (afresh) adapter.SetQuality(kQualityOfANewEngine);
        adapter.SetChannelsNum(channels);
        adapter.SetSampleRate(rate);
        SendFactors(adapter, pitch, channels);
        adapter.SetFFTSize(fftSize);
        adapter.SetQuality(quality);
        adapter.CookFactors();
    }
};

}  // namespace

// The back-end in use, the one handed over, and the one that came back.
struct PitchShift::BackEnds {
    struct BackEnd {
        std::unique_ptr<PitchAdapter> adapter;
        int index = kNone;
        std::optional<Setup> toldAhead;  // until the first cook
    };
    static constexpr int kNone = -1;

    LatestValue<BackEnd> slots;
    // The user-interface thread sends edits to the newest one, in use or on its way. Only that thread frees
    // back-ends, so what it reads here lives while it uses it. The one in use lives for both threads.
    std::atomic<PitchAdapter*> newest{nullptr}, inUse{nullptr};
    std::atomic<int> newestIndex{kNone};
    std::atomic<bool> factorsPending{false};  // automation stored some, on the audio thread
    std::atomic<unsigned> edits{0};           // of the pitch, by the user-interface thread
    std::atomic<int> channels{1}, rate{0};    // 0: not known yet
    tWAVEFORMATEX format{};                   // the audio thread's

    // User-interface thread. The back-end is configured here, as that allocates and takes its time.
    // False when the newest one will do.
    bool HandOver(const _transform_props& record) {
        const int index = BackEndIndex(record);
        if (newestIndex.load() == index) return false;
        BackEnd made = Make(index);
        if (const int known = rate.load(); known > 0) {
            made.toldAhead = Setup::Of(record, channels.load(), known);
            made.toldAhead->Tell(*made.adapter, false);
        }
        // The audio thread may have given the old one back without having named the new one yet.
        auto* cameBack = slots.Draft().adapter.get();
        inUse.compare_exchange_strong(cameBack, nullptr);
        newest.store(made.adapter.get(), std::memory_order_release);
        newestIndex.store(index);
        slots.Draft() = std::move(made);
        slots.Publish();
        return true;
    }
    // No block is being processed.
    void Clear() {
        newest.store(nullptr);
        inUse.store(nullptr);
        newestIndex.store(kNone);
        slots.Clear();
    }

    // Audio thread: looks for a new one. The index of the one then in use, kNone without any.
    int Take() {
        if (slots.Take()) NameTheOneInUse();
        return slots.Taken().index;
    }
    PitchAdapter* InUse() { return slots.Taken().adapter.get(); }
    // May throw std::bad_alloc.
    void Use(int index, const Setup& setup, bool afresh) {
        BackEnd& taken = slots.Taken();
        if (taken.index != index) {
            int expectedIndex = taken.index;
            PitchAdapter* expected = InUse();
            taken = Make(index);
            // Not if another one is on its way.
            newestIndex.compare_exchange_strong(expectedIndex, index);
            newest.compare_exchange_strong(expected, InUse());
            NameTheOneInUse();
        }
        if (std::exchange(taken.toldAhead, {}) != setup) setup.Tell(*InUse(), afresh);
    }

private:
    void NameTheOneInUse() { inUse.store(InUse(), std::memory_order_release); }
    static BackEnd Make(int index) {
        return {std::unique_ptr<PitchAdapter>(PitchAdapter::CreateAdapter(index)), index, {}};
    }
};

PitchShift::PitchShift() : CorvoEffect(Table(), &m_record), m_back_ends(std::make_unique<BackEnds>()) {}
PitchShift::~PitchShift() = default;

int PitchShift::SeparateLeftRightControls() { return 0; }

std::wstring PitchShift::GetParameterFormattedText(int index, double value) {
    const ParameterRow* const row = RealRow(index);
    return row ? row->shown.text(*row, value) : L"";
}

float PitchShift::GetParamValueNormalizedFromText(int index, std::string text) {
    const ParameterRow* const row = RealRow(index);
    return row ? row->shown.read(*row, text) : -1.0f;
}

bool PitchShift::AllowChangeParamFromInputBox(int) { return true; }

_transform_props PitchShift::GetPresetData(int preset) {
    const int last = static_cast<int>(kPresets.size()) - 1;
    return SettingsOf(kPresets[static_cast<std::size_t>(std::clamp(preset, 0, last))].pitch);
}

void PitchShift::SetPreset(int preset) {
    if (preset >= 0 && preset < NumPresets()) TakeRecord(GetPresetData(preset));
}

bool PitchShift::DoSetParam(int index, float normalised, bool fromAutomation) {
    CorvoEffect::DoSetParam(index, normalised, fromAutomation);
    if (fromAutomation) {
        m_back_ends->factorsPending.store(true, std::memory_order_relaxed);
    } else {
        m_back_ends->edits.fetch_add(1, std::memory_order_acq_rel);
        CookPitchShift(Snapshot(m_record), m_back_ends->channels.load());
    }
    return false;  // nothing else of the back-end is stale
}

void PitchShift::SetSettingsChunk(const std::vector<std::uint8_t>& chunk) {
    SettingsWords words;
    if (Table().chunk.Read(chunk, m_chunk_tag, words)) TakeRecord(RecordOf<_transform_props>(words));
}

bool PitchShift::FitsOldChunk(const std::vector<std::uint8_t>& chunk) {
    SettingsWords words;
    std::int32_t unused;
    if (!Table().chunk.ReadWide(chunk, unused, words)) return false;
    TakeRecord(RecordOf<_transform_props>(words));
    return true;
}

void PitchShift::TakeRecord(const _transform_props& record) {
    const bool handedOver = m_back_ends->HandOver(record);
    Assign(m_record, record);  // last: a cook that reads it finds the back-end there
    MarkStale();
    // On this thread, as the engine allocates for another pitch.
    if (!handedOver) CookPitchShift(record, m_back_ends->channels.load());
}

void PitchShift::Cleanup() { m_back_ends->Clear(); }

int PitchShift::GetLatency() {
    PitchAdapter* const adapter = m_back_ends->inUse.load(std::memory_order_acquire);
    return adapter ? adapter->GetLatency() : 0;
}

void PitchShift::CheckCookProperties(const tWAVEFORMATEX* format, bool force) {
    const tWAVEFORMATEX& before = m_back_ends->format;
    const bool newFormat = format->nChannels != before.nChannels ||
                           format->nSamplesPerSec != before.nSamplesPerSec || !m_back_ends->InUse();
    if (!TakeFlag(m_cook) && !force && !newFormat) return;
    m_back_ends->factorsPending.store(false, std::memory_order_relaxed);  // the cook sends them
    const unsigned edits = m_back_ends->edits.load(std::memory_order_acquire);
    auto record = Snapshot(m_record);
    // The back-end that came decides, never the record: one caught in mid-change may name another that is
    // still being handed over, and its flag follows.
    if (const int index = m_back_ends->Take(); index != BackEnds::kNone) record.backEnd = index;
    if (!InitState(record, format, force)) throw std::bad_alloc();  // passes sound until it is prepared again
    m_back_ends->format = *format;
    // An edit after the record was read may have reached the back-end first.
    if (m_back_ends->edits.fetch_add(0, std::memory_order_acq_rel) != edits)
        m_back_ends->factorsPending.store(true, std::memory_order_relaxed);
}

bool PitchShift::InitState(const _transform_props& record, const tWAVEFORMATEX* format, bool force) {
    InitEnvelopes(true);
    const int channels = format->nChannels, rate = static_cast<int>(format->nSamplesPerSec);
    m_back_ends->channels.store(channels);
    m_back_ends->rate.store(rate);
    try {
        m_back_ends->Use(BackEndIndex(record), Setup::Of(record, channels, rate), force);
    } catch (const std::bad_alloc&) {
        return false;
    }
    return true;
}

void PitchShift::CookPitchShift(const _transform_props& record, int channels) {
    if (PitchAdapter* const adapter = m_back_ends->newest.load(std::memory_order_acquire))
        SendFactors(*adapter, record.pitch, channels);
}

void PitchShift::ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format, ProcessFlags&) {
    CheckCookProperties(format, false);
    PitchAdapter* const adapter = m_back_ends->InUse();
    if (TakeFlag(m_back_ends->factorsPending) && adapter)
        SendFactors(*adapter, Snapshot(m_record).pitch, m_back_ends->channels.load());
    const int channels = m_back_ends->channels.load(std::memory_order_relaxed);
    // A cook that failed leaves a back-end that knows other channels: skip the block.
    if (frames < 1 || !adapter || channels != format->nChannels || channels < 1 ||
        channels > kMostEngineChannels)
        return;
    if (format->wBitsPerSample == 64)
        adapter->ProcessInPlace(buffer, frames);
    else
        adapter->ProcessInPlace(reinterpret_cast<float*>(buffer), frames);
}

}  // namespace Corvo::DSP
