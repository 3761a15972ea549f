#pragma once

#include <array>

namespace Corvo {

inline constexpr int kTemperaments = 11;
inline constexpr int kTableNotes = 13;  // A to the A above

// 0 Equal .. 10 Vallotti; empty outside.
const char* TemperamentName(int temperament);

// The octave of notes from `base` (Hz), A, to twice it. An index outside 1..10 is tuned equally.
std::array<double, kTableNotes> TemperedNotes(int temperament, double base);

}  // namespace Corvo
