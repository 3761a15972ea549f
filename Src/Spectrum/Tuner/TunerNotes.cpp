#include "Spectrum/Tuner/TunerNotes.h"

#include <algorithm>
#include <atomic>
#include <cmath>
#include <cstddef>
#include <mutex>

#include "Platform/CriticalSection.h"
#include "Spectrum/Tuner/Tuner.h"

// The class-wide notes: temperament, calibration and the table that follows from them.
namespace {

constexpr double kStandardBase = 110.0;
constexpr double kLargestCalibration = 50.0;  // cents
constexpr int kBaseOctave = 2;
constexpr int kFirstOfOctave = 3;  // C
constexpr int kPlainLines = 2, kLinesWithTuning = 3;

struct Notes {
    std::atomic<int> temperament{0};
    std::atomic<bool> changed{false};
    std::atomic<double> base{kStandardBase};
    std::atomic<TuningListener*> listener{nullptr};
    std::array<std::atomic<double>, Corvo::kTableNotes> frequencies;
    // Of two who cook at once the later one must be the one with the newer temperament.
    Corvo::CriticalSection cooking;

    Notes() { Cook(); }
    void Cook() {
        const auto notes = Corvo::TemperedNotes(temperament, base);
        for (std::size_t i = 0; i < notes.size(); ++i)
            frequencies[i].store(notes[i], std::memory_order_relaxed);
    }
};

Notes& Shared() {
    static Notes notes;
    return notes;
}

void Calibrate(double base) {
    Notes& notes = Shared();
    notes.base = base;
    Tuner::CookNotesFrequencies(true);
    if (TuningListener* const listener = notes.listener) listener->NotesMustBeRecomputed();
}

double Cents(double ratio) { return 1200.0 * std::log2(ratio); }

}  // namespace

TuningListener::~TuningListener() = default;

void Tuner::SetTemperament(int temperament) {
    Notes& notes = Shared();
    temperament = std::max(temperament, 0);
    if (temperament == notes.temperament) return;
    // Stored before it is announced, or a display thread could cook the old one.
    notes.temperament = temperament < Corvo::kTemperaments ? temperament : 0;
    notes.changed = true;
    if (TuningListener* const listener = notes.listener) listener->NotesMustBeRecomputed();
}
int Tuner::GetTemperament() { return Shared().temperament; }
bool Tuner::IsTemperamentChanged() { return Shared().changed; }
const char* Tuner::GetTemperamentName(int temperament) { return Corvo::TemperamentName(temperament); }
const char* Tuner::GetCurrentTemperamentName() { return GetTemperamentName(GetTemperament()); }
void Tuner::SetTuningListener(TuningListener* listener) { Shared().listener = listener; }

void Tuner::CookNotesFrequencies(bool force) {
    Notes& notes = Shared();
    if (!force && !notes.changed) return;
    const std::lock_guard lock(notes.cooking);
    // Lowered before the temperament is read: what changes meanwhile raises it again.
    if (notes.changed.exchange(false) || force) notes.Cook();
}

double Tuner::GetNoteFrequency(int entry) {
    return entry >= 0 && entry < Corvo::kTableNotes
               ? Shared().frequencies[static_cast<std::size_t>(entry)].load(std::memory_order_relaxed)
               : 0.0;
}
double Tuner::GetCalibrationBase() { return Shared().base; }

bool TunerCalibrateNow(const Tuner& tuner) {
    const double heard = tuner.GetStableFrequency();
    if (heard <= 0.0) return false;
    const double cents = Corvo::FindNearestNote(heard).cents;
    const double limited = std::clamp(cents, -kLargestCalibration, kLargestCalibration);
    Calibrate(Tuner::GetCalibrationBase() * std::exp2(limited / 1200.0));
    return true;
}
void TunerCalibrateReset() { Calibrate(kStandardBase); }
bool TunerIsNonstandardCalibration() { return Tuner::GetCalibrationBase() != kStandardBase; }
bool TunerCalibrationNotStandardOrNotUseEqualTemperament() {
    return TunerIsNonstandardCalibration() || Tuner::GetTemperament() != 0;
}
int TunerGetNumLines() {
    return TunerCalibrationNotStandardOrNotUseEqualTemperament() ? kLinesWithTuning : kPlainLines;
}
bool TunerIsTracking(const Tuner& tuner) { return tuner.IsTracking(); }
void CookNotesFreqs() { Tuner::CookNotesFrequencies(true); }

namespace Corvo {

NearestNote FindNearestNote(double hz) {
    std::array<double, kTableNotes> notes;
    for (std::size_t i = 0; i < notes.size(); ++i) notes[i] = Tuner::GetNoteFrequency(static_cast<int>(i));
    const int octave = static_cast<int>(std::floor(std::log2(hz / notes[0])));
    const double folded = std::ldexp(hz, -octave);
    const auto above = std::upper_bound(notes.begin() + 1, notes.end() - 1, folded);
    const auto below = above - 1;
    const auto nearest = folded * folded < *above * *below ? below : above;
    const int entry = static_cast<int>(nearest - notes.begin());
    const int fromBase = 12 * octave + entry;
    NearestNote found;
    found.note = entry % 12;
    found.octave = kBaseOctave + (fromBase - found.note) / 12 + (found.note >= kFirstOfOctave ? 1 : 0);
    found.cents = Cents(folded / *nearest);
    return found;
}

}  // namespace Corvo
