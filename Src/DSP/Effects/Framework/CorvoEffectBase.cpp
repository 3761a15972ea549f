#include "DSP/Effects/Framework/CorvoEffectBase.h"

#include <algorithm>
#include <exception>
#include <numeric>
#include <utility>

#include "DSP/Effects/Framework/TailRecord.h"
#include "DSP/Effects/Parameters/EffectTable.h"
#include "Platform/DenormalGuard.h"
#include "Platform/FiniteSamples.h"
#include "Threads/SharedRecord.h"

namespace Corvo::DSP {
namespace {

bool Guards(const EffectTable* table, const tWAVEFORMATEX& format) {
    const auto guard = table ? table->inputGuard : InputGuard::FloatFormats;
    const bool knownWidth = format.wBitsPerSample == 32 || format.wBitsPerSample == 64;
    return guard == InputGuard::EveryFormat || (guard == InputGuard::FloatFormats && knownWidth);
}

// Interleaved or one channel of a planar block. Effects pass channels after the second unchanged.
void GuardInput(double* buffer, int frames, int channels, int bits) {
    const int guarded = CorvoEffectBase::MaxNumChannels;
    if (bits == 64)
        ReplaceNonFinite(buffer, frames, channels, guarded);
    else
        ReplaceNonFinite(reinterpret_cast<float*>(buffer), frames, channels, guarded);
}

}  // namespace

CorvoEffectBase::CorvoEffectBase() : m_tail(std::make_unique<TailRecord>()) {}
CorvoEffectBase::~CorvoEffectBase() = default;

void CorvoEffectBase::ProcessInternalNoninterleaved(double* const*, int, const tWAVEFORMATEX*,
                                                    ProcessFlags&) {}

bool CorvoEffectBase::HasSeparateLeftRightSettings() { return true; }
int CorvoEffectBase::GetLatency() { return 0; }
bool CorvoEffectBase::IsCollapsingToMono() { return false; }
bool CorvoEffectBase::HasNativeEditor() { return false; }
void CorvoEffectBase::SetEditor(BuiltinEditor* editor) { m_editor = editor; }
bool CorvoEffectBase::SupportsNoninterleaved() { return false; }
void CorvoEffectBase::SetMaximumFramesPerBuffer(int) {}

void CorvoEffectBase::CheckCookProperties(const tWAVEFORMATEX*, bool) {
    m_cook.store(false, std::memory_order_relaxed);
}

void CorvoEffectBase::Cleanup() {}

bool CorvoEffectBase::IsCantrix() { return false; }
int CorvoEffectBase::GetParamCount() { return GetParamCountReal(); }
EffectParameterType CorvoEffectBase::GetParameterTypeAutomatable(int) {
    return EffectParameterType::Continuous;
}

bool CorvoEffectBase::IsMono() const { return false; }
int CorvoEffectBase::GetNumSidechainBusses() { return 0; }
int CorvoEffectBase::GetSidechainBusNumChannelsMax(int) { return 0; }
void CorvoEffectBase::SetSidechainBuffer(int, double* const*) {}
int CorvoEffectBase::SeparateLeftRightControls() { return HasSeparateLeftRightSettings() ? 0 : 1; }
bool CorvoEffectBase::AllowChangeParamFromInputBox(int) { return false; }
int CorvoEffectBase::GetPreferredNumColumnsForTab() const { return -1; }
PluginGenericUILookAndFeel CorvoEffectBase::GetLookAndFeel() { return {}; }
void CorvoEffectBase::InitResetProcessingLight(bool) {}

void CorvoEffectBase::SetParam(int index, float normalised, bool fromAutomation) {
    // Not the external count: automation goes by real indices.
    if (index < 0 || index >= GetParamCountReal()) return;
    const bool paired = SeparateLeftRightControls() == 0;
    const int real = paired ? 2 * index : index;
    bool changed;
    if (!m_reverse_param_order) {
        changed = DoSetParam(real, normalised, fromAutomation);
        if (paired) changed = DoSetParam(real + 1, normalised, fromAutomation);
    } else {
        const int mirrored = GetParamCountReal() - real - 1;
        if (paired) DoSetParam(mirrored - 1, normalised, fromAutomation);
        // Reversed effects hear of automation as if it came from the user interface.
        changed = DoSetParam(mirrored, normalised, false);
    }
    if (changed) MarkStale();
}

CorvoEffectBase::Cook CorvoEffectBase::TakeCook(tWAVEFORMATEX& seen, const tWAVEFORMATEX& now, bool force) {
    const bool afresh = force || now.nChannels != seen.nChannels || now.nSamplesPerSec != seen.nSamplesPerSec;
    seen = now;
    return {TakeFlag(m_cook) || afresh, afresh};
}

// An effect that runs out of memory may be in any state: it is left alone until it is prepared again.
template <typename Call>
void CorvoEffectBase::Attempt(Call&& call) {
    try {
        call();
    } catch (const std::exception&) {
        m_tail->unprepared = true;
        MarkStale();
    }
}

bool CorvoEffectBase::InitProcessing(int maxFrames, const tWAVEFORMATEX* format) {
    *m_tail = {.automated = m_tail->automated};
    Attempt([&] {
        SetMaximumFramesPerBuffer(maxFrames);
        CheckCookProperties(format, true);
    });
    return true;
}

template <typename Call>
void CorvoEffectBase::RunBlock(int frames, ProcessFlags& flags, Call&& call) {
    const DenormalGuard guard;
    flags.params_changed = false;
    if (!m_tail->unprepared)
        Attempt([&] {
            UpdateEnvelopes(flags);
            call(m_tail->BeginBlock(frames));
        });
    else
        m_tail->BeginBlock(frames);
    m_tail->EndBlock();
}

bool CorvoEffectBase::IsPrepared() const { return !m_tail->unprepared; }

void CorvoEffectBase::Process(double* buffer, int frames, const tWAVEFORMATEX* format, ProcessFlags& flags) {
    RunBlock(frames, flags, [&](int allowed) {
        if (Guards(m_table, *format)) GuardInput(buffer, allowed, format->nChannels, format->wBitsPerSample);
        ProcessInternal(buffer, allowed, format, flags);
    });
}

void CorvoEffectBase::ProcessNoninterleaved(double* const* channels, int frames, const tWAVEFORMATEX* format,
                                            ProcessFlags& flags) {
    RunBlock(frames, flags, [&](int allowed) {
        if (allowed > 0 && Guards(m_table, *format) && SupportsNoninterleaved())
            for (int channel = 0; channel < std::min<int>(format->nChannels, MaxNumChannels); ++channel)
                GuardInput(channels[channel], allowed, 1, format->wBitsPerSample);
        ProcessInternalNoninterleaved(channels, allowed, format, flags);
    });
}

void CorvoEffectBase::StartTail(std::int64_t maxFrames) {
    m_tail->frames_limited_to = std::max<std::int64_t>(maxFrames, 0);
}
void CorvoEffectBase::EndTail() { m_tail->frames_limited_to = -1; }
bool CorvoEffectBase::InTail() const { return m_tail->TailMode(); }
int CorvoEffectBase::TailFramesProduced() const { return m_tail->frames_produced; }
bool CorvoEffectBase::TailFinished() const { return m_tail->finished; }
void CorvoEffectBase::RequestTailRestart() { m_tail->restart_requested = true; }

void CorvoEffectBase::SetHostCallback(CorvoEffectHostCallback* callback) { m_host_callback = callback; }
void CorvoEffectBase::NotifyTempoChanged() { MarkStale(); }
void CorvoEffectBase::SetWantRefreshAllParams(bool want) { m_want_refresh_all_params = want; }
bool CorvoEffectBase::WantRefreshAllParams() { return m_want_refresh_all_params; }
bool CorvoEffectBase::WantsUpdateUiFromScratch() const { return m_update_ui_from_scratch.load(); }
void CorvoEffectBase::SetUpdateUiFromScratch(bool want) { m_update_ui_from_scratch.exchange(want); }

void CorvoEffectBase::SetSidechainBusNumChannels(int bus, int channels) {
    if (bus < 0) return;
    m_sidechain_bus_channels.resize(static_cast<std::size_t>(bus) + 1);
    m_sidechain_bus_channels.back() = channels;
}

int CorvoEffectBase::GetSidechainBusNumChannels(int bus) {
    return m_sidechain_bus_channels[static_cast<std::size_t>(bus)];
}

void CorvoEffectBase::AddEnvelope(int index, int count, const MP_ENVELOPE_SEGMENT* segments) {
    if (index < 0 || index >= GetParamCountReal()) return;
    const auto parameter = static_cast<std::size_t>(index);
    // Before the first cook there is no array yet; positions stay with the cook, so nothing plays early.
    if (parameter >= m_envelopes.size()) m_envelopes.resize(parameter + 1);
    std::vector<MP_ENVELOPE_SEGMENT> envelope;
    if (segments && count > 0) envelope.assign(segments, segments + count);
    m_tail->automated |= !envelope.empty();
    m_envelopes[parameter] = std::move(envelope);
    MarkStale();
}

void CorvoEffectBase::FlushEnvelope(int index, std::int64_t from, std::int64_t to) {
    if (index < 0 || static_cast<std::size_t>(index) >= m_envelopes.size()) return;
    const auto inside = [&](std::int64_t time) { return from <= time && time < to; };
    std::erase_if(m_envelopes[static_cast<std::size_t>(index)],
                  [&](const auto& segment) { return inside(segment.rtStart) && inside(segment.rtEnd); });
    MarkStale();
}

void CorvoEffectBase::SetEnvelopeTime(std::int64_t time) { m_envelope_time = time; }
std::int64_t CorvoEffectBase::GetEnvelopeTime() const { return m_envelope_time; }

void CorvoEffectBase::InitEnvelopes(bool reset) {
    if (!reset) return;
    const auto count = static_cast<std::size_t>(std::max(GetParamCountReal(), 0));
    m_envelopes.resize(count);
    m_envelope_positions.assign(count, 0);
    m_envelope_time = 0;
}

void CorvoEffectBase::UpdateEnvelopes(ProcessFlags& flags) {
    flags.params_changed = false;
    if (!m_tail->automated) return;  // most effects, which need not fetch an array from a cold memory
    for (std::size_t parameter = 0; parameter < m_envelope_positions.size(); ++parameter) {
        const auto& envelope = m_envelopes[parameter];
        auto& position = m_envelope_positions[parameter];
        while (static_cast<std::size_t>(position) < envelope.size()) {
            const auto& segment = envelope[static_cast<std::size_t>(position)];
            if (segment.rtStart > m_envelope_time && position != 0) break;
            SetParam(static_cast<int>(parameter), segment.valStart, true);
            flags.params_changed = true;
            ++position;
        }
    }
}

std::vector<int> CorvoEffectBase::GetAllSupportedParameterIds() {
    std::vector<int> ids(static_cast<std::size_t>(std::max(GetParamCountReal(), 0)));
    std::iota(ids.begin(), ids.end(), 0);
    return ids;
}

std::vector<float> CorvoEffectBase::GetPresetValues(int preset) {
    const int count = std::max(GetParamCountReal(), 0);
    std::vector<float> values;
    values.reserve(static_cast<std::size_t>(count));
    for (int i = 0; i < count; ++i)
        values.push_back(GetParamFromProp(m_reverse_param_order ? count - i - 1 : i, preset));
    return values;
}

PluginParamXYGroupInfo CorvoEffectBase::MakeGroup(const std::string& name, int index,
                                                  const std::vector<int>& xAxis,
                                                  const std::vector<int>& yAxis) {
    return {name, index, xAxis, yAxis};
}

CorvoEffectBase::Tempo CorvoEffectBase::HostTempo() const {
    Tempo tempo;
    if (!m_host_callback) return tempo;
    if (const double bpm = m_host_callback->GetTempo(); bpm > 0.0) tempo.bpm = bpm;  // NaN is not
    int numerator = tempo.numerator, denominator = tempo.denominator;
    m_host_callback->GetTimeSignature(numerator, denominator);
    if (numerator > 0) tempo.numerator = numerator;
    if (denominator > 0) tempo.denominator = denominator;
    return tempo;
}

}  // namespace Corvo::DSP
