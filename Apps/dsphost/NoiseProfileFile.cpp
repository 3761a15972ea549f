#include "NoiseProfileFile.h"

#include "Errors.h"
#include "File.h"

namespace dsphost {

void LoadNoiseProfile(Corvo::DSP::DenoiserProcessor& denoiser, const std::string& path) {
    constexpr std::size_t kLargest = 1 << 20;
    const std::string bytes = ReadWhole(path, kLargest);
    denoiser.SetSettingsChunk({bytes.begin(), bytes.end()});
    if (!(denoiser.LearnedSeconds() > 0.0))
        throw UserError(path +
                        ": holds no noise profile; \"dsphost denoise --learn FROM:TO --save-profile FILE\" "
                        "writes one");
}

}  // namespace dsphost
