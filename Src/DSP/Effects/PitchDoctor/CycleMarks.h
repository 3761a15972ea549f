#pragma once

#include <cstddef>
#include <cstdint>
#include <span>

#include "DSP/Effects/PitchDoctor/PitchTrack.h"
#include "DSP/Parts/Biquad.h"
#include "DSP/Parts/SampleHistory.h"

namespace Corvo::DSP {

// Marks one instant in every cycle of the voice, always at the same phase of the cycle; where there is no
// voice, one every 5 ms.
class CycleMarks {
public:
    struct Mark {
        double place = 0.0;   // in samples
        double period = 0.0;  // in samples; of an unvoiced one the distance
        bool voiced = false;
    };

    // `latency`: how far the output is behind the input.
    CycleMarks(double rate, double longestPeriod, int latency);
    // Takes the memory to work in; Clear comes next.
    void Prepare(Arena& arena);
    void Clear();
    void Push(double sample);
    // Sets the marks that what was pushed, and what is known of the voice, allow for.
    void Extend(const PitchTrack& track);
    // Forgets marks in front of `place`, but no more than up to mark `keep`.
    void Forget(double place, std::int64_t keep);
    void Rebase(std::int64_t samples);

    // Marks are numbered from Clear on.
    std::int64_t First() const { return m_first; }
    std::int64_t End() const { return m_end; }
    const Mark& At(std::int64_t number) const {
        return m_marks[static_cast<std::size_t>(number) % m_marks.size()];
    }
    // The mark next to `place`, from number `from` on.
    std::int64_t Nearest(double place, std::int64_t from) const;

private:
    void Add(const Mark& mark) { m_marks[static_cast<std::size_t>(m_end++) % m_marks.size()] = mark; }
    bool ExtendUnvoiced(const PitchTrack& track);
    bool ExtendVoiced(const PitchTrack& track);
    double FromEnergy(double place, double period) const;
    double FromLikeness(double place, double next, double period);

    static constexpr std::size_t kKept = 1024;

    double m_rate, m_longestPeriod;
    int m_latency, m_step;
    double m_unvoicedDistance;
    Biquad m_low1, m_low2;
    double m_last = 0.0;
    SampleHistory<float> m_low, m_energy;  // below 2000 Hz; squares of the differences
    double* m_sums = nullptr;
    std::span<Mark> m_marks;
    std::int64_t m_first = 0, m_end = 0;
};

}  // namespace Corvo::DSP
