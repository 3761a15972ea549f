#pragma once

#include <array>
#include <cstdint>
#include <memory>

#include "DSP/Effects/Framework/CorvoEffectBase.h"

namespace Corvo::DSP {

struct PhaserImpl;

// The settings, the chunk after its first word, and a row of the preset table.
struct PhaserSettings {
    float rate;           // 0..1; times 6 Hz
    float feedback;       // 0..1, a factor
    float wet;            // 0..1; at 0.5 both gains are 1
    float maximum;        // Hz, 0..10000
    float minimum;        // Hz, 0..10000; above the maximum the sweep just goes the other way
    float width;          // 0..1, how far the right sweep is ahead, in cycles
    std::int32_t stages;  // 0..30
};
static_assert(sizeof(PhaserSettings) == 28);

// Phaser: a chain of equal first-order all-passes per channel, swept by a sine, with feedback around the
// chain and a mix with the dry signal. The all-pass is (z^-1 - a) / (1 - a z^-1) with a = (1 - w) / (1 + w),
// w the frequency as a share of half the rate; cf. P. A. Regalia, S. K. Mitra and P. P. Vaidyanathan, "The
// Digital All-Pass Filter: A Versatile Signal Processing Building Block", Proceedings of the IEEE 76 (1988).
//
// Parameters: 0 "Rate", 1 "Feedback", 2 "Wet", 3 "Minimum frequency", 4 "Maximum frequency", 5 "Stereo
// width", 6 "Stages" (1..30). Presets come without stages: until some are set, only the feedback acts. Values
// of a chunk beyond these ranges are kept and given back, and limited where they are used. The chunk has 32
// bytes: the number 1, then the settings.
//
// Blocks are interleaved or planar, mono or stereo; 64-bit samples are double, every other width is taken for
// float. Channels after the second pass unchanged. No latency. The sweep runs on through edits and
// preparation; Cleanup clears the chains. Feedback of 1 may grow without bound.
class DSP_API Phaser : public CorvoEffectBase {
public:
    Phaser();
    ~Phaser() override;

    bool HasSeparateLeftRightSettings() override;
    bool SupportsNoninterleaved() override;
    void CheckCookProperties(const tWAVEFORMATEX* format, bool force) override;
    void Cleanup() override;
    std::wstring GetParameterFormattedText(int index, double value) override;
    float GetParam(int index) override;
    int GetParamCountReal() override;
    std::string GetName() override;

protected:
    bool DoSetParam(int index, float normalised, bool fromAutomation) override;
    void ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format,
                         ProcessFlags& flags) override;
    void ProcessInternalNoninterleaved(double* const* channels, int frames, const tWAVEFORMATEX* format,
                                       ProcessFlags& flags) override;

private:
    void InitState(const PhaserSettings& settings);

    PhaserSettings m_settings{};  // shared between the threads
    tWAVEFORMATEX m_format{};
    std::array<std::shared_ptr<PhaserImpl>, MaxNumChannels> m_engines;
    float m_cooked_width = 0.0f;
    int m_cooked_channels = 0;
};

}  // namespace Corvo::DSP
