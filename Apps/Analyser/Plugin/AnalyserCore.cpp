#include "AnalyserCore.h"

#include <algorithm>
#include <iterator>
#include <string>

#include "AnalyserWindow.h"
#include "Spectrum/Tuner/Tuner.h"

namespace analyser {
namespace {

using namespace Corvo::Plugins;

constexpr const char* kNotes[] = {"None", "A", "A#", "B", "C", "C#", "D", "D#", "E", "F", "F#", "G", "G#"};

// What is published, in the order of the ports.
struct Output {
    ResultPort port;
    float (*read)(const Processor&);
};
// clang-format off
constexpr Output kOutputs[] = {
    {{"Note",      "",      "What the tuner hears, without its octave", -1.0f,   -1.0f,    11.0f, true, kNotes}, [](const Processor& p) { return static_cast<float>(p.GetTuner().GetTunedNote().note); }},
    {{"Octave",    "",      "Of the note",                               0.0f,   -2.0f,    12.0f, true},         [](const Processor& p) { return static_cast<float>(p.GetTuner().GetTunedNote().octave); }},
    {{"Cents",     "cents", "How far the note is out of tune",           0.0f, -100.0f,   100.0f, false},        [](const Processor& p) { return p.GetTuner().GetErrorCents(); }},
    {{"Frequency", "Hz",    "Of the note; 0 without one",                0.0f,    0.0f, 24000.0f, false},        [](const Processor& p) { return static_cast<float>(p.GetTuner().GetFrequency()); }},
    {{"Level",     "dB",    "The highest sample; falls by 20 dB/s",   -120.0f, -120.0f,    24.0f, false},        [](const Processor& p) { return p.GetLevel(); }},
};
// clang-format on
constexpr std::size_t kLevel = 4;

const Layout& PortsOf() {
    static const Layout layout = [] {
        Layout made;
        for (const Output& output : kOutputs) made.ports.push_back(OutputPort(output.port));
        return made;
    }();
    return layout;
}

constexpr PluginRow kRow{
    "Analyser", "analyser",       "DAna",
    2,          "AnalyserPlugin", "analyzer",
    "Analyzer", kSmooth,          "Spectrum, sonogram and tuner. The sound passes through untouched."};

}  // namespace

AnalyserCore::AnalyserCore(const PluginRow& row, int channels) : Core(row, channels, PortsOf()) {}

void AnalyserCore::Prepare(double rate, int) { m_processor.SetRate(rate); }

float AnalyserCore::Value(int port) const {
    const auto index = static_cast<std::size_t>(port);
    const Output& output = kOutputs[index];
    if (index != kLevel && !m_processor.IsTunerOn()) return output.port.silent;
    return std::clamp(output.read(m_processor), output.port.least, output.port.most);
}

void AnalyserCore::Run(const float* const* in, float* const* out, const float* const*, int frames) {
    m_processor.Process(in, out, Channels(), frames, Bypassed());
}

std::vector<std::uint8_t> AnalyserCore::State() {
    const std::string settings = Processor::Hold(m_processor)->GetSettings();
    return {settings.begin(), settings.end()};
}

bool AnalyserCore::TakeState(const std::vector<std::uint8_t>& bytes) {
    return Processor::Hold(m_processor)->SetSettings({bytes.begin(), bytes.end()});
}

std::unique_ptr<Window> AnalyserCore::MakeWindow() { return MakeAnalyserWindow(m_processor); }

}  // namespace analyser

namespace Corvo::Plugins {

std::span<const PluginRow> PluginRows() { return {&analyser::kRow, 1}; }

std::vector<std::string> PresetNamesOf(const PluginRow&) { return {}; }

std::unique_ptr<Core> MakeCore(const PluginRow& row, int channels, Values) {
    return std::make_unique<analyser::AnalyserCore>(row, channels);
}

}  // namespace Corvo::Plugins
