#include <DistrhoPlugin.hpp>
#include <string>

#include "AnalyserPlugin.h"
#include "Spectrum/Tuner/Tuner.h"

START_NAMESPACE_DISTRHO

namespace {

constexpr const char* kState = "settings";

// What is published, in the order of the ports.
struct Output {
    const char *name, *symbol, *unit;
    float silent, lowest, highest;
    bool whole;
    float (*read)(const analyser::Processor&);
};
// clang-format off
constexpr Output kOutputs[] = {
    {"Note",      "note",      "",    -1.0f,   -1.0f,    11.0f, true,  [](const analyser::Processor& p) { return static_cast<float>(p.GetTuner().GetTunedNote().note); }},
    {"Octave",    "octave",    "",     0.0f,   -2.0f,    12.0f, true,  [](const analyser::Processor& p) { return static_cast<float>(p.GetTuner().GetTunedNote().octave); }},
    {"Cents",     "cents",     "ct",   0.0f, -100.0f,   100.0f, false, [](const analyser::Processor& p) { return p.GetTuner().GetErrorCents(); }},
    {"Frequency", "frequency", "Hz",   0.0f,    0.0f, 24000.0f, false, [](const analyser::Processor& p) { return static_cast<float>(p.GetTuner().GetFrequency()); }},
    {"Level",     "level",     "dB", -120.0f, -120.0f,   24.0f, false, [](const analyser::Processor& p) { return p.GetLevel(); }},
};
// clang-format on
constexpr const char* kNotes[] = {"None", "A", "A#", "B", "C", "C#", "D", "D#", "E", "F", "F#", "G", "G#"};

}  // namespace

AnalyserPlugin::AnalyserPlugin() : Plugin(std::size(kOutputs), 0, 1) { m_processor.SetRate(getSampleRate()); }

const char* AnalyserPlugin::getDescription() const {
    return "Spectrum, sonogram and tuner. The sound passes through untouched.";
}
const char* AnalyserPlugin::getLabel() const { return "analyser"; }
const char* AnalyserPlugin::getMaker() const { return DISTRHO_PLUGIN_BRAND; }
const char* AnalyserPlugin::getLicense() const { return "LicenseRef-None"; }
std::uint32_t AnalyserPlugin::getVersion() const { return d_version(1, 0, 0); }
std::int64_t AnalyserPlugin::getUniqueId() const { return d_cconst('D', 'A', 'n', 'a'); }

void AnalyserPlugin::initParameter(std::uint32_t index, Parameter& parameter) {
    const Output& output = kOutputs[index];
    parameter.hints = kParameterIsOutput | (output.whole ? kParameterIsInteger : 0u);
    parameter.name = output.name;
    parameter.symbol = output.symbol;
    parameter.unit = output.unit;
    parameter.ranges = {output.silent, output.lowest, output.highest};
    if (index != 0) return;
    constexpr auto kCount = static_cast<std::uint8_t>(std::size(kNotes));
    parameter.enumValues.count = kCount;
    parameter.enumValues.restrictedMode = true;
    parameter.enumValues.values = new ParameterEnumerationValue[kCount];  // the parameter deletes them
    for (std::uint8_t i = 0; i < kCount; ++i) {
        parameter.enumValues.values[i].value = static_cast<float>(i) - 1.0f;
        parameter.enumValues.values[i].label = kNotes[i];
    }
}

float AnalyserPlugin::getParameterValue(std::uint32_t index) const {
    const Output& output = kOutputs[index];
    constexpr std::uint32_t kLevel = 4;
    if (index != kLevel && !m_processor.IsTunerOn()) return output.silent;
    const float value = output.read(m_processor);
    return value < output.lowest ? output.lowest : value > output.highest ? output.highest : value;
}

void AnalyserPlugin::initState(std::uint32_t, State& state) {
    state.key = kState;
    state.label = "What is chosen";
}
String AnalyserPlugin::getState(const char*) const {
    return String(analyser::Processor::Hold(m_processor)->GetSettings().c_str());
}
void AnalyserPlugin::setState(const char* key, const char* value) {
    if (std::string(kState) == key && value[0] != '\0')
        analyser::Processor::Hold(m_processor)->SetSettings(value);
}

void AnalyserPlugin::sampleRateChanged(double rate) { m_processor.SetRate(rate); }

void AnalyserPlugin::run(const float** inputs, float** outputs, std::uint32_t frames) {
    m_processor.Process(inputs, outputs, frames, getSampleRate());
}

Plugin* createPlugin() { return new AnalyserPlugin; }

END_NAMESPACE_DISTRHO
