#pragma once

#include "Drawing/SpectrumView.h"
#include "Platform/Export.h"

// Makes all drawing routines for one back-end; in one source file each.
#define DSP_INSTANTIATE_VIEWS(Drawing) \
    template DSP_API void kivspectrum::DoDrawSpectrum<Drawing>(Drawing::DrawTarget&, const Corvo::RectF&);
