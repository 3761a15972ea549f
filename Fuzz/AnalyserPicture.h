#pragma once

#include <cairo.h>
#include <pango/pangocairo.h>

#include "Drawing/Backends/DrawingCairo.h"
#include "Target.h"

namespace Fuzz {

using Corvo::DrawingCairo;
using Draw = void (kivspectrum::*)(DrawingCairo::DrawTarget&, const Corvo::RectF&);

inline constexpr Draw kPictures[] = {
    &kivspectrum::DoDraw<DrawingCairo>,
    &kivspectrum::DoDrawSpectrum<DrawingCairo>,
    &kivspectrum::DoDrawSonogramAndSpectrum<DrawingCairo>,
    &kivspectrum::DrawSonogramComponents<DrawingCairo>,
    &kivspectrum::DrawSonogramIntensityScale<DrawingCairo>,
    &kivspectrum::DoDrawBigLetter<DrawingCairo>,
    &kivspectrum::DrawTuner<DrawingCairo>,
    &kivspectrum::DrawTunerBigLetter<DrawingCairo>,
    &kivspectrum::DrawTunerWithNeedle<DrawingCairo>,
    &kivspectrum::DrawNeedle<DrawingCairo>,
    &kivspectrum::DrawNeedleInfo<DrawingCairo>,
};

// One picture of the analyser, of any size at any place, on a surface of its own.
inline void DrawAnything(Input& input, kivspectrum& analyser) {
    // Texts of any size fill the fonts' caches for as long as a process goes on.
    pango_cairo_font_map_set_default(nullptr);
    DrawingCairo drawing;
    const int width = input.Between(1, 400), height = input.Between(1, 300);
    const bool usual = input.Flag();
    const auto edge = [&](int limit) { return usual ? static_cast<float>(limit) : input.Raw<float>(); };
    const Corvo::RectF rectangle{edge(0), edge(0), edge(width), edge(height)};
    cairo_surface_t* const surface = cairo_image_surface_create(CAIRO_FORMAT_RGB24, width, height);
    cairo_t* const context = cairo_create(surface);
    {
        DrawingCairo::DrawTarget target(drawing, context, input.Flag() ? 96.0f : input.Raw<float>());
        (analyser.*input.OneOf(kPictures))(target, rectangle);
    }
    cairo_destroy(context);
    cairo_surface_destroy(surface);
}

}  // namespace Fuzz
