#include <cmath>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>

#include "C/AnalyserHandle.h"
#include "C/Calls.h"
#include "C/PixelSurface.h"
#include "C/dspdrawing.h"
#include "Drawing/DrawingFont.h"

namespace {

using namespace Corvo::C;

constexpr int kLargestSide = 16384;

// What drawing needs again: brushes, laid-out texts, the typeface.
struct Drawing : Object {
    static constexpr Kind kKind = Kind::Drawing;
    Drawing() : Object(kKind) {}
    PixelSurface::Drawing backend;
};

dsp_picture Checked(const dsp_picture* picture) {
    const dsp_picture p =
        Taken(picture, "the picture", offsetof(dsp_picture, reserved) + sizeof picture->reserved);
    Require(p.pixels, "the picture's pixels are null", DSP_NULL);
    Require(Within(p.width, 1, kLargestSide) && Within(p.height, 1, kLargestSide),
            "a picture's sides can be 1 to 16384 pixels");
    Require(p.stride % 4 == 0 && p.stride / 4 >= p.width,
            "a picture's stride must be a multiple of 4 that a row fits into");
    Require(p.dpi > 0.0f && std::isfinite(p.dpi), "a picture's dpi must be above 0");
    return p;
}

void DrawView(kivspectrum& analyser, int view, PixelSurface::Drawing::DrawTarget& target,
              const Corvo::RectF& whole) {
    switch (view) {
        case DSP_VIEW_DISPLAY:
            return Corvo::DrawWhole(analyser, target, whole);
        case DSP_VIEW_SPECTRUM:
            return Corvo::DrawSpectrum(analyser, target, whole);
        case DSP_VIEW_SONOGRAM:
            return Corvo::DrawSonogram(analyser, target, whole);
        case DSP_VIEW_BOTH:
            return Corvo::DrawSonogramAndSpectrum(analyser, target, whole);
        case DSP_VIEW_COLOURS:
            return Corvo::DrawIntensityScale(analyser, target, whole);
        case DSP_VIEW_TUNER:
            return Corvo::DrawTuner(analyser, target, whole);
        case DSP_VIEW_NOTE:
            return Corvo::DrawNoteAndRipples(analyser, target, whole);
        case DSP_VIEW_NEEDLE:
            return Corvo::DrawNeedleAndInfo(analyser, target, whole);
        default:
            throw Refusal{DSP_OUT_OF_RANGE, "there is no view " + std::to_string(view)};
    }
}

}  // namespace

dsp_status DSP_CALL dsp_drawing_create(dsp_drawing** drawing, dsp_error* error) {
    return Create(drawing, error, [] { return std::make_unique<Drawing>(); });
}

dsp_status DSP_CALL dsp_draw(dsp_drawing* drawing, dsp_analyser* analyser, int32_t view,
                             const dsp_picture* picture, dsp_error* error) {
    return With<Drawing>(drawing, error, [&](Drawing& own) -> dsp_status {
        kivspectrum* found = nullptr;
        if (const dsp_status status = AnalyserBehind(analyser, found); status != DSP_OK) return status;
        const dsp_picture p = Checked(picture);
        PixelSurface surface(own.backend, p);
        DrawView(*found, view, surface.target,
                 {0.0f, 0.0f, static_cast<float>(p.width), static_cast<float>(p.height)});
        return DSP_OK;
    });
}

dsp_status DSP_CALL dsp_drawing_font(const char* path, dsp_error* error) {
    return Guarded(error, [path] {
        Corvo::DrawingFont::SetFile(path ? path : "");
        return DSP_OK;
    });
}
