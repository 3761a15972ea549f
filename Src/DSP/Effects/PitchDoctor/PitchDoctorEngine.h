#pragma once

#include <array>
#include <cmath>
#include <cstddef>
#include <cstdint>

#include "DSP/Effects/PitchDoctor/CycleMarks.h"
#include "DSP/Effects/PitchDoctor/GrainSynthesis.h"
#include "DSP/Effects/PitchDoctor/PitchControl.h"
#include "DSP/Effects/PitchDoctor/PitchReadings.h"
#include "DSP/Effects/PitchDoctor/PitchScale.h"
#include "DSP/Effects/PitchDoctor/PitchTrack.h"
#include "DSP/Parts/SampleHistory.h"
#include "DSP/Pitch/VoicePitchAnalysis.h"
#include "Threads/RecentValues.h"

namespace Corvo::DSP {

using PitchReadingRing = RecentValues<PitchReading, 512>;

struct PitchDoctorVoice {
    PitchScale scale;
    PitchControlSettings control;
    GrainSettings grains;
    double highestHz = 1400.0, silence = -70.0;
    double mix = 1.0;
};

// Hears, decides and shifts one stream for one lowest pitch. Work is done in steps at fixed places of the
// stream, so that the output does not depend on how it is cut.
class PitchDoctorEngine {
public:
    // Throws std::bad_alloc.
    PitchDoctorEngine(double rate, double lowestHz);
    // Takes the memory to work in; Clear comes next.
    void Prepare(Arena& arena);
    static int LatencyOf(double rate, double lowestHz);

    int Latency() const { return m_latency; }
    // The next frame is number `start` of the stream that readings tell places of.
    void Clear(std::int64_t start = 0);
    // Frames of that stream so far.
    std::int64_t Position() const { return m_start + m_origin + m_input[0].End(); }
    void Cook(const PitchDoctorVoice& voice);

    // One or two channels in place, `stride` from a channel's sample to its next. `readings`: null for none.
    template <typename Sample>
    void Process(std::array<Sample*, 2> samples, int channels, int frames, std::ptrdiff_t stride,
                 PitchReadingRing* readings) {
        while (frames > 0) {
            const int count = frames < m_untilStep ? frames : m_untilStep;
            for (std::size_t c = 0; c < static_cast<std::size_t>(channels); ++c)
                for (int i = 0; i < count; ++i)
                    m_block[c][static_cast<std::size_t>(i)] = samples[c][i * stride];
            Run(channels, count);
            for (std::size_t c = 0; c < static_cast<std::size_t>(channels); ++c)
                for (int i = 0; i < count; ++i, samples[c] += stride)
                    *samples[c] = static_cast<Sample>(m_block[c][static_cast<std::size_t>(i)]);
            frames -= count;
            if ((m_untilStep -= count) > 0) continue;
            m_untilStep = m_detector.Step();
            Step(readings);
        }
    }

private:
    using Block = std::array<double, GrainSynthesis::kMostFrames>;

    void Run(int channels, int frames);
    void Step(PitchReadingRing* readings);
    void Publish(PitchReadingRing& readings) const;
    void Rebase();

    double m_longestPeriod;
    int m_latency;
    double m_mixShare;  // of the way to a new mix that each frame goes
    VoicePitchAnalysis m_detector;
    PitchTrack m_track;
    PitchControl m_control;
    CycleMarks m_marks;
    GrainSynthesis m_grains;
    std::array<SampleHistory<double>, 2> m_input;
    double m_behind;  // how far behind the output marks are kept
    PitchDoctorVoice m_voice;
    double m_mix = 1.0;
    bool m_fresh = true;  // nothing was processed since Clear
    int m_untilStep = 1;
    std::int64_t m_origin = 0;  // of the places, in what came since Clear
    std::int64_t m_start = 0;   // of that, in the stream
    std::array<Block, 2> m_block{}, m_wet{};
};

}  // namespace Corvo::DSP
