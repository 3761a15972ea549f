#pragma once

#include <array>

namespace Corvo {

inline constexpr int kTemperaments = 11;
inline constexpr int kTableNotes = 13;  // A to the A above

inline constexpr char kTemperamentNames[kTemperaments][30] = {"Equal",
                                                              "Pythagorean",
                                                              "Meantone (1/4 tone)",
                                                              "Werckmeister III",
                                                              "Just (Kepler)",
                                                              "Just (Fogliano I)",
                                                              "Just (Fogliano II)",
                                                              "Meantone (Romieu)",
                                                              "Meantone (Zarlino)",
                                                              "Meantone (Salinas)",
                                                              "Vallotti"};

// Empty outside 0..10.
const char* TemperamentName(int temperament);

// The octave of notes from `base` (Hz), A, to twice it. An index outside 1..10 is tuned equally.
std::array<double, kTableNotes> TemperedNotes(int temperament, double base);

}  // namespace Corvo
