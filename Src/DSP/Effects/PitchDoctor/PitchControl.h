#pragma once

#include <utility>

#include "DSP/Effects/PitchDoctor/PitchScale.h"
#include "DSP/Effects/PitchDoctor/PitchTrack.h"

namespace Corvo::DSP {

struct PitchControlSettings {
    double retune = 0.02;      // seconds, time constant of the correction
    double transition = 0.04;  // seconds from a note to the next
    double ratio = 1.0;        // of the error that is taken away
    double tolerance = 5.0;    // cents that are left alone in the mean
    double keepVibrato = 0.5;  // share
    double hysteresis = 25.0;  // cents by which another note has to be nearer
    double hold = 0.025;       // seconds for which it has to be
    double shift = 0.0;        // cents on top of everything
};

// The law of the correction: decides for each frame which note is meant and how far the voice is moved.
class PitchControl {
public:
    explicit PitchControl(double frameSeconds) : m_frame(frameSeconds) {}
    void Clear() { *this = PitchControl(m_frame); }
    // Takes the next frame, voiced at `hz` or unvoiced at 0, and appends it to the track. Corrections of the
    // frames with which a note sets in are filled in afterwards.
    void Step(PitchTrack& track, double place, double hz, const PitchScale& scale,
              const PitchControlSettings& settings);
    // So many frames before the newest may still get their note.
    std::int64_t FramesOpen() const { return Frames(kOnset) - 1; }

private:
    static constexpr double kOnset = 0.0107;  // seconds for which a voice has to be calm

    std::int64_t Frames(double seconds) const;
    std::pair<double, std::size_t> Median(const PitchTrack& track, std::int64_t now, double hold) const;
    bool IsCalm(const PitchTrack& track, std::int64_t now) const;
    void ChooseNote(double cents, const PitchScale& scale, const PitchControlSettings& settings,
                    std::int64_t now);
    void MoveTo(const PitchScale::Note& note, std::int64_t now);
    bool IsElsewhere(double cents, const PitchScale::Note& nearest) const;
    double Target(double transition);
    double MeanSinceNote(const PitchTrack& track, std::int64_t now) const;
    double Weight(double error, double tolerance, bool fresh);
    void Fill(PitchTrack& track, std::int64_t now, double target, const PitchControlSettings& settings,
              double keep);
    void NameOnset(PitchTrack& track, std::int64_t now) const;
    void Rest(PitchTrack::Frame& frame, double correction);

    double m_frame;  // seconds
    PitchScale::Note m_note;
    int m_rival = -1;
    int m_rivalFrames = 0;
    double m_target = 0.0, m_from = 0.0;  // of a transition
    double m_output = 0.0;                // cents: where the voice is now, if all of the error counted
    double m_since = 1e9;                 // seconds since the last change of note
    double m_meanError = 0.0, m_correction = 0.0;
    std::int64_t m_lastVoiced = -1000000, m_noteStart = 0, m_voiceStart = 0, m_judgedFrom = 0;
};

}  // namespace Corvo::DSP
