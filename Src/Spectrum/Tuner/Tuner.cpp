#include "Spectrum/Tuner/Tuner.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdio>

#include "Platform/DenormalGuard.h"
#include "Spectrum/Tuner/PitchDetector.h"
#include "Spectrum/Tuner/TunerNotes.h"
#include "Spectrum/Tuner/TunerSensitivity.h"

using Corvo::kTunedQuanta;
using Corvo::kTunerSensitivities;
using Corvo::TunerNotes;

namespace {

constexpr int kNamings = 3;
constexpr float kDefaultQuantum = 2.0f;
constexpr double kRefreshRate = 30.0;
// Of two analyses, where each refresh brings one: some displays refresh after 30 ms.
constexpr double kShortestPeriod = 0.030;
constexpr double kStableSeconds = 0.5;
constexpr double kStableOctaves = 10.0 / 1200.0;
// The first analysis of an attack often hears its noise, the second one the note.
constexpr int kFirstConfirmations = 2;
// A pitch that moves faster from one analysis to the next, as many a drum's does, is no first note yet; one
// that moves less than the second has not become another by a jump.
constexpr double kSteadyOctaves = 25.0 / 1200.0, kGlideOctaves = 1.0 / 12.0;
// An analysis this much later than its hop says, in refreshes, is taken to be missing: hosts feed in blocks.
constexpr double kLate = 8.0;
constexpr double kLargestCalibration = 50.0;  // cents
constexpr int kPlainLines = 2, kLinesWithTuning = 3;

constexpr const char* kNoteNames[kNamings][12] = {
    {"A", "A#", "B", "C", "C#", "D", "D#", "E", "F", "F#", "G", "G#"},
    {"A", "Bb", "B", "C", "Db", "D", "Eb", "E", "F", "Gb", "G", "Ab"},
    {"La", "La#", "Si", "Do", "Do#", "Re", "Re#", "Mi", "Fa", "Fa#", "Sol", "Sol#"},
};

struct Choices {
    std::atomic<int> method{0};
    std::atomic<float> quantum{kDefaultQuantum};
    std::atomic<int> naming{0};
    std::atomic<bool> showDenoised{false};
};
Choices g_choices;
std::atomic<TuningListener*> g_tuningListener{nullptr};

void TellOfTuning() {
    if (TuningListener* const listener = g_tuningListener) listener->NotesMustBeRecomputed();
}

void Calibrate(double base) {
    TunerNotes::Shared().SetBase(base);
    TellOfTuning();
}

bool AreNear(double hz, double other, double octaves) {
    return hz > 0.0 && other > 0.0 && std::abs(std::log2(hz / other)) < octaves;
}

bool Within(int index, std::size_t count) { return index >= 0 && static_cast<std::size_t>(index) < count; }

}  // namespace

TuningListener::~TuningListener() = default;
TunerDisplayListener::~TunerDisplayListener() = default;

Tuner::Tuner() : m_detector(std::make_unique<Corvo::PitchDetector>()) {}
Tuner::~Tuner() = default;

void Tuner::SetDetectionMethod(int method) { g_choices.method = method; }
int Tuner::GetDetectionMethod() { return g_choices.method; }

void Tuner::SetShowDenoisedSpectrum(bool show) { g_choices.showDenoised = show; }
bool Tuner::GetShowDenoisedSpectrum() { return g_choices.showDenoised; }
const std::vector<float>& Tuner::GetDenoisedSpectrum() const { return m_detector->Denoised(); }

