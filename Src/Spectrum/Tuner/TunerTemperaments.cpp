#include "Spectrum/Tuner/TunerTemperaments.h"

#include <cmath>
#include <cstddef>

namespace Corvo {
namespace {

using Steps = std::array<float, 12>;

constexpr float kSyntonic = 1.0125f;                 // 81/80
constexpr float kPythagorean = 1.0136432647705078f;  // 3^12 / 2^19

// clang-format off
// By how many commas each note leaves the chain of pure fifths.
//                                A      A#     B       C      C#   D      D#    E       F      F#   G       G#
constexpr Steps kFifths      {   -3,     2,    -5,      0,    -7,  -2,     3,   -4,      1,    -6,  -1,     -8};
constexpr Steps kWerckmeister{-0.75f,    0, -0.75f,     0,    -1, -0.5f,   0, -0.75f,    0,    -1, -0.25f,  -1};
constexpr Steps kVallotti    {-1/2.0f,   0, -5/6.0f,    0,    -1, -1/3.0f, 0, -2/3.0f,   0,    -1, -1/6.0f, -1};
constexpr Steps kJust1       {    0,     1,    -1,      0,    -1,   0,     1,   -1,      0,    -1,   0,     -1};
constexpr Steps kJust2       {    0,     0,    -1,      0,    -1,   0,     0,   -1,      0,    -1,   0,     -1};

constexpr std::array<double, 12> kPureFifths{
    1.0, 256/243.0, 9/8.0, 32/27.0, 81/64.0, 4/3.0, 1024/729.0, 3/2.0, 128/81.0, 27/16.0, 16/9.0, 243/128.0};

struct Row { const Steps* steps; float comma, fraction; };
constexpr Row kRows[] = {
    {&kFifths,       kSyntonic,    0},
    {&kFifths,       kSyntonic,    0.25f},
    {&kWerckmeister, kPythagorean, 1},
    {&kJust1,        kSyntonic,    1},
    {&kJust2,        kSyntonic,    1},
    {&kJust2,        kSyntonic,    1},
    {&kFifths,       kSyntonic,    1/7.0f},
    {&kFifths,       kSyntonic,    2/7.0f},
    {&kFifths,       kSyntonic,    1/3.0f},
    {&kVallotti,     kPythagorean, 1},
};
// clang-format on

}  // namespace

const char* TemperamentName(int temperament) {
    return temperament >= 0 && temperament < kTemperaments ? kTemperamentNames[temperament] : "";
}

std::array<double, kTableNotes> TemperedNotes(int temperament, double base) {
    std::array<double, kTableNotes> notes;
    if (temperament < 1 || temperament >= kTemperaments) {
        for (int i = 0; i < kTableNotes; ++i)
            notes[static_cast<std::size_t>(i)] = base * std::pow(2.0, i / 12.0);
        return notes;
    }
    const auto& [steps, comma, fraction] = kRows[temperament - 1];
    notes[0] = base;
    for (std::size_t i = 1; i < kPureFifths.size(); ++i)
        notes[i] = base * kPureFifths[i] * std::pow(comma, ((*steps)[i] - (*steps)[0]) * fraction);
    notes[12] = 2.0 * base;
    return notes;
}

}  // namespace Corvo
