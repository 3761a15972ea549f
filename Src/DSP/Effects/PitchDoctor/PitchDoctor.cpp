#include "DSP/Effects/PitchDoctor/PitchDoctor.h"

#include <algorithm>

#include "DSP/Effects/Parameters/SettingsChunk.h"
#include "DSP/Effects/PitchDoctor/PitchDoctorEngine.h"
#include "DSP/Effects/PitchDoctor/PitchDoctorTable.h"
#include "DSP/Parts/SampleDispatch.h"
#include "Threads/SharedRecord.h"

namespace Corvo::DSP {
namespace {

constexpr std::int32_t kChunkVersion = 1;
constexpr std::uint32_t kHighestRate = 768000;
constexpr std::uint32_t kFields = kWordsOf<PitchDoctorSettings>;

}  // namespace

// One engine for each lowest pitch, so that choosing another one makes no memory.
struct PitchDoctor::Engines {
    Arena memory;  // of which only what is in use takes pages
    std::array<std::unique_ptr<PitchDoctorEngine>, kLowestPitches.size()> all;
    PitchDoctorEngine* inUse = nullptr;  // null until prepared
    std::uint32_t rate = 0;
    std::unique_ptr<PitchReadingRing> readings;         // the editor's thread's, from its first editor on
    std::atomic<PitchReadingRing*> published{nullptr};  // while an editor wants readings