void Tuner::SetTemperament(int temperament) {
    if (TunerNotes::Shared().SetTemperament(temperament)) TellOfTuning();
}
int Tuner::GetTemperament() { return TunerNotes::Shared().Temperament(); }
bool Tuner::IsTemperamentChanged() { return TunerNotes::Shared().IsChanged(); }
const char* Tuner::GetTemperamentName(int temperament) { return Corvo::TemperamentName(temperament); }
const char* Tuner::GetCurrentTemperamentName() { return GetTemperamentName(GetTemperament()); }
void Tuner::SetTuningListener(TuningListener* listener) { g_tuningListener = listener; }
void Tuner::CookNotesFrequencies(bool force) { TunerNotes::Shared().Cook(force); }
double Tuner::GetNoteFrequency(int entry) { return TunerNotes::Shared().Frequency(entry); }
double Tuner::GetCalibrationBase() { return TunerNotes::Shared().Base(); }

void Tuner::SetNoteNaming(int naming) { g_choices.naming = Within(naming, kNamings) ? naming : 0; }
int Tuner::GetNoteNaming() { return g_choices.naming; }
const char* Tuner::GetNoteName(int note) {
    return Within(note, std::size(kNoteNames[0])) ? kNoteNames[g_choices.naming][note] : "";
}

void Tuner::SetTunedQuantum(float cents) { g_choices.quantum = cents; }
float Tuner::GetTunedQuantum() { return g_choices.quantum; }
void Tuner::SetTunedQuantumPreset(int preset) {
    SetTunedQuantum(Within(preset, kTunedQuanta.size()) ? kTunedQuanta[static_cast<std::size_t>(preset)]
                                                        : kDefaultQuantum);
}

void Tuner::SetSensibilityPreset(int preset) {
    if (Within(preset, kTunerSensitivities.size())) {
        m_sensitivity = preset;
        m_presetChosen = true;
    }
    Forget();
}
int Tuner::GetSensibilityPreset() const {
    return kTunerSensitivities[static_cast<std::size_t>(m_sensitivity)].values.reported;
}
const char* Tuner::GetSensibilityPresetName(int preset) {
    return Within(preset, kTunerSensitivities.size())
               ? kTunerSensitivities[static_cast<std::size_t>(preset)].name
               : "";
}

void Tuner::SetDisplayListener(TunerDisplayListener* listener) { m_displayListener = listener; }
void Tuner::SetWindowType(int type) { m_windowType = type; }

void Tuner::Forget() {
    m_forgetAsked = true;
    ClearShown();
}

bool Tuner::IsTuned() const { return GetNote() >= 0; }
bool Tuner::IsTunedCentered() const { return IsTuned() && std::abs(GetErrorCents()) < GetTunedQuantum(); }
bool Tuner::IsTracking() const { return m_tracking; }
TunedNote Tuner::GetTunedNote() const { return m_shown; }
int Tuner::GetNote() const { return GetTunedNote().note; }
int Tuner::GetOctave() const { return GetTunedNote().octave; }
double Tuner::GetFrequency() const { return m_frequency; }
double Tuner::GetHeardFrequency() const { return m_heardFrequency; }
float Tuner::GetErrorCents() const { return m_cents; }
float Tuner::GetProminence() const { return m_prominence; }
double Tuner::GetStableFrequency() const { return m_stableFrequency; }

const char* Tuner::GetTunedNoteName() const { return GetNoteName(GetNote()); }
std::string Tuner::GetTuningErrorStr() const {
    return IsTuned() ? GetTuningErrorStr(GetErrorCents()) : std::string();
}
std::string Tuner::GetTuningErrorStr(float cents) {
    constexpr float kMost = 9999.9f;
    const float shown = std::abs(cents) <= kMost ? cents : std::copysign(kMost, cents);
    const int tenths = static_cast<int>(std::lround(10.0f * std::abs(shown)));
    const char* const sign = tenths == 0 ? "" : cents < 0.0f ? "\u2212" : "+";
    std::array<char, 24> text;
    std::snprintf(text.data(), text.size(), "%s%d.%dc", sign, tenths / 10, tenths % 10);
    return text.data();
}

void Tuner::Tune(const std::vector<float>& power, const std::vector<float>&, int fftLength, int hopLength,
                 int windowLength, int samplingRate, bool halveHarmonics, bool denoise) {
    if (Analyse(power, fftLength, hopLength, windowLength, samplingRate, halveHarmonics, denoise)) Announce();
}

