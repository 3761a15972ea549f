#pragma once

#include <array>
#include <cstdint>
#include <span>

#include "DSP/Effects/Denoiser/Format.h"

namespace Corvo::DSP::Denoising {

// Lengths are written for 44.1 and 48 kHz; at other rates they are multiplied by the power of two that keeps
// them nearest to as long in seconds, from a quarter at 8 kHz to four times at 176.4 kHz and above.
struct Scale {
    int numerator = 1, denominator = 1;
    static Scale Of(double rate);
    int operator()(int length) const { return length * numerator / denominator; }
    friend bool operator==(const Scale&, const Scale&) = default;
};

// How one window length is used.
struct SizePlan {
    int length;
    int kernel;     // frames that the evidence is averaged over, with the weights of a Hann window
    int ahead;      // of those, frames that lie ahead
    float degrees;  // of freedom of that average under white noise: 2 mean^2 / variance
    // When a frame's work is done: it begins `delay` units after the frame's last sample and is spread over
    // `units` of kUnit samples.
    int delay, units;
};

// One choice of "FFT size".
struct SizeSet {
    const char* name;
    int latency;
    std::array<SizePlan, 3> sizes;
    int count;
    int trackerUnits;  // over which the work of the adaptive profile is spread
    int blendUnits;

    std::span<const SizePlan> Sizes() const { return {sizes.data(), static_cast<std::size_t>(count)}; }
};

constexpr int kUnit = 64;
constexpr int kOverlap = 4;         // frames per window
constexpr int kTrackLength = 4096;  // of the adaptive profile
constexpr int kBlendLength = 1024;
inline constexpr std::array kLearnedLengths{512, 1024, 2048, 4096, 8192};
constexpr int kLongestRing = 16384;

// Where the delays come from: the stated latency is what the longest window and the blend of sizes need at
// least. A shorter window is done with a frame sooner, so it waits until the adaptive profile has seen as
// much: its own half window, up to 1.5 hops to the next of its frames, and the time over which that work is
// spread. The longest window has only the 256 samples that separate two frames of the blend.
// clang-format off
inline constexpr std::array kSizeSets{
    //                                    length kernel ahead degrees  delay units
    SizeSet{"512 + 2048 + 8192", 9216, {{{ 512,   17,    2,   7.67174f, 48,   2},
                                         {2048,   13,    2,   6.49041f, 30,   2},
                                         {8192,    5,    0,   2.93399f,  0,   4}}}, 3, 7, 4},
    SizeSet{"512 + 4096",        5120, {{{ 512,   17,    2,   7.67174f, 24,   1},
                                         {4096,    7,    0,   3.42780f,  0,   1}}}, 2, 1, 1},
    SizeSet{"2048",              2048, {{{2048,   13,    0,   5.02930f,  0,   1}}}, 1, 4, 0},
    SizeSet{"1024",              1024, {{{1024,   13,    0,   5.07509f,  0,   1}}}, 1, 4, 0},
};
// clang-format on

// Loops over bins go over a multiple of so many values.
constexpr std::size_t kBinsAtOnce = 16;

// Values that a spectrum of a window of `length` takes in memory, per frame.
constexpr std::size_t SpectrumValues(int length) {
    return (static_cast<std::size_t>(length) / 2 + kBinsAtOnce) / kBinsAtOnce * kBinsAtOnce;
}

// The set that a stored word chooses; words out of range act like the nearest.
const SizeSet& SizeSetAt(std::int32_t word);

Format_t FormatOf(int rate, int channels, const SizeSet& set, const Scale& scale);

}  // namespace Corvo::DSP::Denoising
