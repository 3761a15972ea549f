#pragma once

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdint>
#include <string_view>

namespace Corvo::DSP::EchoDelay {

// How the echo's depth word, 0..10000, becomes a delay.

enum Mode : std::int32_t { kLinear, kLog, kStraight, kTriplet, kDotted, kModes };

constexpr std::array<std::string_view, kModes> kModeNames{"Time (linear)", "Time (log)", "Tempo (straight)",
                                                          "Tempo (triplet)", "Tempo (dotted)"};

// Each twice as long as the one before; the measure follows the time signature.
constexpr std::array<std::string_view, 10> kNotes{"1/256", "1/128", "1/64", "1/32", "1/16",
                                                  "1/8",   "1/4",   "1/2",  "Beat", "Measure"};
constexpr int kBeat = 8, kMeasure = 9;
constexpr std::int32_t kWordsPerNote = 1000;

struct Tempo {
    double bpm;
    int numerator, denominator;
};

inline bool IsTime(std::int32_t mode) { return mode == kLinear || mode == kLog; }
inline bool IsTempo(std::int32_t mode) { return mode >= kStraight && mode <= kDotted; }

inline int NoteIndex(std::int32_t word) { return std::clamp(word / kWordsPerNote, 0, kMeasure); }

// One and two single-precision steps off 60000 and 62.5, and 1/3 in single precision: delays in saved
// projects were made with them.
inline double NoteMs(int note, std::int32_t mode, const Tempo& tempo) {
    const double ms = note == kMeasure
                          ? 3840.0 / tempo.denominator * (62.500004 / tempo.bpm) * tempo.numerator
                          : std::ldexp(59999.992 / tempo.bpm, note - kBeat);
    if (mode == kDotted) return ms * 1.5;
    if (mode == kTriplet) return ms * 0.33333334;  // a third of the note, not two
    return ms;
}

// Milliseconds of any word; a mode that does not exist gives 1.
inline double Ms(std::int32_t word, std::int32_t mode, const Tempo& tempo) {
    const double control = word * 0.0001;
    if (mode == kLinear) return control * 10000.0;
    if (mode == kLog) return std::exp(control * 8.513185501098633) + 19.0;
    return IsTempo(mode) ? NoteMs(NoteIndex(word), mode, tempo) : 1.0;
}

// The word of a time mode whose delay is `ms`. It may lie above what the parameter reaches: 10 s in the
// logarithmic mode is 10817.
inline std::int32_t Word(std::int32_t mode, double ms) {
    const double word =
        mode == kLinear ? ms : 1.0 - std::trunc(-1174.6484375 * std::log(std::max(20.0, ms) - 19.0));
    return word > 0.0 ? static_cast<std::int32_t>(std::min(word, 1e6)) : 0;
}

// The note whose delay is nearest to `ms`.
inline int NearestNote(std::int32_t mode, double ms, const Tempo& tempo) {
    int nearest = 0;
    for (int note = 1; note <= kMeasure; ++note)
        if (std::abs(NoteMs(note, mode, tempo) - ms) < std::abs(NoteMs(nearest, mode, tempo) - ms))
            nearest = note;
    return nearest;
}

}  // namespace Corvo::DSP::EchoDelay
