#pragma once

#include <array>
#include <cstdint>

namespace Corvo::DSP::CompressorPrivate {

struct TransferCurve;

// A factory preset as an engineer would note it down.
struct CompressorPreset {
    // Below the threshold the output sinks `slope` decibels per decibel, down by `range` at most. The knee
    // is centred on the threshold. No gate: range 0.
    struct Gate {
        double threshold = 0.0, slope = 1.0, range = 0.0, knee = 0.0;
    };
    const char* name;
    double threshold;      // dB; the knee is centred on it
    double ratio;          // decibels in per decibel out above it; 1: no knee at all
    double knee;           // width in dB, 0: hard
    double attack;         // ms, as the knob shows it
    double release;        // ms, as the knob shows it; it acts ten times as long
    double outGain = 0.0;  // dB
    Gate gate{};
    bool stereoLink = true;
    bool autoMakeUp = false;
};

constexpr double kLimit = 1e9;  // a ratio beyond every text: flat

// clang-format off
inline constexpr std::array<CompressorPreset, 42> kCompressorPresets{{
    // name                      threshold ratio knee  attack release out gain  gate {threshold, slope, range, knee}, link, make-up
    {"Default",                      0.0,   1.0,  0.0,  10.0,  20.0},
    {"Soft Knee Compression",      -24.0,   3.0, 12.0,  10.0,  15.0},
    {"Compression",                -20.0,   4.0,  0.0,   8.0,  15.0},
    {"Soft Limiter",                -8.0, kLimit, 8.0,   0.5,   8.0},
    {"Soft Knee Compressor+Gate",  -22.0,   3.0, 12.0,   8.0,  15.0,  0.0,  {-50.0,  2.5, 40.0, 6.0}},
    {"Compressor+gate",            -20.0,   4.0,  0.0,   5.0,  15.0,  0.0,  {-48.0,  5.0, 50.0}},
    {"Soft Noise Gate",              0.0,   1.0,  0.0,   2.0,  20.0,  0.0,  {-46.0,  2.0, 30.0, 10.0}},
    {"Noise Gate",                   0.0,   1.0,  0.0,   0.5,  12.0,  0.0,  {-42.0,  8.0, 60.0}},
    {"Heavy Limiter",              -12.0, kLimit, 0.0,   0.05,  6.0},
    {"Inverted dynamic",           -30.0,  -2.5,  0.0,   5.0,  12.0, 12.0},
    {"Acoustic Guitar",            -22.0,   3.0,  6.0,  15.0,  12.0,  3.0},
    {"Angry Piano",                -28.0,   6.0,  4.0,   3.0,   8.0,  8.0},
    {"Big Red Kick",               -18.0,   5.0,  2.0,  20.0,   6.0,  4.0,  {-40.0,  4.0, 30.0}},
    {"DI Bass",                    -24.0,   4.0,  6.0,  12.0,  14.0,  6.0},
    {"Drum Mix",                   -16.0,   3.5,  4.0,  18.0,   9.0,  3.0},
    {"Edgy Quillon",               -26.0,   8.0,  2.0,   1.0,   7.0,  7.0},
    {"Electric Bass",              -22.0,   5.0,  4.0,  10.0,  16.0,  5.0},
    {"FET Bass",                   -24.0,  12.0,  1.0,   0.4,   8.0,  8.0},
    {"Guitar Crunch",              -20.0,   4.0,  3.0,   6.0,  10.0,  4.5},
    {"Intense Vocal",              -30.0,   8.0,  6.0,   2.0,  10.0,  9.0,  {-58.0,  2.0, 20.0, 4.0}},
    {"Jazzy Bass",                 -20.0,   2.5, 10.0,  20.0,  25.0,  3.0},
    {"Keyboard Wizard",            -21.0,   2.8,  8.0,  12.0,  18.0,  3.5},
    {"Kick Rock",                  -16.0,   6.0,  1.0,  12.0,   8.0,  4.0,  {-36.0,  6.0, 40.0}},
    {"L.A. Snare",                 -20.0,   5.5,  8.0,   8.0,  20.0,  5.0,  {-38.0,  3.0, 25.0}},
    {"Modern Acoustic Guitar",     -26.0,   3.2,  6.0,   8.0,  14.0,  5.0},
    {"Modern Organ",               -18.0,   2.2,  6.0,  10.0,  30.0,  2.5},
    {"Narrator",                   -26.0,   3.5,  8.0,   4.0,  16.0,  6.0,  {-52.0,  2.0, 24.0, 6.0}},
    {"Nashville Jangle",           -25.0,   6.0,  4.0,   7.0,   9.0,  6.5},
    {"Nice Overheads",             -18.0,   2.0, 10.0,  25.0,  20.0,  1.5},
    {"Pump It",                    -24.0,   8.0,  0.0,   5.0,  20.0, 12.0},
    {"Radiant Guitar",             -24.0,   3.6, 10.0,  14.0,  22.0,  5.0},
    {"Rock Vox",                   -24.0,   6.0,  3.0,   3.0,   9.0,  7.0,  {-54.0,  2.5, 24.0}},
    {"Soft Mix Buss",              -14.0,   1.8, 12.0,  30.0,  20.0,  1.5},
    {"Studio Vocal",               -22.0,   3.0,  8.0,   5.0,  12.0,  4.0,  {-56.0,  1.8, 18.0, 6.0}},
    {"Sustain That Solo",          -38.0,  12.0,  6.0,   5.0,  40.0, 12.0,  {-62.0,  3.0, 20.0}},
    {"Tele Pick'n",                -23.0,   4.5,  2.0,  16.0,   7.0,  5.0},
    {"Tom Tom",                    -18.0,   4.0,  3.0,  14.0,  12.0,  3.5,  {-38.0,  4.0, 36.0}, false},
    {"Velvet Kit",                 -20.0,   2.4, 12.0,  22.0,  16.0,  2.5},
    {"Vintage Electric Bass",      -26.0,   3.8, 12.0,   9.0,  30.0,  6.0},
    {"Vintage Organ",              -22.0,   2.6, 12.0,  12.0,  35.0,  3.5},
    {"Vintage String Machines",    -28.0,   2.0, 14.0,   4.0,  50.0,  0.0,  {}, true, true},
    {"Wurlie Rhodes",              -24.0,   3.4,  8.0,  18.0,  18.0,  4.0,  {}, false},
}};
// clang-format on

// The transfer curve of a preset.
TransferCurve DrawCurve(const CompressorPreset& preset);

}  // namespace Corvo::DSP::CompressorPrivate
