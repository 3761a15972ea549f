#pragma once

#include <array>
#include <cstdint>
#include <memory>

#include "DSP/Effects/Denoiser/Format.h"
#include "DSP/Effects/Framework/CorvoEffect.h"

namespace Corvo::DSP {

namespace DenoiserPrivate {

// The settings; every preset is one of these.
struct Settings {
    using Bands = std::array<std::int32_t, 8>;  // octaves from 63 Hz to 8 kHz
    std::int32_t profile;                       // 0 learned, 1 following, 2 adaptive
    std::int32_t learn;                         // 0 or 1
    std::int32_t clear;                         // always 0: what it asks for is done at once
    std::int32_t reduction;                     // 0..600 tenths of dB
    std::int32_t sensitivity;                   // -60..60 tenths of dB
    std::int32_t detail;                        // 60..180 tenths of dB
    std::int32_t whitening;                     // 0..1000 thousandths
    std::int32_t masked;                        // 0..300 tenths of dB; 300 is off
    std::int32_t fftSize;                       // 0..3: 512 + 2048 + 8192, 512 + 4096, 2048, 1024
    std::int32_t material;                      // 0 speech, 1 music
    std::int32_t listen;                        // 0 output, 1 residue
    std::int32_t mix;                           // 0..1000 thousandths
    Bands gains;                                // -120..120 tenths of dB
    Bands ranges;                               // 0..600 tenths of dB
};

struct State;

}  // namespace DenoiserPrivate

// Takes steady and slowly changing noise out of recordings: hiss, hum, air, fans.
//
// What counts as noise is a profile, its power per frequency. "Learned": from passages without signal, played
// while "Learn" is on; each passage adds to those before, until "Clear profile". "Following": the learned
// profile, whose level follows the noise's. "Adaptive": found while the signal plays. Without anything
// learned all three are adaptive. While "Learn" is on the sound passes as it is, delayed as always.
//
// One or two channels; of two, each has a profile of its own and both get the same gain, so that the image
// stays. Blocks with more channels pass unchanged. Interleaved and planar blocks, 32- and 64-bit; other
// widths pass unchanged. Samples that are not finite count as 0, and those above +120 dB as that much.
//
// The gain of a bin is (s / (1 + s))^p * floor^(1 - p): s is the signal-to-noise ratio, estimated from the
// bin's power over the profile, p the probability that there is signal, and the floor what "Reduction"
// leaves. p is a likelihood ratio at the fixed signal-to-noise ratio "Detail", after T. Gerkmann, C.
// Breithaupt and R. Martin, "Improved A Posteriori Speech Presence Probability Estimation Based on a
// Likelihood Ratio With Fixed Priors", IEEE Trans. Audio, Speech, and Language Processing 16 (2008); the
// weighting after I. Cohen and B. Berdugo, "Speech enhancement for non-stationary noise environments", Signal
// Processing 81 (2001).
//
// Latency: by "FFT size" 9216, 5120, 2048 or 1024 samples at 44.1 and 48 kHz. At other rates it is that times
// a power of two, so that the windows last about as long in seconds. It changes with that parameter; sound
// then passes as it is until the new windows have filled and know the noise, up to 0.4 s. A host that changes
// the rate without InitProcessing keeps the windows' lengths. Until it prepares, nothing is learned and what
// was learned is not used.
//
// Cost: some 200 ns a stereo frame at 48 kHz with three window sizes. Blocks in which a spectrum is due take
// longer than the others. The slowest mono block of 64 frames takes 4 times as long as the median one with
// three window sizes (2 % of the time it lasts) and 25 times with two (6 %); with 2048 alone 65 times and
// with 1024 17 times (below 2 %), as most blocks there only wait.
//
// Memory: preparing sets 4 MB aside at 48 kHz and 16 MB at 192 kHz, and touches hardly any; the first blocks
// do, each page when it is needed. In stereo all sizes and learned noise together need 3.5 and 14 MB.
//
// Threads: as in CorvoEffectBase. Learning is switched like every parameter; a passage ends with the block
// that finds it switched off, and with InitProcessing, InitResetProcessingLight, Cleanup and another format.
// Loading or clearing a profile drops the passage still open. Neither thread ever sees a profile half
// changed. Learned noise survives Cleanup, InitProcessing and presets.
//
// Settings chunk, little-endian, as long as what it holds: tag and version, 4 bytes each; the parameters'
// plain values in their order, as doubles behind a 4-byte count (fewer leave the rest at their defaults); the
// seconds of noise learned (a double), its rate and number of channels, 4 bytes each; then per channel, and
// for windows of 512, 1024, 2048, 4096 and 8192 at 44.1 and 48 kHz, the mean power per bin as doubles behind
// a count (0: not learned; the same for every channel). A profile from another rate is interpolated; in mono
// the mean of two channels is used. A chunk changes nothing if it is cut short, has counts that do not fit or
// holds values that no profile has. Loading leaves "Learn" off.
class DSP_API DenoiserProcessor : public CorvoEffect {
public:
    DenoiserProcessor();
    ~DenoiserProcessor() override;

    bool HasSeparateLeftRightSettings() override;
    int GetLatency() override;
    bool SupportsNoninterleaved() override;
    void CheckCookProperties(const tWAVEFORMATEX* format, bool force) override;
    void GetSettingsChunk(std::vector<std::uint8_t>& chunk) override;
    int GetSettingsChunkSize() override;
    void SetSettingsChunk(const std::vector<std::uint8_t>& chunk) override;
    // Clears the sound and what was adapted to, and frees the memory for them.
    void Cleanup() override;
    void InitResetProcessingLight(bool reset) override;  // clears the sound, whatever `reset`
    bool AllowChangeParamFromInputBox(int index) override;

    // Seconds of noise in the learned profile; 0: there is none. User-interface thread.
    double LearnedSeconds();
    // The learned noise as power density, the mean of the channels: noise that is white and has variance v
    // has v in every bin. Bin k of `bins` stands for k * rate / 2 / (bins - 1) Hz. False, with nothing
    // written, without a profile or for a rate that is not above 0 and at most 1e9. User-interface thread;
    // allocates.
    bool LearnedDensity(double rate, float* density, int bins);

    // What the reducer's frames are at the format of the last block or InitProcessing. Between blocks.
    Format_t Format() const;

    // The parameters' plain values in their order, as a new instance has them.
    static const std::array<double, 28>& ParamsDefault();

protected:
    bool DoSetParam(int index, float normalised, bool fromAutomation) override;
    void ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format,
                         ProcessFlags& flags) override;
    void ProcessInternalNoninterleaved(double* const* channels, int frames, const tWAVEFORMATEX* format,
                                       ProcessFlags& flags) override;

private:
    bool Ready(const tWAVEFORMATEX* format);

    DenoiserPrivate::Settings m_settings{};  // shared between the threads
    std::unique_ptr<DenoiserPrivate::State> m_state;
};

}  // namespace Corvo::DSP
