#pragma once

#include "Drawing/DrawTarget.h"
#include "Spectrum/Scales/SpectrumScales.h"
#include "Spectrum/kivspectrum.h"

namespace Corvo {

// Where the parts of a sonogram stand; strips of no width where they are not wanted or leave no room.
struct SonogramLayout {
    RectF plot, frequencies, timeline, intensity;
};

SonogramLayout LayOutSonogram(DrawTarget& target, const RectF& rectangle, const SpectrumSettings& settings);

void DrawSonogramAs(kivspectrum& analyser, DrawTarget& target, const RectF& rectangle,
                    const SpectrumSettings& view);

}  // namespace Corvo
