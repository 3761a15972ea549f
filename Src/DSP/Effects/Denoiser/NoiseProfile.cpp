#include "DSP/Effects/Denoiser/NoiseProfile.h"

#include "DSP/Effects/Denoiser/SpectrumConversion.h"

namespace Corvo::DSP::Denoising {

void ConvertSpectrum(std::span<const float> from, int fromLength, double fromRate, float* to,
                     std::size_t bins, int length, double rate) {
    const double step = (rate / length) / (fromRate / fromLength);
    // A window twice as long gathers twice the noise; a rate twice as high has it in half the band.
    const auto scale = static_cast<float>(length * rate / (fromLength * fromRate));
    Resample(from.data(), from.size(), step, to, bins);
    for (std::size_t i = 0; i < bins; ++i) to[i] *= scale;
}

}  // namespace Corvo::DSP::Denoising
