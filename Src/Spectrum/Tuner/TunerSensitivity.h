#pragma once

#include <array>

namespace Corvo {

// How sure the tuner must be, and how long it waits.
//
//   lowestHz, highestHz  pitches sought; the lowest also gives the first bin searched
//   partialDb            a peak this far above the noise floor is a partial, and keeps the note alive
//   onsetDb              partials that together stand this far above it begin a note or change to another
//   rangeDb              partials this far below the strongest one count for nothing
//   releaseCount         refreshes without the note until it is dropped
//   holdCount            refreshes without the note for which the tuner still counts as tracking it
//   confirmCount         refreshes in succession that must hear another note before it replaces the one shown
//   harmonics            partials summed by the pseudo harmonic product (method 2)
//   reported             what GetSensibilityPreset gives
//
// The noise floor is what one bin of noise in seven exceeds (twice the mean power), so that the loudest of a
// spectrum's thousands of noise bins reaches about 6 dB. Refreshes are thirtieths of a second; with analyses
// further apart as many of these as take as long. The harmonic product proper (method 1) has limits of its
// own instead of the three in decibels, multiplies five spectra and leaves its five in `harmonics`.
struct TunerSensitivity {
    float lowestHz, highestHz;
    float partialDb, onsetDb, rangeDb;
    int releaseCount, holdCount, confirmCount;
    int harmonics;
    int reported;
};

struct TunerSensitivityPreset {
    const char* name;
    TunerSensitivity values;
};

// clang-format off
inline constexpr std::array kTunerSensitivities{
    //                     name                    lowest highest  partial onset range   release hold confirm  harmonics reported
    TunerSensitivityPreset{"Standard",             { 30, 17000,         5,   15,   25,        60,  40,      3,         3,       2}},
    TunerSensitivityPreset{"Noisy environment",    { 70, 10000,        25,   40,   20,        40,  25,      6,         3,       1}},
    TunerSensitivityPreset{"Sensitive",            { 30, 17000,         4,   11,   25,        60,  40,      2,         2,       2}},
    TunerSensitivityPreset{"Stable sounds",        { 70, 15000,         8,   18,   13,        40,  30,      8,         3,       3}},
    TunerSensitivityPreset{"Strong sounds",        { 40, 12000,        25,   35,   15,        50,  30,      4,         7,       4}},
    TunerSensitivityPreset{"Very high frequencies",{100, 19000,        15,   35,   15,        50,  30,      4,         2,       5}},
};
// clang-format on

// Cents within which a note counts as tuned, by preset.
inline constexpr std::array kTunedQuanta{0.1f, 0.5f, 1.0f, 2.0f, 5.0f, 10.0f};

}  // namespace Corvo
