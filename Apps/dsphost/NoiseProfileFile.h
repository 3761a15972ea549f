#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "DSP/Effects/Denoiser/DenoiserProcessor.h"

namespace dsphost {

// Takes what "dsphost denoise --save-profile" wrote, or any settings chunk of the effect that holds learned
// noise. Throws UserError for bytes or a file that hold none; messages call them `name`.
void TakeNoiseProfile(Corvo::DSP::DenoiserProcessor& denoiser, const std::vector<std::uint8_t>& bytes,
                      const std::string& name);
void LoadNoiseProfile(Corvo::DSP::DenoiserProcessor& denoiser, const std::string& path);

}  // namespace dsphost
