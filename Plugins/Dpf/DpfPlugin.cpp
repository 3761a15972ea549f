#include <DistrhoPlugin.hpp>
#include <algorithm>
#include <memory>
#include <string>
#include <vector>

#include "DSP/Effects/EffectKinds.h"

START_NAMESPACE_DISTRHO

namespace {

using namespace Corvo::DSP;

const EffectKind& TheKind() { return *FindEffectKind(DISTRHO_PLUGIN_NAME); }

int ParameterCount() { return TheKind().make()->GetParamCount(); }

class EffectPlugin final : public Plugin {
public:
    EffectPlugin()
        : Plugin(static_cast<std::uint32_t>(ParameterCount()), 0, 0), m_effect(TheKind().MakeReady()) {}

protected:
    const char* getLabel() const override { return DISTRHO_PLUGIN_NAME; }
    const char* getMaker() const override { return DISTRHO_PLUGIN_BRAND; }
    const char* getLicense() const override { return "LicenseRef-None"; }
    std::uint32_t getVersion() const override { return d_version(1, 0, 0); }
    std::int64_t getUniqueId() const override { return d_cconst('D', 'G', 'a', 'i'); }

    void initParameter(std::uint32_t index, Parameter& parameter) override {
        const auto description = m_effect->Describe(static_cast<int>(index));
        parameter.hints = kParameterIsAutomatable;
        parameter.name = description.label.c_str();
        parameter.symbol = std::string("p").append(std::to_string(index)).c_str();
        parameter.ranges = {m_effect->GetParam(static_cast<int>(index)), 0.0f, 1.0f};
    }
    float getParameterValue(std::uint32_t index) const override {
        return m_effect->GetParam(static_cast<int>(index));
    }
    void setParameterValue(std::uint32_t index, float value) override {
        m_effect->SetParam(static_cast<int>(index), value, false);
    }
    void activate() override {
        m_format.nChannels = 2;
        m_format.nSamplesPerSec = static_cast<std::uint32_t>(getSampleRate());
        m_format.wBitsPerSample = 32;
        m_block.resize(std::size_t{2} * getBufferSize());
        m_effect->InitProcessing(static_cast<int>(getBufferSize()), &m_format);
        setLatency(static_cast<std::uint32_t>(std::max(m_effect->GetLatency(), 0)));
    }
    void run(const float** inputs, float** outputs, std::uint32_t frames) override {
        const auto longest = static_cast<std::uint32_t>(m_block.size() / 2);
        for (std::uint32_t from = 0; from < frames; from += longest) {
            const std::uint32_t count = std::min(longest, frames - from);
            for (std::uint32_t i = 0; i < count; ++i)
                for (std::size_t c = 0; c < 2; ++c) m_block[2 * i + c] = inputs[c][from + i];
            ProcessFlags flags;
            m_effect->Process(m_block.data(), static_cast<int>(count), &m_format, flags);
            for (std::uint32_t i = 0; i < count; ++i)
                for (std::size_t c = 0; c < 2; ++c) outputs[c][from + i] = m_block[2 * i + c];
        }
    }

private:
    std::unique_ptr<CorvoEffectBase> m_effect;
    tWAVEFORMATEX m_format{};
    std::vector<float> m_block;
};

}  // namespace

Plugin* createPlugin() { return new EffectPlugin; }

END_NAMESPACE_DISTRHO
