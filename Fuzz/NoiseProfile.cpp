// Any bytes, or a learned profile with some of them changed, as the file that --profile of the command-line
// host names; what it holds is asked for and played with.
#include <cmath>
#include <memory>

#include "Errors.h"
#include "NoiseProfileFile.h"
#include "Target.h"

namespace {

using Corvo::DSP::DenoiserProcessor;
using Fuzz::Input;
using Fuzz::Require;

constexpr int kProfile = 0, kLearn = 1;  // parameters
constexpr int kBlock = 512;

tWAVEFORMATEX Format(int rate, int channels) {
    tWAVEFORMATEX format{};
    format.nChannels = static_cast<std::uint16_t>(channels);
    format.nSamplesPerSec = static_cast<std::uint32_t>(rate);
    format.wBitsPerSample = 64;
    return format;
}

void Play(DenoiserProcessor& denoiser, const tWAVEFORMATEX& format, int blocks) {
    for (std::uint32_t state = 1; blocks > 0; --blocks) {
        std::vector<double> block(static_cast<std::size_t>(kBlock * format.nChannels));
        for (auto& sample : block) sample = (state = state * 1664525u + 1013904223u) / 8589934592.0 - 0.25;
        Corvo::DSP::ProcessFlags flags;
        denoiser.Process(block.data(), kBlock, &format, flags);
        for (const double sample : block) Require(std::isfinite(sample), "finite sound stays finite");
    }
}

std::vector<std::uint8_t> Learned() {
    DenoiserProcessor denoiser;
    const auto format = Format(8000, 2);
    denoiser.InitProcessing(kBlock, &format);
    denoiser.SetParam(kLearn, 1.0f, false);
    Play(denoiser, format, 20);
    denoiser.SetParam(kLearn, 0.0f, false);
    Play(denoiser, format, 1);
    std::vector<std::uint8_t> chunk;
    denoiser.GetSettingsChunk(chunk);
    return chunk;
}

const Fuzz::Target target("NoiseProfile", [](Input& input) {
    static const auto learned = Learned();
    const int bins = input.Between(0, 5000);
    const double rate = input.Flag() ? 48000.0 : input.Raw<double>();
    const int formatRate = input.Flag() ? 48000 : input.Between(1, 50000);
    const auto format = Format(formatRate, input.Between(1, 2));
    auto bytes = learned;
    if (input.Flag()) {
        for (int i = input.Between(0, 8); i > 0; --i) {
            // Most of it is the profile's values; what rules them stands at the front.
            const auto at = input.Flag() ? input.Between(0, 300) : input.Between(0, 60000);
            bytes[static_cast<std::size_t>(at) % bytes.size()] = input.Raw<std::uint8_t>();
        }
        if (input.Between(0, 7) == 0)
            bytes.resize(static_cast<std::size_t>(input.Between(0, 60000)) % bytes.size());
    } else {
        const auto rest = input.Rest();
        bytes.assign(rest.begin(), rest.end());
    }
    const auto denoiser = std::make_unique<DenoiserProcessor>();
    try {
        dsphost::TakeNoiseProfile(*denoiser, bytes, "a file");
    } catch (const dsphost::UserError&) {
        return;
    }
    std::vector<float> density(static_cast<std::size_t>(bins));
    denoiser->LearnedDensity(rate, density.data(), bins);
    for (const float bin : density)
        Require(bin >= 0.0f && std::isfinite(bin), "a density is a number from 0 on");
    denoiser->SetParam(kLearn, 0.0f, false);
    denoiser->SetParam(kProfile, 0.0f, false);  // as learned
    denoiser->InitProcessing(kBlock, &format);
    Play(*denoiser, format, 20);
});

}  // namespace