    void Prepare(std::uint32_t wanted) {
        inUse = nullptr;
        if (rate == wanted) return;
        rate = 0;  // should memory run out
        all = {};
        decltype(all) made;
        for (std::size_t i = 0; i < all.size(); ++i)
            made[i] = std::make_unique<PitchDoctorEngine>(wanted, kLowestPitches[i]);
        ReserveFor(memory, [&](Arena& arena) {
            for (auto& engine : made) engine->Prepare(arena);
        });
        all = std::move(made);
        rate = wanted;
    }
    void Use(PitchDoctorEngine* engine) {
        if (engine && engine != inUse) engine->Clear(inUse ? inUse->Position() : 0);
        inUse = engine;
    }
    template <typename Sample>
    void Run(std::array<Sample*, MaxNumChannels> samples, int channels, int frames, std::ptrdiff_t stride) {
        if (frames < 1 || channels < 1 || !inUse) return;
        inUse->Process(samples, channels, frames, stride, published.load(std::memory_order_acquire));
    }
};

PitchDoctor::PitchDoctor()
    : CorvoEffectBase(PitchDoctorTable(), &m_settings), m_engines(std::make_unique<Engines>()) {
    CorvoEffectBase::SetPreset(0);
}
PitchDoctor::~PitchDoctor() = default;

bool PitchDoctor::HasSeparateLeftRightSettings() { return false; }
bool PitchDoctor::SupportsNoninterleaved() { return true; }
bool PitchDoctor::IsCantrix() { return true; }
bool PitchDoctor::AllowChangeParamFromInputBox(int) { return true; }
float PitchDoctor::GetParam(int index) { return CorvoEffectBase::GetParam(index); }
int PitchDoctor::GetParamCountReal() { return CorvoEffectBase::GetParamCountReal(); }
std::string PitchDoctor::GetName() { return CorvoEffectBase::GetName(); }

EffectParameterType PitchDoctor::GetParameterTypeAutomatable(int index) {
    const ParameterRow* const row = RowOf(index);
    if (row && row->type == MPT_BOOL) return EffectParameterType::Switch;
    return row && row->type == MPT_ENUM ? EffectParameterType::List : EffectParameterType::Continuous;
}

int PitchDoctor::GetLatency() {
    const auto rate = m_rate.load(std::memory_order_relaxed);
    if (rate == 0) return 0;
    const auto lowest = LowestPitchOf(WithinRanges(Snapshot(m_settings)));
    return PitchDoctorEngine::LatencyOf(rate, kLowestPitches[lowest]);
}

void PitchDoctor::SetEditor(BuiltinEditor* editor) {
    auto& ring = m_engines->readings;
    if (editor && !ring) ring = std::make_unique<PitchReadingRing>();
    CorvoEffectBase::SetEditor(editor);
    m_engines->published.store(editor ? ring.get() : nullptr, std::memory_order_release);
}

void PitchDoctor::TakeReadings(std::vector<PitchReading>& readings) {
    if (m_engines->readings) m_engines->readings->Take(readings);
}

template <typename Edit>
void PitchDoctor::WatchingLatency(Edit edit) {
    const auto before = LowestPitchOf(WithinRanges(Snapshot(m_settings)));
    edit();
    if (LowestPitchOf(WithinRanges(Snapshot(m_settings))) != before) SetWantRefreshAllParams(true);
}

bool PitchDoctor::DoSetParam(int index, float normalised, bool fromAutomation) {
    if (index != kLowestPitchParameter) return CorvoEffectBase::DoSetParam(index, normalised, fromAutomation);
    if (fromAutomation) return false;
    WatchingLatency([&] { CorvoEffectBase::DoSetParam(index, normalised, false); });
    return true;
}

void PitchDoctor::SetPreset(int preset) {
    WatchingLatency([&] { CorvoEffectBase::SetPreset(preset); });
}

int PitchDoctor::GetSettingsChunkSize() { return static_cast<int>(8 + sizeof(PitchDoctorSettings)); }

void PitchDoctor::GetSettingsChunk(std::vector<std::uint8_t>& chunk) {
    ChunkWriter write(chunk, static_cast<std::size_t>(GetSettingsChunkSize()));
    write(kChunkVersion);
    write(kFields);
    write(std::bit_cast<std::array<std::uint32_t, kFields>>(Snapshot(m_settings)));
}

void PitchDoctor::SetSettingsChunk(const std::vector<std::uint8_t>& chunk) {
    ChunkReader read(chunk);
    std::int32_t version;
    std::uint32_t count;
    if (!read(version) || !read(count)) return;
    count = std::min(count, kFields);
    if (chunk.size() < 8 + 4 * static_cast<std::size_t>(count)) return;
    std::array<std::uint32_t, kFields> words;
    std::ranges::copy(PitchDoctorTable().Preset(0)->settings, words.begin());
    for (std::uint32_t field = 0; field < count; ++field) read(words[field]);
    WatchingLatency([&] { Assign(m_settings, std::bit_cast<PitchDoctorSettings>(words)); });
    MarkStale();
}

void PitchDoctor::Cleanup() {
    if (m_engines->inUse) m_engines->inUse->Clear();
}

void PitchDoctor::InitResetProcessingLight(bool) {
    if (m_engines->inUse) m_engines->inUse->Clear();
}

void PitchDoctor::CheckCookProperties(const tWAVEFORMATEX* format, bool force) {
    const Cook cook = TakeCook(m_format, *format, force);
    if (!cook.due) return;
    InitEnvelopes(true);
    const auto rate = std::min<std::uint32_t>(format->nSamplesPerSec, kHighestRate);
    if (cook.afresh) m_engines->Prepare(rate);
    m_rate.store(rate, std::memory_order_relaxed);
    const auto settings = WithinRanges(Snapshot(m_settings));
    m_engines->Use(m_engines->all[LowestPitchOf(settings)].get());
    if (m_engines->inUse) m_engines->inUse->Cook(VoiceOf(settings));
}

void PitchDoctor::ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format, ProcessFlags&) {
    CheckCookProperties(format, false);
    const int channels = format->nChannels;
    if (frames < 1 || channels < 1) return;
    WithSamples(buffer, *format, OtherWidths::AreFloat, [&]<typename Sample>(Sample* samples) {
        m_engines->Run<Sample>({samples, samples + 1}, std::min(channels, MaxNumChannels), frames, channels);
    });
}

void PitchDoctor::ProcessInternalNoninterleaved(double* const* channels, int frames,
                                                const tWAVEFORMATEX* format, ProcessFlags&) {
    CheckCookProperties(format, false);
    const int count = std::min<int>(format->nChannels, MaxNumChannels);
    if (frames < 1 || count < 1) return;
    WithChannels(channels, *format, OtherWidths::AreFloat, [&]<typename Sample>(Sample* const* buffers) {
        m_engines->Run<Sample>({buffers[0], count == 2 ? buffers[1] : nullptr}, count, frames, 1);
    });
}

}  // namespace Corvo::DSP
