#include <algorithm>
#include <cmath>
#include <cstdio>

#include "TunerFixture.h"
#include "TunerSounds.h"

namespace {

using TunerSounds::Kind;

constexpr int kLength = 8192;
constexpr int kFrames = 8;
constexpr std::size_t kHop = 1470;  // a refresh at 44.1 kHz

struct KindRow {
    const char* name;
    Kind kind;
};
constexpr KindRow kKinds[] = {{"sine", Kind::Sine},
                              {"sawtooth", Kind::Sawtooth},
                              {"plucked", Kind::Plucked},
                              {"missing fundamental", Kind::MissingFundamental},
                              {"piano", Kind::Piano}};

struct NoiseRow {
    const char* name;
    double decibelsBelow;  // 0 for none
    double bins;
};
constexpr NoiseRow kNoises[] = {
    {"clean", 0, 0.02}, {"30 dB", 30, 0.03}, {"20 dB", 20, 0.05}, {"10 dB", 10, 0.05}};

// Semitones above 55 Hz and cents beside them.
struct Tone {
    int semitones;
    double cents;
};
constexpr Tone kTones[] = {{0, 0},    {1, -37}, {4, 21},  {7, 0},   {11, 44}, {12, 0},   {17, -44},
                           {21, 12},  {24, -7}, {28, 31}, {33, 0},  {36, 45}, {41, -19}, {48, 3},
                           {55, -45}, {60, 0},  {63, 38}, {68, -3}, {72, 17}, {74, -30}, {75, 0}};

struct Worst {
    double ofBound = 0.0, bins = 0.0, cents = 0.0, hz = 0.0;
    int wrong = 0, frames = 0;
};

// 55 Hz to 4186 Hz: the right note in 99 of 100 frames, the error within the bound but never asked below half
// a cent. Catches octave errors, bias of the interpolation, and pitches pulled by noise or inharmonicity.
TEST_F(TunerTest, HearsEveryKindOfTone) {
    for (const KindRow& kind : kKinds)
        for (const NoiseRow& noise : kNoises) {
            Worst worst;
            for (const int rate : {44100, 48000})
                for (std::size_t t = 0; t < std::size(kTones); ++t) {
                    const double note = 55.0 * std::exp2(kTones[t].semitones / 12.0);
                    const double hz = note * std::exp2(kTones[t].cents / 1200.0);
                    auto sound = TunerSounds::Sound(kind.kind, hz, rate, kLength + kFrames * kHop,
                                                    0.13 * static_cast<double>(t));
                    if (noise.decibelsBelow > 0.0) TunerSounds::AddNoise(sound, noise.decibelsBelow, t + 1);
                    TunerProbe probe(rate);
                    for (int frame = 0; frame < kFrames; ++frame) {
                        probe.Tune(sound.data() + static_cast<std::size_t>(frame) * kHop);
                        ++worst.frames;
                        if (probe.tuner.GetNote() != kTones[t].semitones % 12 ||
                            std::abs(probe.tuner.GetFrequency() / note - 1.0) > 0.06) {
                            ++worst.wrong;
                            continue;
                        }
                        const double bins = std::abs(probe.tuner.GetFrequency() - hz) * kLength / rate;
                        const double cents = std::abs(probe.tuner.GetErrorCents() - kTones[t].cents);
                        const double halfCent = hz * (std::exp2(0.5 / 1200.0) - 1.0) * kLength / rate;
                        const double ofBound = bins / std::max(noise.bins, halfCent);
                        if (ofBound > worst.ofBound) {
                            worst.ofBound = ofBound;
                            worst.bins = bins;
                            worst.cents = cents;
                            worst.hz = hz;
                        }
                    }
                }
            std::printf(
                "%-20s %-6s wrong %d of %d, worst %.2f of its bound: %.4f bins, %.2f cents at %.1f Hz\n",
                kind.name, noise.name, worst.wrong, worst.frames, worst.ofBound, worst.bins, worst.cents,
                worst.hz);
            EXPECT_LE(worst.wrong, worst.frames / 100) << kind.name << ", " << noise.name;
            EXPECT_LE(worst.ofBound, 1.0) << kind.name << ", " << noise.name;
        }
}

}  // namespace
