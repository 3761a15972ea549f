#pragma once

#include <array>
#include <cstdint>
#include <span>
#include <vector>

#include "DSP/Effects/Denoiser/SizeSets.h"

namespace Corvo::DSP::Denoising {

// The noise learned from passages that hold nothing else: its mean power per bin, per channel, and for each
// of kLearnedLengths at the rate's scale. Empty spectra stand for lengths that no passage was long enough
// for.
struct NoiseProfile {
    using Spectra = std::array<std::vector<float>, kLearnedLengths.size()>;

    double seconds = 0.0;  // of noise heard; 0: nothing learned
    std::uint32_t rate = 0;
    std::uint32_t channels = 0;
    std::array<Spectra, 2> power;
    // Which loading or clearing this comes after; only the effect's two threads look at it.
    std::uint32_t generation = 0;

    bool Learned() const { return seconds > 0.0 && channels > 0; }
    // Window length and bins of spectrum `which` at a rate.
    static int Length(std::size_t which, std::uint32_t rate) {
        return Scale::Of(rate)(kLearnedLengths[which]);
    }
    static std::size_t Bins(std::size_t which, std::uint32_t rate) {
        return static_cast<std::size_t>(Length(which, rate)) / 2 + 1;
    }
};

// What an engine has learned, on its way out of the audio thread, in memory that is made before: the powers
// of one channel after the other, length by length.
struct LearnedNoise {
    double seconds = 0.0;
    std::uint32_t rate = 0, channels = 0, generation = 0;
    std::span<float> power;

    // Powers of two channels at a rate.
    static std::size_t MostPowers(std::uint32_t rate);
    NoiseProfile Profile() const;
};

// Fills `to` (`bins` bins of windows of `length` at `rate`) from a spectrum of another length or rate:
// linear over frequency, and scaled as the same sound's power would be.
void ConvertSpectrum(std::span<const float> from, int fromLength, double fromRate, float* to,
                     std::size_t bins, int length, double rate);

}  // namespace Corvo::DSP::Denoising
