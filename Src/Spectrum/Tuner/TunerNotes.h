#pragma once

#include <array>
#include <atomic>

#include "Platform/CriticalSection.h"
#include "Spectrum/Tuner/TunerTemperaments.h"

namespace Corvo {

struct NearestNote {
    int note = -1;   // 0 A .. 11 G#
    int octave = 0;  // changes at C: the A of 440 Hz is in octave 4
    double cents = 0.0;
};

// Temperament, calibration and the table of notes that follows from them. Any thread; while another cooks the
// table, some of its notes may be the new ones already.
class TunerNotes {
public:
    // Those that all tuners share.
    static TunerNotes& Shared();
    static constexpr double kStandardBase = 110.0;  // Hz

    TunerNotes() { FillTable(); }

    // False when it is the current one; the table follows with the next Cook. Negative counts as 0; above the
    // last one is a change, stored as 0.
    bool SetTemperament(int temperament);
    int Temperament() const { return m_temperament; }
    bool IsChanged() const { return m_changed; }
    // Cooks at once.
    void SetBase(double hz);
    double Base() const { return m_base; }
    // Unless neither `force` nor a change asks for it.
    void Cook(bool force);

    // 0 outside 0..12.
    double Frequency(int entry) const;
    // The note of the table, repeated over the octaves, next to a frequency (Hz, above 0).
    NearestNote FindNearest(double hz) const;

private:
    void FillTable();

    std::atomic<int> m_temperament{0};
    std::atomic<bool> m_changed{false};
    std::atomic<double> m_base{kStandardBase};
    std::array<std::atomic<double>, kTableNotes> m_frequencies;
    // Of two who cook at once the later one must be the one with the newer temperament.
    CriticalSection m_cooking;
};

}  // namespace Corvo
