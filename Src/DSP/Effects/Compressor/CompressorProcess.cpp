#include <algorithm>
#include <cmath>
#include <numbers>

#include "DSP/Effects/Compressor/CompressorSides.h"
#include "DSP/Parts/Decibels.h"
#include "DSP/Parts/SampleDispatch.h"
#include "Platform/FiniteSamples.h"

// The compressor on the audio thread: taking settings, cooking, processing.
namespace Corvo::DSP {

using namespace CompressorPrivate;

namespace {

constexpr double kSmoothingTime = 0.1;  // both smoothers are low-passes at the reciprocal of this, in Hz
constexpr double kMostMakeUp = 100.0;   // +40 dB

}  // namespace

void Compressor::TakeUiSettings() {
    const auto* newest = m_hand_over->toAudio.Take();
    if (newest) m_audio->current = **newest;
}

void Compressor::CheckCookProperties(const tWAVEFORMATEX* format, bool force) {
    const bool otherWidth = format->wBitsPerSample != m_audio->format.wBitsPerSample;
    if (TakeCook(m_audio->format, *format, force).due || otherWidth) InitState(force);
}

void Compressor::InitState(bool forced) {
    InitEnvelopes(true);
    TakeUiSettings();
    auto& audio = *m_audio;
    auto& c = audio.coefficients;
    const auto& parameters = audio.current.parameters;
    const auto& curves = audio.current.curves;
    const double fs = audio.format.nSamplesPerSec;

    const auto coefficient = [](double frames) { return 1.0 - std::pow(10.0, -1.0 / (frames + 1.0)); };
    const double smoothing = 1.0 - std::exp(-2.0 * std::numbers::pi / (fs * kSmoothingTime));
    const bool otherSmoothing = smoothing != c.parameterSmoothing;
    c.parameterSmoothing = c.gainSmoothing = smoothing;
    const auto outGainBefore = c.outGain;
    for (std::size_t channel = 0; channel < 2; ++channel) {
        c.attack[channel] = coefficient(parameters.attack[channel] * fs * 0.00001);
        // Ten times slower than the attack at the same setting; projects were mixed with that.
        c.release[channel] = coefficient(parameters.release[channel] * fs * 0.0001);
        c.outGain[channel] = GainFromTenthsOfDb(parameters.outGain[channel], kSilentOutGain, kHighestOutGain);
        if (parameters.makeUp != 0) {
            const double fullScale = curves.Curve(channel).back().y;
            c.outGain[channel] *= fullScale * kMostMakeUp > 1.0 ? 1.0 / fullScale : kMostMakeUp;
        }
    }

    if (!forced && audio.map.SetOutFor(curves, smoothing)) audio.FindSegments();
    if (otherSmoothing) audio.map.framesLeft = GlideFrames(audio.map.factor, smoothing);
    if (c.outGain != outGainBefore || (otherSmoothing && audio.gainFramesLeft > 0))
        audio.gainFramesLeft = GlideFrames(1.0, smoothing);

    if (!forced) return;
    audio.map.ArriveAt(curves);
    audio.state = {};
    audio.state.appliedGain = c.outGain;
    audio.gainFramesLeft = 0;
    for (auto& display : m_hand_over->displayGain) display = 1.0f;
}

void Compressor::SetSidechainBuffer(int bus, double* const* channels) {
    if (bus != 0) return;
    auto& audio = *m_audio;
    const int announced = m_sidechain_bus_channels.empty() ? 0 : m_sidechain_bus_channels.front();
    audio.sideChainChannels = 0;
    while (channels && audio.sideChainChannels < std::min(announced, MaxNumChannels) &&
           channels[audio.sideChainChannels]) {
        audio.sideChain[static_cast<std::size_t>(audio.sideChainChannels)] =
            channels[audio.sideChainChannels];
        ++audio.sideChainChannels;
    }
    m_hand_over->usingSideChain.store(audio.sideChainChannels > 0, std::memory_order_relaxed);
}

void Compressor::ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format, ProcessFlags&) {
    CheckCookProperties(format, false);
    const int channels = format->nChannels;
    auto& audio = *m_audio;
    m_hand_over->usingSideChain.store(audio.sideChainChannels > 0, std::memory_order_relaxed);
    audio.coefficients.meter = m_hand_over->meterOn.load(std::memory_order_relaxed);
    if (frames > 0 && (channels == 1 || channels == 2))
        WithSamples(buffer, *format, OtherWidths::Skip,
                    [&](auto* samples) { ProcessBlock(samples, frames, channels); });
    audio.sideChainChannels = 0;  // the buffers were this block's only
}

template <typename Sample, typename ParameterAccessor, typename GainAccessor>
void Compressor::ProcessStereoLinked(Sample* output, const Sample* detectorRight, const Sample* detector,
                                     int frames, int outputChannels, int detectorStride,
                                     const GlidingMap& map, CoreState& state, ParameterAccessor& parameters,
                                     GainAccessor gains) {
    const LinkedFrame<Sample> frame{output, detector, detectorRight, outputChannels, detectorStride};
    const auto second = static_cast<std::size_t>(outputChannels - 1);
    RunCore(frame, frames, {0, second}, map, m_audio->coefficients, state, parameters, gains);
}

