#pragma once

#include "Drawing/DrawTarget.h"
#include "Drawing/Views/ShortText.h"
#include "Spectrum/Scales/CoordinatesAndFrequencies.h"
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
// What is shown of the frequency axis in `rectangle`.
CoordinatesAndFrequencies ShownMap(const RectF& rectangle, const SpectrumSettings& settings, int samplingRate,
                                   const FrequencySpan& span);
bool IsLargeEnough(const RectF& plot, float scale);
bool ShowsNotes(const SpectrumSettings& settings);
// "1.000 kHz   B5 +21c   -20.0 dB": what the pointer is over or, without one, the highest peak.
ShortText DescribeSpectrum(double hz, double level, LevelScale scale);
// "Δ   +120.0 Hz   +3.86 st   −6.0 dB": from the marker to what is pointed at; empty without a marker.
// Levels are compared within one plot, moments within the sonogram.
ShortText DescribeDifference(const AnalyserReading& marker, const AnalyserReading& pointed, LevelScale scale);

void DrawSpectrumAs(kivspectrum& analyser, DrawTarget& target, const RectF& rectangle,
                    const SpectrumSettings& view);

}  // namespace Corvo
