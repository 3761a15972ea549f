#include "PitchResults.h"

#include <cmath>
#include <vector>

#include "DSP/Effects/PitchDoctor/PitchDoctor.h"

class BuiltinEditor {};

namespace Corvo::Plugins {
namespace {

constexpr const char* kNotes[]{"None", "C", "C#", "D", "D#", "E", "F", "F#", "G", "G#", "A", "A#", "B"};
// clang-format off
constexpr ResultPort kPorts[]{
    {"Note",       "",      "That is meant, without its octave",                -1.0f,    -1.0f,   11.0f, true,  kNotes},
    {"Octave",     "",      "Of the note",                                       0.0f,    -1.0f,    9.0f, true},
    {"Pitch",      "Hz",    "Of the voice; 0 without one",                       0.0f,     0.0f, 4000.0f, false},
    {"Cents",      "cents", "How far the voice is above the note",               0.0f, -1200.0f, 1200.0f, false},
    {"Correction", "cents", "How far the output is above the voice",             0.0f, -3600.0f, 3600.0f, false},
};
// clang-format on
constexpr std::size_t kMostReadings = 512;  // that the effect keeps

class PitchResults final : public Results {
public:
    explicit PitchResults(DSP::PitchDoctor& effect) : m_effect(effect) {
        m_readings.reserve(kMostReadings);
        effect.SetEditor(&m_editor);
    }
    ~PitchResults() override { m_effect.SetEditor(nullptr); }

    void Read(std::span<float> values) override {
        m_readings.clear();
        m_effect.TakeReadings(m_readings);
        if (m_readings.empty()) return;
        const auto& now = m_readings.back();
        const bool hasNote = now.note >= 0;
        const float cents = hasNote && now.IsVoiced() ? 1200.0f * std::log2(now.heardHz / now.noteHz) : 0.0f;
        const float all[]{static_cast<float>(hasNote ? now.note % 12 : -1),
                          static_cast<float>(hasNote ? now.note / 12 - 1 : 0), now.heardHz, cents,
                          now.correctionCents};
        for (std::size_t i = 0; i < values.size(); ++i) values[i] = all[i];
    }

private:
    DSP::PitchDoctor& m_effect;
    BuiltinEditor m_editor;
    std::vector<DSP::PitchReading> m_readings;
};

}  // namespace

const ResultKind kPitchResults{
    kPorts, [](DSP::CorvoEffectBase& effect) -> std::unique_ptr<Results> {
        return std::make_unique<PitchResults>(dynamic_cast<DSP::PitchDoctor&>(effect));
    }};

}  // namespace Corvo::Plugins
