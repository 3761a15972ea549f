#include <cmath>
#include <cstdint>
#include <memory>
#include <string>
#include <utility>

#include "C/Calls.h"
#include "DSP/Pitch/OfflinePitchShift.h"
#include "DSP/Resampler/AlignedConverter.h"

// What turns whole recordings into others: another rate or format, another pitch.

namespace {

using namespace Corvo::C;
using Corvo::DSP::OfflinePitchShift;

constexpr double kMostCents = 20.0;  // a listener begins to notice

struct Converter : Object {
    static constexpr Kind kKind = Kind::Converter;
    explicit Converter(const AlignedConverter::Settings& settings) : Object(kKind), converter(settings) {}
    AlignedConverter converter;
    bool finished = false;
};

struct PitchShift : Object {
    static constexpr Kind kKind = Kind::PitchShift;
    explicit PitchShift(const OfflinePitchShift::Settings& settings) : Object(kKind), shift(settings) {}
    OfflinePitchShift shift;
    bool finished = false;
};

AlignedConverter::Settings Settings(const dsp_conversion& c) {
    return {c.in_rate,
            c.out_rate,
            c.channels,
            static_cast<StoredSample>(c.in_sample),
            static_cast<StoredSample>(c.out_sample),
            c.nearest == 0,
            static_cast<DitherCurve>(c.dither),
            0};
}
static_assert(static_cast<int>(StoredSample::Int16) == DSP_S16 &&
              static_cast<int>(StoredSample::Double) == DSP_F64);
static_assert(static_cast<int>(DitherCurve::None) == DSP_DITHER_NONE &&
              static_cast<int>(DitherCurve::Strong) == DSP_DITHER_STRONG);

OfflinePitchShift::Settings Settings(const dsp_shift& s) {
    return {s.rate,      s.channels,
            s.semitones, static_cast<OfflinePitchShift::Engine>(s.engine),
            s.quality,   s.speed == 0.0 ? 1.0 : s.speed};
}
static_assert(static_cast<int>(OfflinePitchShift::Engine::New) == DSP_ENGINE_NEW);

}  // namespace

dsp_status DSP_CALL dsp_converter_create(const dsp_conversion* conversion, dsp_converter** converter,
                                         dsp_error* error) {
    return Create(converter, error, [conversion] {
        const dsp_conversion wanted = Taken(conversion, "the conversion");
        auto made = std::make_unique<Converter>(Settings(wanted));
        const double factor = static_cast<double>(made->converter.Up()) / made->converter.Down();
        const double cents = 1200.0 * std::log2(factor * wanted.in_rate / wanted.out_rate);
        Require(std::abs(cents) <= kMostCents, "factors up to 49 miss the rate by " +
                                                   std::to_string(std::lround(std::abs(cents))) + " cents");
        return made;
    });
}

dsp_status DSP_CALL dsp_converter_frames(dsp_converter* converter, int64_t in_frames, int64_t* out_frames,
                                         int64_t* most_of_a_block) {
    return With<Converter>(converter, [&](Converter& c) -> dsp_status {
        // Factors are below 2^23.
        if (!Within(in_frames, 0, INT64_MAX >> 25)) return DSP_OUT_OF_RANGE;
        if (out_frames) *out_frames = c.converter.FramesOut(in_frames);
        if (most_of_a_block) *most_of_a_block = c.converter.MostFrames(in_frames);
        return DSP_OK;
    });
}

dsp_status DSP_CALL dsp_converter_factors(dsp_converter* converter, int32_t* up, int32_t* down) {
    return With<Converter>(converter, [&](Converter& c) {
        if (up) *up = c.converter.Up();
        if (down) *down = c.converter.Down();
    });
}

dsp_status DSP_CALL dsp_converter_process(dsp_converter* converter, const void* in, int32_t frames, void* out,
                                          int32_t capacity, int32_t* written) {
    return With<Converter>(converter, [&](Converter& c) -> dsp_status {
        if (!written || (frames > 0 && (!in || !out))) return DSP_NULL;
        if (frames < 0) return DSP_OUT_OF_RANGE;
        if (c.finished) return DSP_UNPREPARED;
        if (frames > 0 && capacity < c.converter.MostFrames(frames)) return DSP_TOO_SMALL;
        return Give(c.converter.Convert(in, frames, out), written);
    });
}

dsp_status DSP_CALL dsp_converter_finish(dsp_converter* converter, void* out, int32_t capacity,
                                         int32_t* written) {
    return With<Converter>(converter, [&](Converter& c) -> dsp_status {
        if (!written || !out) return DSP_NULL;
        if (capacity < c.converter.MostFrames(1)) return DSP_TOO_SMALL;
        c.finished = true;
        return Give(c.converter.Finish(out, capacity), written);
    });
}

dsp_status DSP_CALL dsp_pitch_shift_create(const dsp_shift* shift, dsp_pitch_shift** pitch_shift,
                                           dsp_error* error) {
    return Create(pitch_shift, error,
                  [shift] { return std::make_unique<PitchShift>(Settings(Taken(shift, "the shift"))); });
}

dsp_status DSP_CALL dsp_pitch_shift_feed(dsp_pitch_shift* pitch_shift, const float* samples, int32_t frames) {
    return With<PitchShift>(pitch_shift, [&](PitchShift& p) -> dsp_status {
        if (frames < 0) return DSP_OUT_OF_RANGE;
        if (frames > 0 && !samples) return DSP_NULL;
        if (p.finished) return DSP_UNPREPARED;
        p.shift.Feed(samples, frames);
        return DSP_OK;
    });
}

dsp_status DSP_CALL dsp_pitch_shift_finish(dsp_pitch_shift* pitch_shift) {
    return With<PitchShift>(pitch_shift, [](PitchShift& p) {
        if (!std::exchange(p.finished, true)) p.shift.Finish();
    });
}

dsp_status DSP_CALL dsp_pitch_shift_take(dsp_pitch_shift* pitch_shift, float* samples, int32_t capacity,
                                         int32_t* written) {
    return With<PitchShift>(pitch_shift, [&](PitchShift& p) -> dsp_status {
        if (!written || (capacity > 0 && !samples)) return DSP_NULL;
        if (capacity < 0) return DSP_OUT_OF_RANGE;
        return Give(p.shift.Take(samples, capacity), written);
    });
}
