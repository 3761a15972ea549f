#include <algorithm>
#include <string>

#include "C/Calls.h"
#include "C/EffectStream.h"
#include "C/Format.h"

// An effect's life, its processing, side-chain and tempo.

namespace {

using namespace Corvo::C;

constexpr int kMostFrames = 1 << 20;

template <typename Sample, typename Samples, typename Process>
dsp_status Processed(dsp_effect* effect, Samples samples, int frames, Process process) {
    return With<EffectStream>(effect, [&](EffectStream& stream) -> dsp_status {
        if (!stream.IsPrepared() || stream.Bits() != 8 * static_cast<int>(sizeof(Sample)))
            return DSP_UNPREPARED;
        if (frames < 0) return DSP_OUT_OF_RANGE;
        if (frames > 0 && !samples) return DSP_NULL;
        return process(stream);
    });
}

template <typename Sample>
dsp_status ProcessedPlanar(dsp_effect* effect, Sample* const* channels, int frames) {
    return Processed<Sample>(effect, channels, frames, [&](EffectStream& stream) -> dsp_status {
        for (int c = 0; frames > 0 && c < stream.Channels(); ++c)
            if (!channels[c]) return DSP_NULL;
        stream.ProcessPlanar(channels, frames);
        return DSP_OK;
    });
}

template <typename Sample>
dsp_status GiveSidechain(dsp_effect* effect, int32_t bus, const Sample* const* channels) {
    return With<EffectStream>(effect, [&](EffectStream& stream) -> dsp_status {
        if (!stream.IsPrepared() || stream.Bits() != 8 * static_cast<int>(sizeof(Sample)))
            return DSP_UNPREPARED;
        if (!Within(bus, 0, stream.Busses() - 1)) return DSP_OUT_OF_RANGE;
        if (channels && stream.SidechainChannels(bus) == 0) return DSP_UNPREPARED;
        for (int c = 0; channels && c < stream.SidechainChannels(bus); ++c)
            if (!channels[c]) return DSP_NULL;
        stream.SetSidechain(bus, reinterpret_cast<const void* const*>(channels));
        return DSP_OK;
    });
}

}  // namespace

int32_t DSP_CALL dsp_effect_kinds(void) { return static_cast<int32_t>(Corvo::DSP::EffectKinds().size()); }

dsp_status DSP_CALL dsp_effect_kind_name(int32_t kind, char* buffer, size_t size, size_t* needed) {
    if (!Within(kind, 0, dsp_effect_kinds() - 1)) return DSP_OUT_OF_RANGE;
    return GiveText(Corvo::DSP::EffectKinds()[static_cast<std::size_t>(kind)].name, buffer, size, needed);
}

dsp_status DSP_CALL dsp_effect_create(const char* name, dsp_effect** effect, dsp_error* error) {
    return Create(effect, error, [name] {
        Require(name, "the name is null", DSP_NULL);
        const auto* const kind = Corvo::DSP::FindEffectKind(name);
        if (kind) return std::make_unique<EffectStream>(*kind);
        std::string names;
        for (const auto& other : Corvo::DSP::EffectKinds())
            names += (names.empty() ? "" : ", ") + std::string(other.name);
        throw Refusal{DSP_UNKNOWN, "there is no effect \"" + std::string(name) + "\"; there are " + names};
    });
}

dsp_status DSP_CALL dsp_effect_name(dsp_effect* effect, char* buffer, size_t size, size_t* needed) {
    return With<EffectStream>(effect, [&](EffectStream& stream) {
        return GiveText(stream.effect->GetName(), buffer, size, needed);
    });
}

dsp_status DSP_CALL dsp_effect_prepare(dsp_effect* effect, const dsp_format* format, dsp_error* error) {
    return With<EffectStream>(effect, error, [format](EffectStream& stream) {
        const dsp_format wanted = Taken(format, "the format");
        Require(Within(wanted.max_frames, 1, kMostFrames), "max_frames can be 1 to 1048576");
        stream.Prepare(WaveFormat(wanted), wanted.max_frames);
    });
}

dsp_status DSP_CALL dsp_effect_reset(dsp_effect* effect) {
    return With<EffectStream>(effect, [](EffectStream& stream) -> dsp_status {
        if (!stream.IsPrepared()) return DSP_UNPREPARED;
        stream.Restart();
        return DSP_OK;
    });
}

dsp_status DSP_CALL dsp_effect_process_f32(dsp_effect* effect, float* samples, int32_t frames) {
    return Processed<float>(effect, samples, frames, [&](EffectStream& stream) {
        stream.Process(samples, frames);
        return DSP_OK;
    });
}
dsp_status DSP_CALL dsp_effect_process_f64(dsp_effect* effect, double* samples, int32_t frames) {
    return Processed<double>(effect, samples, frames, [&](EffectStream& stream) {
        stream.Process(samples, frames);
        return DSP_OK;
    });
}
dsp_status DSP_CALL dsp_effect_process_planar_f32(dsp_effect* effect, float* const* channels,
                                                  int32_t frames) {
    return ProcessedPlanar(effect, channels, frames);
}
dsp_status DSP_CALL dsp_effect_process_planar_f64(dsp_effect* effect, double* const* channels,
                                                  int32_t frames) {
    return ProcessedPlanar(effect, channels, frames);
}