template <typename Sample, typename ParameterAccessor, typename GainAccessor>
void Compressor::ProcessChannelMono(Sample* output, const Sample* detector, std::size_t channel, int frames,
                                    int outputStride, int detectorStride, const GlidingMap& map,
                                    CoreState& state, ParameterAccessor& parameters, GainAccessor gains) {
    const ChannelFrame<Sample> frame{output, detector, outputStride, detectorStride};
    RunCore(frame, frames, {channel, channel}, map, m_audio->coefficients, state, parameters, gains);
}

template <typename Sample>
void Compressor::ProcessBlock(Sample* block, int frames, int channels) {
    auto& audio = *m_audio;
    const bool sideChain = audio.sideChainChannels > 0;
    const bool monitor = (audio.current.parameters.flags & kMonitorFlag) != 0;
    // What the detector reads, per channel, and the distance between its samples.
    std::array<const Sample*, 2> detector{block, block + (channels - 1)};
    if (sideChain)
        for (std::size_t channel = 0; channel < 2; ++channel)
            detector[channel] = reinterpret_cast<const Sample*>(
                audio.sideChain[channel < static_cast<std::size_t>(audio.sideChainChannels) ? channel : 0]);
    const int stride = sideChain ? 1 : channels;
    // The side-chain is the host's, so what is not finite there becomes 0 in a copy.
    const bool repair = sideChain && !(AllFinite(detector[0], static_cast<std::size_t>(frames)) &&
                                       AllFinite(detector[1], static_cast<std::size_t>(frames)));

    // Monitored, the followers run on a copy, so that they are where they should be when it ends.
    constexpr int kCopiedPiece = 64;
    std::array<std::array<Sample, kCopiedPiece>, 2> repaired;
    for (int done = 0; done < frames;) {
        int piece = frames - done;
        if (audio.map.framesLeft > 0) piece = std::min(piece, audio.map.framesLeft);
        if (audio.gainFramesLeft > 0) piece = std::min(piece, audio.gainFramesLeft);
        Sample* const output = block + static_cast<std::ptrdiff_t>(done) * channels;
        std::array<const Sample*, 2> from{detector[0] + static_cast<std::ptrdiff_t>(done) * stride,
                                          detector[1] + static_cast<std::ptrdiff_t>(done) * stride};
        if (monitor || repair) piece = std::min(piece, kCopiedPiece);
        for (std::size_t channel = 0; repair && channel < 2; ++channel) {
            auto& copy = repaired[channel];
            std::copy_n(from[channel], piece, copy.begin());
            ReplaceNonFinite(copy.data(), piece, 1);
            from[channel] = copy.data();
        }
        if (monitor) {
            std::array<Sample, kCopiedPiece * MaxNumChannels> copy;
            std::copy_n(output, piece * channels, copy.begin());
            RunPiece(copy.data(), from.data(), stride, piece, channels);
            if (sideChain && channels == 1)
                for (int i = 0; i < piece; ++i) output[i] = (from[0][i] + from[1][i]) * Sample(0.5);
            else if (sideChain)
                for (int i = 0; i < piece * 2; ++i) output[i] = from[static_cast<std::size_t>(i % 2)][i / 2];
        } else {
            RunPiece(output, from.data(), stride, piece, channels);
        }
        done += piece;
    }
    audio.ClearUnlessFinite();
    for (std::size_t channel = 0; channel < 2; ++channel)
        m_hand_over->displayGain[channel].store(static_cast<float>(audio.state.displayGain[channel]),
                                                std::memory_order_relaxed);
}

template <typename Sample>
void Compressor::RunPiece(Sample* block, const Sample* const* detector, int detectorStride, int frames,
                          int channels) {
    auto& audio = *m_audio;
    // One channel under two detectors follows their mean.
    const bool linked =
        channels == 2 ? audio.current.parameters.stereoLink != 0 : audio.sideChainChannels == 2;
    const auto run = [&](auto& parameters, auto gains) {
        if (linked)
            return ProcessStereoLinked(block, detector[1], detector[0], frames, channels, detectorStride,
                                       audio.map, audio.state, parameters, gains);
        const auto start = parameters;  // every channel's glide is at the same place
        for (int channel = 0; channel < channels; ++channel) {
            parameters = start;
            ProcessChannelMono(block + channel, detector[channel], static_cast<std::size_t>(channel), frames,
                               channels, detectorStride, audio.map, audio.state, parameters, gains);
        }
    };
    const auto withGains = [&](auto& parameters) {
        if (audio.gainFramesLeft == 0) return run(parameters, GainGetter{});
        run(parameters, GainSmoother{});
        if ((audio.gainFramesLeft -= frames) == 0) audio.state.appliedGain = audio.coefficients.outGain;
    };
    if (audio.map.framesLeft == 0) {
        ParameterGetter standing(audio.map);
        withGains(standing);
    } else {
        ParameterSmoother gliding(audio.map, audio.coefficients.parameterSmoothing);
        withGains(gliding);
        audio.map.factor = gliding.Factor();
        if ((audio.map.framesLeft -= frames) == 0) {
            audio.map.Arrive();
            audio.FindSegments();
        }
    }
}

}  // namespace Corvo::DSP
