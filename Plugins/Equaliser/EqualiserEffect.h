#pragma once

#include <array>
#include <atomic>
#include <cstdint>
#include <string>
#include <vector>

#include "DSP/Effects/Framework/CorvoEffectBase.h"
#include "DSP/Equalizer/ParEQ.h"

namespace Corvo::Plugins {

// The equaliser behind the interface of an effect: eight bands, each with a switch, a type, a frequency, a
// gain and a Q. Bands glide to new settings. Blocks of floats or doubles, interleaved, mono or stereo.
//
// Settings chunk: the number 1, then on, type, frequency in Hz, gain in tenths of a decibel and Q of every
// band, 4 bytes each.
class EqualiserEffect : public DSP::CorvoEffectBase {
public:
    static constexpr int kBands = 8;
    enum Kind { kOn, kType, kFrequency, kGain, kQ, kKinds };  // the parameters of a band, in order

    EqualiserEffect();

    bool HasSeparateLeftRightSettings() override { return false; }
    void CheckCookProperties(const tWAVEFORMATEX* format, bool force) override;
    void GetSettingsChunk(std::vector<std::uint8_t>& chunk) override;
    int GetSettingsChunkSize() override;
    void SetSettingsChunk(const std::vector<std::uint8_t>& chunk) override;
    void Cleanup() override;

    std::wstring GetParameterFormattedText(int index, double value) override;
    std::wstring GetParamName(int index) override;
    std::wstring GetParamUnitsText(int index) override;
    float GetParam(int index) override;
    float GetParamPlain(int index) const override;
    int GetParamCountReal() override { return kBands * kKinds; }
    std::string GetName() override { return "Equaliser"; }
    EffectParameterType GetParameterTypeAutomatable(int index) override;
    std::vector<std::string> GetParameterAvailableValues(int index) override;
    float GetParamValueNormalizedFromText(int index, std::string text) override;
    void GetParamSectionInfo(int index, PluginParameterInfo& info) override;
    std::vector<std::string> GetParamUiSections() override;

protected:
    bool DoSetParam(int index, float normalised, bool fromAutomation) override;
    void ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format,
                         DSP::ProcessFlags& flags) override;

private:
    std::array<std::atomic<std::int32_t>, kBands * kKinds> m_words;
    DSP::ParEQ m_equaliser;
    DSP::builtin_effects_data m_record;  // of the audio thread
    tWAVEFORMATEX m_format{};
};

}  // namespace Corvo::Plugins
