#include <DistrhoPlugin.hpp>
#include <extra/Base64.hpp>

#include <algorithm>
#include <cstring>
#include <exception>
#include <string>
#include <vector>

#include "Adapter.h"
#include "Dpf/PluginChoice.h"

namespace Corvo::Plugins {
namespace {

const PluginRow& Chosen() { return *FindPluginRow(kChosenPlugin); }

}  // namespace

const char* ChosenName() {
    static const std::string name = PluginName(Chosen(), DSP_PLUGIN_CHANNELS);
    return name.c_str();
}
const char* ChosenUri() {
    static const std::string uri = PluginUri(Chosen(), DSP_PLUGIN_CHANNELS);
    return uri.c_str();
}
const char* ChosenVst3Category() {
    static const std::string category =
        std::string("Fx|") + Chosen().vst3Category + (DSP_PLUGIN_CHANNELS == 1 ? "|Mono" : "|Stereo");
    return category.c_str();
}

}  // namespace Corvo::Plugins

START_NAMESPACE_DISTRHO

namespace {

using namespace Corvo::Plugins;

constexpr char kStateKey[] = "settings";
constexpr int kChannels = DSP_PLUGIN_CHANNELS;

std::uint32_t PresetCount() { return static_cast<std::uint32_t>(Adapter(Chosen(), kChannels).Presets()); }
std::uint32_t PortCount() { return static_cast<std::uint32_t>(LayoutOf(Chosen(), kChannels).ports.size()); }

// An adapter as DPF wants it. Parameter 0 is the bypass; port i of the adapter is the parameter i + 1.
class DpfPlugin final : public Plugin {
public:
    DpfPlugin() : Plugin(PortCount() + 1, PresetCount(), 1), m_adapter(Chosen(), kChannels) {}

protected:
    const char* getLabel() const override { return Chosen().id; }
    const char* getMaker() const override { return DISTRHO_PLUGIN_BRAND; }
    const char* getDescription() const override { return Chosen().about; }
    const char* getLicense() const override { return ""; }
    std::uint32_t getVersion() const override {
        return d_version(1, static_cast<std::uint8_t>(Chosen().minorVersion), 0);
    }
    std::int64_t getUniqueId() const override {
        const char* const code = Chosen().code;
        const auto letter = [code](int i) { return static_cast<std::uint8_t>(code[i]); };
        // The mono plug-in is another one: its code begins with a small letter.
        return d_cconst(kChannels == 1 ? 'd' : letter(0), letter(1), letter(2), letter(3));
    }

    void initAudioPort(bool input, std::uint32_t index, AudioPort& port) override {
        port.groupId = kChannels == 1 ? kPortGroupMono : kPortGroupStereo;
        Plugin::initAudioPort(input, index, port);
    }

    void initParameter(std::uint32_t index, Parameter& parameter) override {
        if (index == 0) {
            parameter.initDesignation(kParameterDesignationBypass);
            return;
        }
        const Port& port = m_adapter.Ports()[index - 1];
        parameter.hints = kParameterIsAutomatable;
        if (port.whole) parameter.hints |= kParameterIsInteger;
        if (port.type == Corvo::EffectParameterType::Switch) parameter.hints |= kParameterIsBoolean;
        if (port.logarithmic) parameter.hints |= kParameterIsLogarithmic;
        parameter.name = port.name.c_str();
        parameter.shortName = port.name.substr(0, 16).c_str();
        parameter.symbol = port.symbol.c_str();
        parameter.unit = port.unit.c_str();
        parameter.description = port.comment.c_str();
        parameter.ranges = {port.start, port.least, port.most};
        if (port.group >= 0) parameter.groupId = static_cast<std::uint32_t>(port.group);
        if (port.points.empty()) return;
        auto* const values = new ParameterEnumerationValue[port.points.size()];
        for (std::size_t i = 0; i < port.points.size(); ++i) {
            values[i].value = port.points[i].value;
            values[i].label = port.points[i].text.c_str();
        }
        parameter.enumValues.count = static_cast<std::uint8_t>(port.points.size());
        parameter.enumValues.restrictedMode = port.type != Corvo::EffectParameterType::Continuous;
        parameter.enumValues.values = values;
    }
    void initPortGroup(std::uint32_t group, PortGroup& portGroup) override {
        const auto& groups = LayoutOf(Chosen(), kChannels).groups;
        if (group >= groups.size()) return Plugin::initPortGroup(group, portGroup);
        portGroup.name = groups[group].c_str();
        portGroup.symbol = SymbolOf(groups[group]).c_str();
    }
    void initProgramName(std::uint32_t index, String& name) override {
        name = m_adapter.PresetName(static_cast<int>(index)).c_str();
    }
    void initState(std::uint32_t, State& state) override {
        state.hints = kStateIsBase64Blob | kStateIsOnlyForDSP;
        state.key = kStateKey;
        state.defaultValue = getState(kStateKey);
    }

    float getParameterValue(std::uint32_t index) const override {
        if (index == 0) return m_adapter.Bypassed() ? 1.0f : 0.0f;
        return m_adapter.Value(static_cast<int>(index) - 1);
    }
    void setParameterValue(std::uint32_t index, float value) override {
        if (index == 0)
            m_adapter.Bypass(value > 0.5f);
        else
            m_adapter.Set(static_cast<int>(index) - 1, value);
    }
    void loadProgram(std::uint32_t index) override { m_adapter.TakePreset(static_cast<int>(index)); }
    String getState(const char*) const override {
        const auto bytes = m_adapter.State();
        return String::asBase64(bytes.data(), bytes.size());
    }
    void setState(const char* key, const char* value) override {
        if (std::strcmp(key, kStateKey) == 0) m_adapter.TakeState(d_getChunkFromBase64String(value));
    }

    void activate() override {
        m_adapter.Prepare(getSampleRate(), static_cast<int>(getBufferSize()));
        TellLatency();
    }
    void run(const float** inputs, float** outputs, std::uint32_t frames) override {
        const auto& time = getTimePosition().bbt;
        if (time.valid)
            m_adapter.Tempo(time.beatsPerMinute, static_cast<int>(time.beatsPerBar),
                            static_cast<int>(time.beatType));
        m_adapter.Run(inputs, outputs, nullptr, static_cast<int>(frames));
        TellLatency();
    }

private:
    void TellLatency() { setLatency(static_cast<std::uint32_t>(m_adapter.Latency())); }

    // Asking for the state is no change of it.
    mutable Adapter m_adapter;
};

}  // namespace

Plugin* createPlugin() { return new DpfPlugin; }

END_NAMESPACE_DISTRHO