bool Tuner::Analyse(const std::vector<float>& power, int fftLength, int hopLength, int windowLength,
                    int samplingRate, bool halveHarmonics, bool denoise) {
    if (power.empty() || fftLength < 2 || samplingRate < 1) return false;
    const Corvo::DenormalGuard denormals;
    CookNotesFrequencies(false);
    DoAsAsked();
    const int window = windowLength >= 1 ? std::min(windowLength, fftLength) : fftLength;
    const std::size_t bins = std::min(power.size(), static_cast<std::size_t>(fftLength / 2));
    m_detector->Prepare({fftLength, window, m_windowType, samplingRate, bins});
    const std::span<const float> spectrum(power.data(), bins);

    m_detector->MeasureFloor(spectrum, denoise || g_choices.showDenoised);
    m_detector->Expect(GetHeardFrequency() > 0.0 || !IsTracking() ? GetHeardFrequency() : GetFrequency());

    const auto detect = [&]() -> Corvo::Pitch {
        if (denoise) return m_detector->TuneHPSdenoise(spectrum, true);
        switch (g_choices.method) {
            case 0:
                return m_detector->TuneHPSdenoise(spectrum, false);
            case 1:
                return m_detector->TuneHPS(spectrum, halveHarmonics);
            case 2:
                return m_detector->TunePseudoHPS(spectrum);
            case 4:
                return m_detector->TuneTWMorig(spectrum);
            default:
                return m_detector->TuneLegacy(spectrum);
        }
    };
    const Corvo::Pitch& pitch = m_detector->Keep(detect());
    const double seconds = static_cast<double>(hopLength >= 1 ? hopLength : window) / samplingRate;
    m_period = std::max(kRefreshRate * seconds, 1.0);
    Follow(pitch.hz, pitch.prominence, std::max(seconds, kShortestPeriod));
    m_waited = 0.0;
    return GetTunedNote() != m_announced;
}

bool Tuner::Wait() {
    DoAsAsked();
    m_waited += 1.0;
    if (m_waited > m_period + kLate) {
        m_heardFrequency = 0.0;
        m_otherCount = 0;
        Miss(m_missed + m_waited);
    }
    return GetTunedNote() != m_announced;
}

void Tuner::Announce() {
    const TunedNote shown = GetTunedNote();
    if (TunerDisplayListener* const listener = m_displayListener) listener->NoteChanged(shown.note >= 0);
    m_announced = shown;
}

void Tuner::DoAsAsked() {
    if (m_presetChosen.exchange(false))
        m_detector->SetSensitivity(kTunerSensitivities[static_cast<std::size_t>(m_sensitivity)].values);
    if (m_forgetAsked.exchange(false)) ResetPeakMemories(true);
}

// The note shown follows the pitch at once; another replaces it only when it has been heard often enough.
void Tuner::Follow(double hz, float prominence, double seconds) {
    const Corvo::TunerSensitivity& sensitivity = m_detector->Sensitivity();
    const bool heard = hz > 0.0;
    const Corvo::NearestNote nearest = heard ? TunerNotes::Shared().FindNearest(hz) : Corvo::NearestNote{};
    const TunedNote note{nearest.note, nearest.octave}, shown = GetTunedNote();
    const bool same = heard && note == shown;
    const bool other = heard && !same && prominence >= sensitivity.onsetDb;
    const bool again =
        note == m_other && (shown.note >= 0 || AreNear(hz, m_detector->Before(), kSteadyOctaves));
    m_otherCount = !other ? 0 : again ? m_otherCount + 1 : 1;
    m_other = note;
    const int needed = shown.note < 0 ? kFirstConfirmations
                                      : static_cast<int>(std::ceil(sensitivity.confirmCount / m_period));
    const bool shows = same || (other && m_otherCount >= needed);
    const bool glides = other && AreNear(hz, m_heardFrequency, kGlideOctaves);
    m_heardFrequency = shows || glides ? hz : m_detector->Now().expectedHz;
    if (shows) {
        if (!same) ResetPeakMemories(false);
        Hear(hz, prominence, nearest);
        RememberPitch(hz, seconds);
    } else if (other) {
        ForgetPitches();
    } else {
        m_missed += std::max(m_period, m_waited);
        Miss(m_missed);
    }
}

