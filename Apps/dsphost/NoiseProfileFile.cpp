#include "NoiseProfileFile.h"

#include "Errors.h"
#include "File.h"

namespace dsphost {

void TakeNoiseProfile(Corvo::DSP::DenoiserProcessor& denoiser, const std::vector<std::uint8_t>& bytes,
                      const std::string& name) {
    denoiser.SetSettingsChunk(bytes);
    if (!(denoiser.LearnedSeconds() > 0.0))
        throw UserError(name +
                        ": holds no noise profile; \"dsphost denoise --learn FROM:TO --save-profile FILE\" "
                        "writes one");
}

void LoadNoiseProfile(Corvo::DSP::DenoiserProcessor& denoiser, const std::string& path) {
    constexpr std::size_t kLargest = 1 << 20;
    const std::string bytes = ReadWhole(path, kLargest);
    TakeNoiseProfile(denoiser, {bytes.begin(), bytes.end()}, path);
}

}  // namespace dsphost
