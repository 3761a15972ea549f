#pragma once

#include "DSP/Equalizer/AudioParameter.h"
#include "DSP/Equalizer/EQFilterType.h"
#include "Platform/Export.h"

namespace Corvo::DSP {

// The coefficients of a second-order section, normalised so that a0 is 1:
// w = x - a1*w1 - a2*w2, y = b0*w + b1*w1 + b2*w2.
template <typename Parameter>
struct coeff {
    Parameter b0, b1, b2, a1, a2;  // what the line above multiplies by
};

// Coefficients that glide; those of an equaliser are counted while they do.
using SmoothCoefficient = AudioParameter<double, AudioParameterProgressAlternate>;
using ManagedCoefficient = AudioParameterManaged<double, AudioParameterProgressAlternate>;

// Designs a filter and hands its coefficients to the parameters as new targets; `immediate` makes them jump.
//
// `gain` is linear, `freq` and `sampleRate` in Hz. Q: a peak is Q/133 octaves wide; the shelves slope with
// Q/50, 1 being the steepest without a bump and 3 the limit; high- and low-pass resonate with Q/50, 1 being
// the flattest; the Butterworth shelves take no Q. `gain` scales the whole pass band of a high- or low-pass.
// Formulae: R. Bristow-Johnson, "Cookbook formulae for audio equalizer biquad filter coefficients", for peak
// and shelves; the passes by the bilinear transform; the Butterworth shelves designed at a quarter of the
// rate and moved by an all-pass (A. G. Constantinides, "Spectral transformations for digital filters",
// Proceedings of the IEE 117, 1970).
//
// Nothing is checked: a frequency at or above half the rate, or a Q of 0 or less, gives whatever the
// formulas give, which may be unstable or not a number. No memory, no locks; takes 20 to 60 ns.
template <typename Parameter>
DSP_API void CalcolaCoefficientiBiquad(EQFilterType type, double gain, long freq, long Q,
                                       coeff<Parameter>* coefficients, int sampleRate, bool immediate);

extern template DSP_API void CalcolaCoefficientiBiquad(EQFilterType, double, long, long,
                                                       coeff<SmoothCoefficient>*, int, bool);
extern template DSP_API void CalcolaCoefficientiBiquad(EQFilterType, double, long, long,
                                                       coeff<ManagedCoefficient>*, int, bool);

}  // namespace Corvo::DSP
