#include "Spectrum/Tuner.h"

#include <array>
#include <atomic>
#include <cstddef>

namespace {

constexpr int kTemperaments = 11;
constexpr int kNamings = 3;
constexpr float kDefaultQuantum = 2.0f;
constexpr std::array kQuantumPresets{0.1f, 0.5f, 1.0f, 2.0f, 5.0f, 10.0f};
constexpr std::array kReportedSensitivity{2, 1, 2, 3, 4, 5};

struct Choices {
    std::atomic<int> method{0};
    std::atomic<int> temperament{0};
    std::atomic<bool> temperamentChanged{false};
    std::atomic<TuningListener*> listener{nullptr};
    std::atomic<float> quantum{kDefaultQuantum};
    std::atomic<int> naming{0};
    std::atomic<bool> showDenoised{false};
};
Choices g_choices;

bool Within(int index, std::size_t count) { return index >= 0 && static_cast<std::size_t>(index) < count; }

}  // namespace

TuningListener::~TuningListener() = default;

Tuner::Tuner() = default;

void Tuner::SetDetectionMethod(int method) { g_choices.method = method; }
int Tuner::GetDetectionMethod() { return g_choices.method; }

void Tuner::SetShowDenoisedSpectrum(bool show) { g_choices.showDenoised = show; }
bool Tuner::GetShowDenoisedSpectrum() { return g_choices.showDenoised; }

void Tuner::SetTemperament(int temperament) {
    if (temperament == g_choices.temperament) return;
    // Stored before it is announced, or a display thread could cook the old one.
    g_choices.temperament = Within(temperament, kTemperaments) ? temperament : 0;
    g_choices.temperamentChanged = true;
    if (TuningListener* const listener = g_choices.listener) listener->NotesMustBeRecomputed();
}
int Tuner::GetTemperament() { return g_choices.temperament; }
bool Tuner::IsTemperamentChanged() { return g_choices.temperamentChanged; }
void Tuner::SetTuningListener(TuningListener* listener) { g_choices.listener = listener; }

void Tuner::SetNoteNaming(int naming) { g_choices.naming = Within(naming, kNamings) ? naming : 0; }
int Tuner::GetNoteNaming() { return g_choices.naming; }

void Tuner::SetTunedQuantum(float cents) { g_choices.quantum = cents; }
float Tuner::GetTunedQuantum() { return g_choices.quantum; }
void Tuner::SetTunedQuantumPreset(int preset) {
    SetTunedQuantum(Within(preset, kQuantumPresets.size()) ? kQuantumPresets[static_cast<std::size_t>(preset)]
                                                           : kDefaultQuantum);
}

void Tuner::SetSensibilityPreset(int preset) {
    if (Within(preset, kReportedSensitivity.size())) m_sensitivity = preset;
}
int Tuner::GetSensibilityPreset() const {
    return kReportedSensitivity[static_cast<std::size_t>(m_sensitivity)];
}
