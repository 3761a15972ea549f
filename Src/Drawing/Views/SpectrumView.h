#pragma once

#include "Drawing/DrawTarget.h"
#include "Drawing/Views/ShortText.h"
#include "Spectrum/Scales/SpectrumScales.h"
#include "Spectrum/kivspectrum.h"

// The spectrum's curve with its scales: what the other views share with it.
namespace Corvo {

// Where the plot of a spectrum stands, and whether there are labels to its left and below it: where they are
// wanted and leave room.
struct SpectrumLayout {
    RectF plot;
    bool labels;
};

SpectrumLayout LayOutSpectrum(DrawTarget& target, const RectF& rectangle, const SpectrumSettings& settings);
bool IsLargeEnough(const RectF& plot, float scale);
bool ShowsNotes(const SpectrumSettings& settings);
// "1.000 kHz   B5 +21c   -20.0 dB": what the pointer is over or, without one, the highest peak.
ShortText DescribeSpectrum(double hz, double level, LevelScale scale);

void DrawSpectrumAs(kivspectrum& analyser, DrawTarget& target, const RectF& rectangle,
                    const SpectrumSettings& view);

}  // namespace Corvo
