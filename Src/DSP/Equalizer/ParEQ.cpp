#include "DSP/Equalizer/ParEQ.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <numbers>
#include <span>

#include "DSP/Equalizer/BiquadSection.h"
#include "DSP/Equalizer/EqCascade.h"
#include "DSP/Equalizer/EqChannel.h"
#include "Platform/DenormalGuard.h"
#include "Platform/FiniteSamples.h"

namespace Corvo::DSP {
namespace {

constexpr int kMaxBands = builtin_effects_data::kMaxBands;

int BandsInUse(const builtin_effects_data& record) { return std::clamp(record.numBands, 0, kMaxBands); }

// The highest frequency below half the rate. A peak's warping is valid anywhere.
double DesignFrequency(const _eq_data& band, int sampleRate) {
    const int freq = std::max(band.freq, 1);
    const int highest = sampleRate > 2 ? (sampleRate - 1) / 2 : 1;
    return band.filter_type() == EQ_PEAK ? freq : std::min(freq, highest);
}

bool IsFlat(const _eq_data& band) {
    const auto type = band.filter_type();
    return band.boost == 0 && type != EQ_HIGHPASS && type != EQ_LOWPASS;
}

void CookBand(EqBand& band, const _eq_data& data, int sampleRate, bool smooth) {
    const auto section = DesignBiquad(data.filter_type(), std::pow(10.0, data.boost * 0.005),
                                      DesignFrequency(data, sampleRate), data.Q, sampleRate);
    const bool glide = smooth && band.active;
    band.active = section.IsUsable();
    if (!band.active) return;
    section.HandTo(band._eq_coeffs, !glide);
    if (!glide) band.w1 = band.w2 = 0.0;
}

void CookBands(EqBands& bands, const builtin_effects_data& data, int sampleRate, bool smooth,
               bool bypassAll) {
    const int count = BandsInUse(data);
    for (int i = 0; i < count; ++i) {
        EqBand& band = bands[static_cast<std::size_t>(i)];
        const _eq_data& settings = data.bands[static_cast<std::size_t>(i)];
        if (bypassAll || settings.bypass() || data.GetBypassChannel() || IsFlat(settings))
            band.active = 0;
        else
            CookBand(band, settings, sampleRate, smooth);
    }
}

template <typename Sample>
void Invert(Sample* samples, std::ptrdiff_t stride, int frames) {
    for (int i = 0; i < frames; ++i) samples[i * stride] = -samples[i * stride];
}

template <typename Sample>
struct Lanes {
    Sample* samples;  // the first channel's first
    std::ptrdiff_t stride;
    int frames;
};

// One channel, or two neighbouring ones: polarity, bands, analysers. What overflowed is cleared.
template <typename Sample>
void RunChannels(const Lanes<Sample>& block, std::span<EqChannel* const> channels,
                 const builtin_effects_data* records, int numBands, std::int32_t& counter,
                 bool feedSpectrum) {
    std::array<EqBands*, 2> bands{};
    for (std::size_t c = 0; c < channels.size(); ++c) {
        bands[c] = &channels[c]->bands;
        if (records[c].GetPhaseShift()) Invert(block.samples + c, block.stride, block.frames);
    }
    RunCascade(block.samples, block.stride, block.frames, std::span(bands).first(channels.size()), numBands,
               counter);
    for (std::size_t c = 0; c < channels.size(); ++c) {
        for (EqBand& band : std::span(*bands[c]).first(static_cast<std::size_t>(numBands)))
            if (!std::isfinite(band.w1) || !std::isfinite(band.w2)) band.w1 = band.w2 = 0.0;
        if (feedSpectrum)
            channels[c]->analyser.Feed(block.samples + c, block.frames, static_cast<int>(block.stride), 1);
    }
}

}  // namespace

ParEQ::ParEQ() : m_glide_counter(std::make_shared<std::int32_t>(0)) {}
ParEQ::ParEQ(const ParEQ&) = default;
ParEQ& ParEQ::operator=(const ParEQ&) = default;
ParEQ::~ParEQ() = default;

void ParEQ::AfterCloneInit() { *this = ParEQ(); }

void ParEQ::Resize(int n) {
    m_channel_count = std::max(n, 0);
    while (m_channels.size() < static_cast<std::size_t>(m_channel_count))
        m_channels.push_back(std::make_shared<EqChannel>(m_glide_counter.get()));
}

void ParEQ::Cook(bool smooth, bool bypassAll, builtin_effects_data* data, int sampleRate, int numChannels) {
    if (!data) return;
    Resize(numChannels);
    for (const auto& channel : m_channels) {
        CookBands(channel->bands, *data, sampleRate, smooth, bypassAll);
        channel->analyser.set_parameters(sampleRate);
        channel->analyser.init();
    }
}

void ParEQ::CookBandsOnly(bool smooth, bool bypassAll, const builtin_effects_data& data, int sampleRate) {
    for (const auto& channel : m_channels) CookBands(channel->bands, data, sampleRate, smooth, bypassAll);
}

void ParEQ::ResetProcessing() { *m_glide_counter = 0; }

EqChannel* ParEQ::Channel(int channel) const {
    return channel >= 0 && static_cast<std::size_t>(channel) < m_channels.size()
               ? m_channels[static_cast<std::size_t>(channel)].get()
               : nullptr;
}

kivspectrum* ParEQ::GetSpectrum(int channel) {
    if (channel < 0) return nullptr;
    if (!Channel(channel)) Resize(channel + 1);
    return &Channel(channel)->analyser;
}

template <typename Sample>
void ParEQ::Process(Sample* buf, int frames, int numChannels, bool feedSpectrum,
                    builtin_effects_data* records) {
    if (!records || frames <= 0) return;
    const DenormalGuard guard;
    ReplaceNonFinite(buf, frames, numChannels, static_cast<int>(m_channels.size()));
    const int numBands = BandsInUse(records[0]);
    for (int channel = 0; channel < numChannels; ++channel) {
        EqChannel* const channels[] = {Channel(channel),
                                       channel + 1 < numChannels ? Channel(channel + 1) : nullptr};
        if (!channels[0]) break;
        const bool together =
            channels[1] && MayRunTogether(channels[0]->bands, channels[1]->bands, numBands, *m_glide_counter);
        RunChannels(Lanes<Sample>{buf + channel, numChannels, frames},
                    std::span(channels).first(together ? 2 : 1), records + channel, numBands,
                    *m_glide_counter, feedSpectrum);
        channel += together;
    }
}

template <typename Sample>
void ParEQ::ProcessSingle(Sample* buf, int frames, int stride, bool feedSpectrum, int channel,
                          builtin_effects_data* records) {
    EqChannel* const state = Channel(channel);
    if (!state || !records || frames <= 0 || stride <= 0) return;
    const DenormalGuard guard;
    const std::int64_t first = stride < 2 ? 0 : channel, end = static_cast<std::int64_t>(frames) * stride;
    if (first >= end) return;
    const int count = static_cast<int>((end - first + stride - 1) / stride);
    Sample* const samples = buf + first;
    // Only this channel's: the others may be in another thread's hands.
    for (int i = 0; i < count; ++i)
        if (Sample& sample = samples[std::ptrdiff_t{i} * stride]; !std::isfinite(sample)) sample = 0;
    EqChannel* const channels[] = {state};
    RunChannels(Lanes<Sample>{samples, stride, count}, channels, records + channel, BandsInUse(records[0]),
                *m_glide_counter, feedSpectrum);
}

std::complex<double> ParEQ::GetResponse(int channel, double frequency, int sampleRate,
                                        const builtin_effects_data* records) const {
    const EqChannel* const state = Channel(channel);
    if (!state || !records || sampleRate <= 0) return 1.0;
    const auto z1 = std::polar(1.0, -2.0 * std::numbers::pi * frequency / sampleRate), z2 = z1 * z1;
    std::complex<double> response = records[channel].GetPhaseShift() ? -1.0 : 1.0;
    for (int i = 0; i < BandsInUse(records[0]); ++i) {
        const EqBand& band = state->bands[static_cast<std::size_t>(i)];
        const auto& [b0, b1, b2, a1, a2] = band._eq_coeffs;
        if (band.active)
            response *=
                (b0.target + b1.target * z1 + b2.target * z2) / (1.0 + a1.target * z1 + a2.target * z2);
    }
    return response;
}

template DSP_API void ParEQ::Process(float*, int, int, bool, builtin_effects_data*);
template DSP_API void ParEQ::Process(double*, int, int, bool, builtin_effects_data*);
template DSP_API void ParEQ::ProcessSingle(float*, int, int, bool, int, builtin_effects_data*);
template DSP_API void ParEQ::ProcessSingle(double*, int, int, bool, int, builtin_effects_data*);

}  // namespace Corvo::DSP
