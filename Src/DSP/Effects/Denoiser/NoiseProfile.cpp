#include "DSP/Effects/Denoiser/NoiseProfile.h"

#include <algorithm>

#include "DSP/Effects/Denoiser/SpectrumConversion.h"

namespace Corvo::DSP::Denoising {

std::size_t LearnedNoise::MostPowers(std::uint32_t rate) {
    std::size_t powers = 0;
    for (std::size_t which = 0; which < kLearnedLengths.size(); ++which)
        powers += 2 * NoiseProfile::Bins(which, rate);
    return powers;
}

NoiseProfile LearnedNoise::Profile() const {
    NoiseProfile profile;
    profile.seconds = seconds;
    profile.rate = rate;
    profile.channels = channels;
    profile.generation = generation;
    const float* from = power.data();
    for (std::size_t c = 0; c < channels; ++c)
        for (std::size_t which = 0; which < kLearnedLengths.size(); ++which) {
            const std::size_t bins = NoiseProfile::Bins(which, rate);
            profile.power[c][which].assign(from, from + bins);
            from += bins;
        }
    return profile;
}

void ConvertSpectrum(std::span<const float> from, int fromLength, double fromRate, float* to,
                     std::size_t bins, int length, double rate) {
    const double step = (rate / length) / (fromRate / fromLength);
    // A window twice as long gathers twice the noise; a rate twice as high has it in half the band.
    const auto scale = static_cast<float>(length * rate / (fromLength * fromRate));
    if (step == 1.0 && scale == 1.0f && bins <= from.size()) {
        std::copy_n(from.begin(), bins, to);
        return;
    }
    Resample(from.data(), from.size(), step, to, bins);
    for (std::size_t i = 0; i < bins; ++i) to[i] *= scale;
}

}  // namespace Corvo::DSP::Denoising
