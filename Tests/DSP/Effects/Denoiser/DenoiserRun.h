#pragma once

#include <string>

#include "DSP/Effects/Denoiser/DenoiserProcessor.h"
#include "Support/EffectRun.h"

namespace TestSupport {

using Corvo::DSP::DenoiserProcessor;

enum DenoiserParameter { kProfile, kLearn, kClear, kReduction, kSensitivity, kSize = 8, kListen = 10, kMix };
constexpr float kLearned = 0.0f, kFollowing = 0.5f, kAdaptive = 1.0f;

inline void SetText(DenoiserProcessor& denoiser, int index, const std::string& text) {
    denoiser.SetParam(index, denoiser.GetParamValueNormalizedFromText(index, text), false);
}

// Begins to learn, from `noise`, interleaved, and does not end.
template <typename Sample>
void Open(DenoiserProcessor& denoiser, std::vector<Sample> noise, const tWAVEFORMATEX& format) {
    denoiser.SetParam(kLearn, 1.0f, false);
    ProcessBlock(denoiser, noise.data(), static_cast<int>(noise.size() / format.nChannels), format);
}
template <typename Sample = float>
void Close(DenoiserProcessor& denoiser, const tWAVEFORMATEX& format) {
    denoiser.SetParam(kLearn, 0.0f, false);
    ProcessBlock(denoiser, std::vector<Sample>(format.nChannels).data(), 1, format);
}
// Further passages add up.
template <typename Sample>
void Learn(DenoiserProcessor& denoiser, const std::vector<Sample>& noise, const tWAVEFORMATEX& format) {
    denoiser.InitProcessing(static_cast<int>(noise.size() / format.nChannels), &format);
    Open(denoiser, noise, format);
    Close<Sample>(denoiser, format);
}

// What becomes of the samples, the latency taken out.
template <typename Sample>
std::vector<Sample> Clean(DenoiserProcessor& denoiser, const std::vector<Sample>& samples,
                          const tWAVEFORMATEX& format) {
    denoiser.InitProcessing(512, &format);
    const auto late = static_cast<std::ptrdiff_t>(denoiser.GetLatency() * format.nChannels);
    std::vector<Sample> padded = samples;
    for (std::ptrdiff_t i = 0; i < late; ++i) padded.push_back(0);
    padded = Render(denoiser, padded, format, {512});
    return {padded.begin() + late, padded.end()};
}

}  // namespace TestSupport