dsp_status DSP_CALL dsp_effect_latency(dsp_effect* effect, int32_t* frames) {
    return With<EffectStream>(effect, [&](EffectStream& stream) -> dsp_status {
        return stream.IsPrepared() ? Give(std::max(stream.effect->GetLatency(), 0), frames) : DSP_UNPREPARED;
    });
}

dsp_status DSP_CALL dsp_effect_seek(dsp_effect* effect, int64_t position) {
    return With<EffectStream>(effect, [position](EffectStream& stream) -> dsp_status {
        if (!Within(position, -EffectStream::kLastFrame, EffectStream::kLastFrame)) return DSP_OUT_OF_RANGE;
        stream.Seek(position);
        return DSP_OK;
    });
}

dsp_status DSP_CALL dsp_effect_rewind(dsp_effect* effect, int64_t position) {
    if (const dsp_status status = dsp_effect_seek(effect, position); status != DSP_OK) return status;
    return With<EffectStream>(effect,
                              [](EffectStream& stream) { stream.effect->InitResetProcessingLight(true); });
}

dsp_status DSP_CALL dsp_effect_start_tail(dsp_effect* effect, int64_t max_frames) {
    return With<EffectStream>(effect, [=](EffectStream& stream) { stream.effect->StartTail(max_frames); });
}
dsp_status DSP_CALL dsp_effect_tail(dsp_effect* effect, int32_t* frames, int32_t* finished) {
    return With<EffectStream>(effect, [&](EffectStream& stream) -> dsp_status {
        if (!frames || !finished) return DSP_NULL;
        *frames = stream.TailFrames();
        *finished = stream.effect->TailFinished();
        return DSP_OK;
    });
}
dsp_status DSP_CALL dsp_effect_end_tail(dsp_effect* effect) {
    return With<EffectStream>(effect, [](EffectStream& stream) { stream.effect->EndTail(); });
}
dsp_status DSP_CALL dsp_effect_longest_gap(dsp_effect* effect, double* gap) {
    return With<EffectStream>(effect,
                              [gap](EffectStream& stream) { return Give(stream.effect->LongestGap(), gap); });
}

dsp_status DSP_CALL dsp_effect_sidechain_busses(dsp_effect* effect, int32_t* busses) {
    return With<EffectStream>(effect,
                              [busses](EffectStream& stream) { return Give(stream.Busses(), busses); });
}
dsp_status DSP_CALL dsp_effect_sidechain_most_channels(dsp_effect* effect, int32_t bus, int32_t* channels) {
    return With<EffectStream>(effect, [&](EffectStream& stream) -> dsp_status {
        if (!Within(bus, 0, stream.Busses() - 1)) return DSP_OUT_OF_RANGE;
        return Give(stream.effect->GetSidechainBusNumChannelsMax(bus), channels);
    });
}
dsp_status DSP_CALL dsp_effect_sidechain_channels(dsp_effect* effect, int32_t bus, int32_t channels) {
    return With<EffectStream>(effect, [&](EffectStream& stream) -> dsp_status {
        if (!Within(bus, 0, stream.Busses() - 1) ||
            !Within(channels, 0, stream.effect->GetSidechainBusNumChannelsMax(bus)))
            return DSP_OUT_OF_RANGE;
        stream.AnnounceSidechain(bus, channels);
        return DSP_OK;
    });
}
dsp_status DSP_CALL dsp_effect_sidechain_f32(dsp_effect* effect, int32_t bus, const float* const* channels) {
    return GiveSidechain(effect, bus, channels);
}
dsp_status DSP_CALL dsp_effect_sidechain_f64(dsp_effect* effect, int32_t bus, const double* const* channels) {
    return GiveSidechain(effect, bus, channels);
}

dsp_status DSP_CALL dsp_effect_tempo_callback(dsp_effect* effect, dsp_tempo_callback callback, void* user) {
    return With<EffectStream>(effect, [&](EffectStream& stream) {
        auto source = callback ? std::make_unique<TempoSource>(callback, user) : nullptr;
        stream.effect->SetHostCallback(source.get());
        stream.tempo = std::move(source);
        stream.effect->NotifyTempoChanged();
    });
}
dsp_status DSP_CALL dsp_effect_tempo_changed(dsp_effect* effect) {
    return With<EffectStream>(effect, [](EffectStream& stream) { stream.effect->NotifyTempoChanged(); });
}
