#pragma once

#include "Drawing/Views/WholeView.h"
#include "Platform/Export.h"

// Makes all drawing routines for one back-end; in one source file each.
// clang-format off
#define DSP_INSTANTIATE_VIEW(Class, Routine, Drawing) \
    template DSP_API void Class::Routine<Drawing>(Drawing::DrawTarget&, const Corvo::RectF&);

#define DSP_INSTANTIATE_VIEWS(Drawing)                                           \
    DSP_INSTANTIATE_VIEW(Corvo::Sonogram, Draw, Drawing)                         \
    DSP_INSTANTIATE_VIEW(Corvo::Sonogram, DrawIntensityScale, Drawing)           \
    DSP_INSTANTIATE_VIEW(Corvo::Sonogram, DrawTimeline, Drawing)                 \
    DSP_INSTANTIATE_VIEW(Corvo::Sonogram, DrawPitchTrace, Drawing)               \
    template DSP_API void Corvo::Sonogram::DrawFrequencyScale<Drawing>(          \
        Drawing::DrawTarget&, const Corvo::RectF&, bool);                        \
    DSP_INSTANTIATE_VIEW(kivspectrum, DoDrawSpectrum, Drawing)                   \
    DSP_INSTANTIATE_VIEW(kivspectrum, DrawSonogramIntensityScale, Drawing)       \
    DSP_INSTANTIATE_VIEW(kivspectrum, DrawSonogramComponents, Drawing)           \
    DSP_INSTANTIATE_VIEW(kivspectrum, DoDrawSonogramAndSpectrum, Drawing)        \
    DSP_INSTANTIATE_VIEW(kivspectrum, DoDrawBigLetter, Drawing)                  \
    DSP_INSTANTIATE_VIEW(kivspectrum, DrawTunerBigLetter, Drawing)               \
    DSP_INSTANTIATE_VIEW(kivspectrum, DrawNeedle, Drawing)                       \
    DSP_INSTANTIATE_VIEW(kivspectrum, DrawNeedleInfo, Drawing)                   \
    DSP_INSTANTIATE_VIEW(kivspectrum, DrawTunerWithNeedle, Drawing)              \
    DSP_INSTANTIATE_VIEW(kivspectrum, DrawTuner, Drawing)                        \
    DSP_INSTANTIATE_VIEW(kivspectrum, DoDraw, Drawing)
// clang-format on
