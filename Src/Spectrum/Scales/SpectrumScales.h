#pragma once

#include "Platform/Export.h"
#include "Spectrum/Scales/SpectrumSettings.h"

namespace Corvo {

// What the display fields of the settings record mean. Any thread, at no cost.

// view_option_a. Automatic is logarithmic, and linear over less than two octaves. The bands collect the power
// of their bins around the centres 1000 Hz * 2^n and 2^(n/3).
enum class FrequencyScale { Automatic = -1, Linear, Logarithmic, Octaves, ThirdOctaves, Mel, Notes };
// view_option_b.
enum class LevelScale { Decibels, Power, Amplitude };
// view_option_e.
enum class CurveStyle { Line = 1, Filled, Bars };

// What a field of the settings says; values outside are taken as the default.
DSP_API FrequencyScale FrequencyScaleOf(const SpectrumSettings& settings);
DSP_API LevelScale LevelScaleOf(const SpectrumSettings& settings);
DSP_API CurveStyle CurveStyleOf(const SpectrumSettings& settings);
// view_option_d: how far the decibel scale reaches below full scale.
DSP_API float VerticalRangeOf(const SpectrumSettings& settings);

// The power that a full-scale sine on a bin's centre has in the analyser's power spectrum.
DSP_API double FullScalePower(const SpectrumSettings& settings);
// How many bins the transform has for each of the window's: above 1 where it is longer.
double Padding(const SpectrumSettings& settings);
// How many bins' worth of a sine's peak power its windowed spectrum sums to.
DSP_API double NoiseBandwidth(const SpectrumSettings& settings);

}  // namespace Corvo
