#include "DSP/Effects/Denoiser/DenoiserProcessor.h"

#include <algorithm>
#include <limits>

#include "DSP/Effects/Denoiser/DenoiserPresets.h"
#include "DSP/Effects/Denoiser/DenoiserState.h"
#include "DSP/Effects/Denoiser/DenoiserTable.h"
#include "DSP/Parts/SampleDispatch.h"
#include "Threads/SharedRecord.h"

namespace Corvo::DSP {
namespace {

using namespace Denoising;

constexpr int kClear = 2;  // parameter
constexpr double kHighestRate = 1e9;

std::size_t ChannelsOf(const tWAVEFORMATEX& format) {
    return std::clamp<std::size_t>(format.nChannels, 1, kMostChannels);
}
double RateOf(const tWAVEFORMATEX& format) { return std::max<double>(format.nSamplesPerSec, 1.0); }

}  // namespace

DenoiserProcessor::DenoiserProcessor()
    : CorvoEffect(Table(), &m_settings), m_state(std::make_unique<DenoiserPrivate::State>()) {
    SetPreset(0);
}
DenoiserProcessor::~DenoiserProcessor() = default;

bool DenoiserProcessor::HasSeparateLeftRightSettings() { return false; }
bool DenoiserProcessor::SupportsNoninterleaved() { return true; }
bool DenoiserProcessor::AllowChangeParamFromInputBox(int) { return true; }
Format_t DenoiserProcessor::Format() const {
    return m_state->engine ? m_state->engine->Format() : Format_t{};
}

int DenoiserProcessor::GetLatency() {
    return Scale::Of(m_state->rate.load())(SizeSetAt(LoadShared(m_settings.fftSize)).latency);
}

const std::array<double, 28>& DenoiserProcessor::ParamsDefault() {
    static const auto values = [] {
        const auto words = WordsOf(DenoiserPresets::kPresets[0].settings);
        std::array<double, 28> plain;
        for (std::size_t i = 0; i < plain.size(); ++i) {
            const auto& row = Table().rows[i];
            plain[i] = PlainValue(row, static_cast<std::int32_t>(words[row.word]));
        }
        return plain;
    }();
    return values;
}

// "Clear profile" acts at once and never stays on.
bool DenoiserProcessor::DoSetParam(int index, float normalised, bool fromAutomation) {
    if (index != kClear) return CorvoEffect::DoSetParam(index, normalised, fromAutomation);
    if (!(normalised >= 0.5f)) return false;
    if (fromAutomation)
        m_state->clearRequested.store(true, std::memory_order_release);
    else
        m_state->Load({});
    return true;
}

double DenoiserProcessor::LearnedSeconds() { return m_state->Known().seconds; }

bool DenoiserProcessor::LearnedDensity(double rate, float* density, int bins) {
    const auto& profile = m_state->Known();
    if (!profile.Learned() || bins < 2 || !(rate > 0.0 && rate <= kHighestRate)) return false;
    const int length = 2 * (bins - 1);
    // The longest of what was learned that is no longer than asked for, or else the shortest.
    std::size_t which = kLengths;
    for (std::size_t i = 0; i < kLengths; ++i)
        if (!profile.power[0][i].empty() &&
            (which == kLengths || NoiseProfile::Length(i, profile.rate) <= length))
            which = i;
    if (which == kLengths) return false;
    std::vector<float> channel(static_cast<std::size_t>(bins));
    std::fill_n(density, bins, 0.0f);
    for (std::size_t c = 0; c < profile.channels; ++c) {
        ConvertSpectrum(profile.power[c][which], NoiseProfile::Length(which, profile.rate), profile.rate,
                        channel.data(), channel.size(), length, rate);
        // The windows' squares sum up to half their length.
        const float scale = 2.0f / static_cast<float>(length) / static_cast<float>(profile.channels);
        for (std::size_t bin = 0; bin < channel.size(); ++bin)
            density[bin] = std::min(density[bin] + scale * channel[bin], std::numeric_limits<float>::max());
    }
    return true;
}

void DenoiserProcessor::CheckCookProperties(const tWAVEFORMATEX* format, bool force) {
    const auto cook = TakeCook(m_state->format, *format, force);
    // Prepared for this format already, an engine has the memory, and what was learned.
    const bool prepares = force && !m_state->IsPreparedFor(RateOf(*format), ChannelsOf(*format));
    if (prepares)
        m_state->Prepare(RateOf(*format), ChannelsOf(*format),
                         EngineSettingsOf(Snapshot(m_settings)).sizeSet);
    if (!cook.due || !m_state->engine) return;
    InitEnvelopes(true);
    if (cook.afresh && !prepares) m_state->engine->SetFormat(RateOf(*format), ChannelsOf(*format));
    m_state->TakeProfiles();
    m_state->engine->Apply(EngineSettingsOf(Snapshot(m_settings)));
    m_state->HandOverLearned();
}

void DenoiserProcessor::Cleanup() {
    m_state->Free();
    MarkStale();
}

void DenoiserProcessor::InitResetProcessingLight(bool) {
    if (m_state->engine) m_state->engine->SetFormat(RateOf(m_state->format), ChannelsOf(m_state->format));
    MarkStale();
}

// False: the block passes unchanged.
bool DenoiserProcessor::Ready(const tWAVEFORMATEX* format) {
    CheckCookProperties(format, false);
    return m_state->engine && format->nChannels >= 1 && format->nChannels <= kMostChannels;
}

void DenoiserProcessor::ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format,
                                        ProcessFlags&) {
    if (!Ready(format)) return;
    const std::size_t stride = format->nChannels;
    WithSamples(buffer, *format, OtherWidths::Skip, [&](auto* samples) {
        m_state->engine->Run(
            frames, [&](std::size_t channel, int frame) -> auto& {
                return samples[static_cast<std::size_t>(frame) * stride + channel];
            });
    });
}

void DenoiserProcessor::ProcessInternalNoninterleaved(double* const* channels, int frames,
                                                      const tWAVEFORMATEX* format, ProcessFlags&) {
    if (!Ready(format)) return;
    WithChannels(channels, *format, OtherWidths::Skip, [&](auto* planes) {
        m_state->engine->Run(
            frames, [&](std::size_t channel, int frame) -> auto& { return planes[channel][frame]; });
    });
}

}  // namespace Corvo::DSP
