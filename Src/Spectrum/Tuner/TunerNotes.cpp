#include "Spectrum/Tuner/TunerNotes.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <mutex>

namespace Corvo {
namespace {

constexpr int kBaseOctave = 2;
constexpr int kFirstOfOctave = 3;  // C

}  // namespace

TunerNotes& TunerNotes::Shared() {
    static TunerNotes notes;
    return notes;
}

bool TunerNotes::SetTemperament(int temperament) {
    temperament = std::max(temperament, 0);
    if (temperament == m_temperament) return false;
    // Stored before it is announced, or a display thread could cook the old one.
    m_temperament = temperament < kTemperaments ? temperament : 0;
    m_changed = true;
    return true;
}

void TunerNotes::SetBase(double hz) {
    m_base = hz;
    Cook(true);
}

void TunerNotes::Cook(bool force) {
    if (!force && !m_changed) return;
    const std::lock_guard lock(m_cooking);
    // Lowered before the temperament is read: what changes meanwhile raises it again.
    if (m_changed.exchange(false) || force) FillTable();
}

void TunerNotes::FillTable() {
    const auto notes = TemperedNotes(m_temperament, m_base);
    for (std::size_t i = 0; i < notes.size(); ++i)
        m_frequencies[i].store(notes[i], std::memory_order_relaxed);
}

double TunerNotes::Frequency(int entry) const {
    return entry >= 0 && entry < kTableNotes
               ? m_frequencies[static_cast<std::size_t>(entry)].load(std::memory_order_relaxed)
               : 0.0;
}

NearestNote TunerNotes::FindNearest(double hz) const {
    std::array<double, kTableNotes> notes;
    for (std::size_t i = 0; i < notes.size(); ++i) notes[i] = Frequency(static_cast<int>(i));
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
    found.cents = 1200.0 * std::log2(folded / *nearest);
    return found;
}

}  // namespace Corvo
