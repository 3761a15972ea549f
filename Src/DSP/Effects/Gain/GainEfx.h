#pragma once

#include <array>

#include "DSP/Effects/Framework/CorvoEffect.h"

namespace Corvo::DSP::GainEfx {

// Gain with stereo width, constant-power pan and a polarity switch per channel.
//
// Blocks are interleaved or planar, 32- or 64-bit float; any other width passes unchanged. Stereo uses
// all parameters; with any other channel count only the first channel is scaled, by the left gain, the
// pan's share included. No latency, no state between blocks, no presets, no automation of its own.
//
// Left becomes ((L + R) * mid + (L - R) * side) / 2 * gain * sqrt 2 * cos((pan + 1) * pi / 4), right the same
// with -side and the sine; mid and side are 2 - width and width up to a width of 1, then 1 and 2 * width.
// Derived here.
//
// Parameters (plain range): 0 "Gain" 0.0001..10, unity at the middle of the knob; 1 "Stereo width" 0..2;
// 2 "Pan" -1..1; 3 and 4 "Flip phase" left and right.
//
// Settings chunk: 20 bytes, the five plain values as floats.
class DSP_API GainEfx : public CorvoEffect {
public:
    GainEfx();
    ~GainEfx() override;

    bool HasSeparateLeftRightSettings() override;
    bool SupportsNoninterleaved() override;
    void CheckCookProperties(const tWAVEFORMATEX* format, bool force) override;
    void SetSettingsChunk(const std::vector<std::uint8_t>& chunk) override;
    std::wstring GetParameterFormattedText(int index, double value) override;
    void GetParamSectionInfo(int index, PluginParameterInfo& info) override;

    // Default values and layout; the constructor calls it.
    void InitializeParamsFromDefault();
    // Labels and groups of the controls for a mono or a stereo stream.
    static void SetKnobsLayout(bool mono, std::array<PluginParameterInfo, 5>& knobs);

protected:
    bool DoSetParam(int index, float normalised, bool fromAutomation) override;
    void ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format,
                         ProcessFlags& flags) override;
    void ProcessInternalNoninterleaved(double* const* channels, int frames, const tWAVEFORMATEX* format,
                                       ProcessFlags& flags) override;

private:
    void UpdateCoefficients();

    tWAVEFORMATEX m_format{};
    std::array<float, 5> m_params{};             // plain values, shared between the threads
    std::array<PluginParameterInfo, 5> m_knobs;  // never changes: the layout is applied where it is read
    float m_coef_side = 0.0f, m_coef_mid = 0.0f, m_gain_left = 0.0f, m_gain_right = 0.0f;
    std::atomic<bool> m_coef_dirty{true};
    bool m_separate_settings = false;
    std::atomic<bool> m_layout_dirty{false};
    std::atomic<bool> m_mono_layout{true};
    std::atomic<bool> m_had_stereo{false};
    std::atomic<bool> m_stereo_hidden{false};  // the controls that only a stereo stream has
};

}  // namespace Corvo::DSP::GainEfx
