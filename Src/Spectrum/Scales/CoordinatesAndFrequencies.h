#pragma once

#include "Picture/Geometry.h"
#include "Platform/Export.h"
#include "Spectrum/Scales/SpectrumScales.h"

// Maps frequencies (Hz) to x and levels to y within a rectangle, and back. A level is in the scale's own
// unit: decibels below full scale, or power or amplitude as a fraction of it. Never changes once made,
// allocates nothing, and serves any thread.
class DSP_API CoordinatesAndFrequencies {
public:
    // `lowest` and `highest` are at the left and right edge. Scales other than linear and mel begin at 1 Hz
    // or above; the note scale is widened to whole semitones. The decibel scale reaches from -range to 0, the
    // others from 0 to 1.
    CoordinatesAndFrequencies(const Corvo::RectF& rectangle, double lowest, double highest,
                              Corvo::FrequencyScale frequencies, Corvo::LevelScale levels, float range);

    // What the map was made for; Hz.
    const Corvo::RectF& GetRectangle() const;
    double GetLowest() const;
    double GetHighest() const;
    // Never Automatic: what it chose.
    Corvo::FrequencyScale GetFrequencyScale() const;
    Corvo::LevelScale GetLevelScale() const;
    // The level at the bottom.
    double GetFloor() const;

    // Beyond the edges, too. The mel scale is ln(1 + f / 700 Hz): D. O'Shaughnessy, "Speech
    // Communication: Human and Machine" (1987).
    float FrequencyToX(double frequency) const;
    double XToFrequency(double x) const;
    // Levels outside the scale are drawn at its edge.
    float LevelToY(double level) const;
    double YToLevel(double y) const;

private:
    double Position(double frequency) const;

    Corvo::RectF m_rectangle;
    Corvo::FrequencyScale m_frequencies;
    Corvo::LevelScale m_levels;
    double m_lowest, m_highest;
    double m_left, m_span;  // of the position along the scale
    double m_floor, m_top;
};

namespace Corvo {

// Where a display's frequency axis begins: at 20 Hz, or 0 on the linear and mel scales.
DSP_API double LowestShown(FrequencyScale scale);

// What a display of the settings shows in `rectangle`: from the lowest frequency shown to half the sampling
// rate.
DSP_API CoordinatesAndFrequencies SpectrumMap(const RectF& rectangle, const SpectrumSettings& settings,
                                              int samplingRate);

}  // namespace Corvo
