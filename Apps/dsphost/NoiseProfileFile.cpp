#include "NoiseProfileFile.h"

#include <cstdint>
#include <vector>

#include "Errors.h"
#include "File.h"

namespace dsphost {

void LoadNoiseProfile(Corvo::DSP::DenoiserProcessor& denoiser, const std::string& path) {
    constexpr std::size_t kLargest = 1 << 24;
    File file(path, File::Mode::Read, path);
    std::vector<std::uint8_t> bytes(kLargest);
    bytes.resize(file.Read(bytes.data(), bytes.size()));
    file.ThrowIfFailed();
    denoiser.SetSettingsChunk(bytes);
    if (!(denoiser.LearnedSeconds() > 0.0))
        throw UserError(path +
                        ": holds no noise profile; \"dsphost denoise --learn FROM:TO --save-profile FILE\" "
                        "writes one");
}

}  // namespace dsphost
