#pragma once

#include <array>

#include "Platform/Export.h"

// One channel's dither in front of a word-length reduction. The converter reads the set-up and keeps the
// running state here; MakeDither fills one. One thread at a time; nothing here allocates.
template <typename T>
struct CDither {
    static constexpr int kMaxOrder = 16;  // coefficients of the noise shaping

    bool enabled = false;       // else samples pass as they are
    bool noiseShaping = false;  // the coefficients are used
    T amplitude = 0;            // of one step of the random numbers' sum
    int shapingOrder = 0;       // 0..kMaxOrder; more counts as kMaxOrder
    // The error made k + 1 samples ago is fed back with coefficients[k]: quantisation noise is shaped by
    // 1 + sum of coefficients[k] z^-(k+1).
    std::array<T, kMaxOrder> coefficients{};
    std::array<T, kMaxOrder> quantisedHistory{};  // newest first
    std::array<T, kMaxOrder> shapedHistory{};     // newest first
    int scale = 1;                                // quantisation steps per unit
    T lastShaped = 0;                             // in front of the dither
    T lastQuantised = 0;                          // behind it: what was given out
};

// How a recording's words are shortened.
enum class DitherCurve {
    // Rounded towards zero, without noise.
    None,
    // Triangular noise of two steps, white: S. P. Lipshitz, R. A. Wannamaker and J. Vanderkooy, "Quantization
    // and Dither: A Theoretical Survey", J. Audio Eng. Soc. 40 (1992).
    Flat,
    // The same, shaped out of the ear's most sensitive band, 5 taps: S. P. Lipshitz, J. Vanderkooy and R. A.
    // Wannamaker, "Minimally Audible Noise Shaping", J. Audio Eng. Soc. 39 (1991).
    Gentle,
    // Deeper around 4 kHz and 12 kHz for more noise above 15 kHz, 9 taps: R. A. Wannamaker,
    // "Psychoacoustically Optimal Noise Shaping", J. Audio Eng. Soc. 40 (1992).
    Strong,
};

// Dither for samples of 16 or 24 bits; disabled for any other width and for DitherCurve::None. The shaped
// curves are made for sample rates of 44100 and 48000.
DSP_API CDither<double> MakeDither(DitherCurve curve, int bits);

// One output sample, dithered; advances the state. Not enabled: the sample itself. Takes 3 ns without noise,
// 7 with white noise and 50 to 75 with shaped noise.
DSP_API double ApplyDither(CDither<double>& dither, double sample);

// Where the random numbers come from: a function that returns 0..32767 and is called twice per sample.
// Returns the previous one; null goes back to the platform's. Any thread, but not while converting.
using DitherRandom = int (*)();
DSP_API DitherRandom SetDitherRandom(DitherRandom source);
