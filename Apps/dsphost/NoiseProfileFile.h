#pragma once

#include <string>

#include "DSP/Effects/Denoiser/DenoiserProcessor.h"

namespace dsphost {

// Loads what "dsphost denoise --save-profile" wrote, or any settings chunk of the effect that holds learned
// noise. Throws UserError for a file that holds none.
void LoadNoiseProfile(Corvo::DSP::DenoiserProcessor& denoiser, const std::string& path);

}  // namespace dsphost
