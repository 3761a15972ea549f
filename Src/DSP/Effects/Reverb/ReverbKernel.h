#pragma once

#include <array>
#include <cstddef>

#include "DSP/Effects/Reverb/ReverbDesign.h"
#include "DSP/Parts/PieceRing.h"

namespace Corvo::DSP {

// Frames that are filtered and reflected at a time, and that run through the loops.
constexpr int kReverbStretch = 512, kReverbPiece = PieceRing<float>::kPiece;

// The combs of all channels side by side, one channel's after the other's.
template <typename T>
struct CombBank {
    static constexpr std::size_t kMost = 2 * ReverbDesign::kCombs, kPadded = kMost + 4;
    // What a comb's damping remembers, and its gains; what pads a register is 0.
    std::array<T, kPadded> memory{}, damping{}, feedback{};
};

// The gains of a channel's sound.
template <typename T>
struct ReverbLevels {
    T reflections{}, tail{}, wet{}, dry{};
};

// What is done to `count` frames.
template <typename T>
struct ReverbKernels {
    // The reflections' sum; each is read from its own place.
    void (*reflect)(const std::array<const T*, ReverbDesign::kTaps>& from, T* early, int count);
    // Runs the combs of one or two channels, each in its `cells`, on their reflections.
    void (*combs)(CombBank<T>& bank, T* const* cells, const std::array<const T*, 2>& early,
                  const std::array<T*, 2>& sum, int channels, int count);
    // The all-pass, in place. False when something that is not finite came out.
    bool (*allPass)(T* cells, T* sum, int count);
    // Dry sound, reflections and tail; the result may take the tail's place.
    void (*mix)(const ReverbLevels<T>& levels, const T* in, const T* early, const T* tail, T* out, int count);
};

// One for every processor, and one for those with AVX2. Both give the same bits.
template <typename T>
const ReverbKernels<T>& BaselineReverbKernels();
template <typename T>
const ReverbKernels<T>& Avx2ReverbKernels();

}  // namespace Corvo::DSP
