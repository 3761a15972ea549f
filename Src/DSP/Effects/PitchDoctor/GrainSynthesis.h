#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <span>

#include "DSP/Effects/PitchDoctor/CycleMarks.h"
#include "DSP/Effects/PitchDoctor/PitchTrack.h"
#include "DSP/Parts/SampleHistory.h"

namespace Corvo::DSP {

struct GrainSettings {
    double formantsKept = 1.0;  // share
    double formantRatio = 1.0;  // by which formants are moved
};

// Lays the cycles of the voice at another distance: each output cycle is a windowed grain around a mark of
// the input, so that the pitch changes and the formants stay. The method is pitch-synchronous overlap-add
// (Moulines and Charpentier, Speech Communication 9, 1990).
class GrainSynthesis {
public:
    static constexpr int kMostFrames = 32;

    explicit GrainSynthesis(double rate) : m_rate(rate) {}
    // Takes the memory to work in.
    void Prepare(Arena& arena);
    void Clear();
    void Rebase(double samples);

    // Decides every grain that reaches in front of `until`, a place of the output.
    void Place(const CycleMarks& marks, const PitchTrack& track, const GrainSettings& settings, double until);
    // At most kMostFrames output samples from place `from` on, of one or two channels of input, which reach
    // at least to the output's place plus a period.
    void Render(std::array<const SampleHistory<double>*, 2> input, int channels, std::int64_t from,
                int frames, std::array<std::array<double, kMostFrames>, 2>& output);
    // The mark of the newest grain.
    std::int64_t Newest() const { return m_mark; }

private:
    static constexpr int kTaps = 16;
    static constexpr std::size_t kKept = 64;
    struct Grain {
        double centre = 0.0;             // in the output
        double mark = 0.0;               // in the input
        double left = 0.0, right = 0.0;  // widths of the window, in the input
        double speed = 1.0;              // input samples per output sample
        std::int64_t shift = 0;          // at speed 1: input place of the first tap less output place
        std::array<double, kTaps> taps{};
        bool aligned = false;  // at speed 1: no reading between samples
    };

    // Widens or narrows the newest grain to reach the next mark, which may be known only now.
    void Widen(const CycleMarks& marks);
    void Add(const CycleMarks& marks, std::int64_t mark, double centre, double ratio,
             const GrainSettings& settings);
    bool PlaceVoiced(const CycleMarks& marks, const PitchTrack& track, const GrainSettings& settings,
                     double until);
    bool PlaceUnvoiced(const CycleMarks& marks, const GrainSettings& settings, double until);
    double Speed(const CycleMarks::Mark& mark, double ratio, const GrainSettings& settings) const;

    double m_rate;
    std::span<Grain> m_grains;
    std::int64_t m_firstGrain = 0, m_endGrain = 0;
    std::int64_t m_mark = -1;  // of the newest grain
    double m_centre = 0.0, m_ratio = 1.0;
    double m_rendered = 0.0;  // the output's end
};

}  // namespace Corvo::DSP