void Tuner::Miss(double refreshes) {
    const Corvo::TunerSensitivity& sensitivity = m_detector->Sensitivity();
    ForgetPitches();
    if (refreshes >= sensitivity.holdCount) m_tracking = false;
    if (refreshes >= sensitivity.releaseCount) ResetPeakMemories(true);
}

void Tuner::Hear(double hz, float prominence, const Corvo::NearestNote& heard) {
    m_shown = TunedNote{heard.note, heard.octave};
    m_frequency = hz;
    m_cents = static_cast<float>(heard.cents);
    m_prominence = prominence;
    m_tracking = true;
    m_missed = 0.0;
}

void Tuner::ResetPeakMemories(bool forgetNote) {
    m_other = {};
    m_otherCount = 0;
    m_missed = 0.0;
    ForgetPitches();
    if (forgetNote) ClearShown();
}

void Tuner::ForgetPitches() {
    m_pitchCount = 0;
    m_stableFrequency = 0.0;
}

void Tuner::ClearShown() {
    m_shown = TunedNote{};
    m_frequency = m_heardFrequency = m_stableFrequency = 0.0;
    m_cents = 0.0f;
    m_prominence = 0.0f;
    m_tracking = false;
}

void Tuner::RememberPitch(double hz, double seconds) {
    const int needed =
        std::clamp(1 + static_cast<int>(std::ceil(kStableSeconds / seconds)), 2, kLongestMemory);
    m_pitches[static_cast<std::size_t>(m_pitchCount % kLongestMemory)] = std::log2(hz);
    ++m_pitchCount;
    if (m_pitchCount < needed) return;
    double lowest = std::log2(hz), highest = lowest, sum = 0.0;
    for (int i = 1; i <= needed; ++i) {
        const double pitch = m_pitches[static_cast<std::size_t>((m_pitchCount - i) % kLongestMemory)];
        lowest = std::min(lowest, pitch);
        highest = std::max(highest, pitch);
        sum += pitch;
    }
    m_stableFrequency = highest - lowest <= kStableOctaves ? std::exp2(sum / needed) : 0.0;
}

bool TunerCalibrateNow(const Tuner& tuner) {
    const double heard = tuner.GetStableFrequency();
    if (heard <= 0.0) return false;
    const double cents = TunerNotes::Shared().FindNearest(heard).cents;
    const double limited = std::clamp(cents, -kLargestCalibration, kLargestCalibration);
    Calibrate(Tuner::GetCalibrationBase() * std::exp2(limited / 1200.0));
    return true;
}
bool TunerCalibrateTo(double concertPitchHz) {
    if (!(concertPitchHz >= 220.0 && concertPitchHz <= 880.0)) return false;
    Calibrate(concertPitchHz / 4.0);
    return true;
}
void TunerCalibrateReset() { Calibrate(TunerNotes::kStandardBase); }
bool TunerIsNonstandardCalibration() { return Tuner::GetCalibrationBase() != TunerNotes::kStandardBase; }
bool TunerCalibrationNotStandardOrNotUseEqualTemperament() {
    return TunerIsNonstandardCalibration() || Tuner::GetTemperament() != 0;
}
int TunerGetNumLines() {
    return TunerCalibrationNotStandardOrNotUseEqualTemperament() ? kLinesWithTuning : kPlainLines;
}
bool TunerIsTracking(const Tuner& tuner) { return tuner.IsTracking(); }
void CookNotesFreqs() { Tuner::CookNotesFrequencies(true); }
