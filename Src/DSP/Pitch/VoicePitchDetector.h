#pragma once

#include <cstdint>
#include <memory>
#include <span>

#include "Platform/Export.h"

namespace Corvo::DSP {

class VoicePitchAnalysis;

// What to listen for.
struct VoicePitchSettings {
    double rate = 48000.0;      // Hz, limited to 1000..768000
    double lowestHz = 75.0;     // limited to 20..1000; the delay grows with its period
    double highestHz = 1400.0;  // limited to twice the lowest..2000
    double silence = -70.0;     // dB: mean power below which nothing is voiced; 0 is a full-scale square
    bool shortHop = false;      // a frame every 2.7 ms instead of 5.3
};

// What was heard in one frame.
struct VoicePitchFrame {
    std::int64_t end = 0;  // the samples given before it: the newest one used is end - 1
    double age = 0.0;      // the estimate fits best so many samples before `end`
    double hz = 0.0;       // 0: unvoiced
    double value = 0.0;    // of the chosen candidate; see VoicePitchCandidate
};

// A period that the frame could have.
struct VoicePitchCandidate {
    double hz;  // one over the period
    // Up to about 1.7: the peak of the normalised autocorrelation, plus that of the autocorrelation of the
    // flattened spectrum less 0.3.
    double value;
};

// Hears the pitch of one voice or monophonic instrument as it comes in, with a fixed delay: voiced or not,
// and in hertz where it is.
//
// Each frame weighs the peaks of two autocorrelations: one of the waveform below 2500 Hz, normalised by the
// energies of the two stretches compared (the "NSDF" of McLeod and Wyvill, "A smarter way to find pitch",
// ICMC 2005), one of the spectrum with its formants flattened, in the manner of Tolonen and Karjalainen ("A
// computationally efficient multipitch analysis model", IEEE Trans. Speech and Audio Processing 8, 2000).
// The path through the frames' candidates is followed as Viterbi does, and decided at once. The period chosen
// is measured again over the newest two and a half periods.
//
// The same bits however the stream is cut into calls, on every processor. All memory is made by the
// constructor; nothing else allocates. One thread uses an object at a time. A sample that is not finite
// counts as 0. A second of 48 kHz takes about 4 ms of one core.
class DSP_API VoicePitchDetector {
public:
    // Settings out of range are limited. Throws std::bad_alloc.
    explicit VoicePitchDetector(const VoicePitchSettings& settings);
    ~VoicePitchDetector();
    VoicePitchDetector(const VoicePitchDetector&) = delete;
    VoicePitchDetector& operator=(const VoicePitchDetector&) = delete;

    // Forgets what it heard; the limits stay as last set.
    void Clear();
    // Take effect with the next frame.
    void SetHighest(double hz);
    void SetSilence(double decibels);

    // Samples from frame to frame, and from a frame's end until it can be taken: its work is spread.
    int HopSamples() const;
    int DelaySamples() const;
    // Frames are made when the samples given are a multiple of this.
    int StepSamples() const;

    // The next samples of one channel, full scale 1; copied.
    void Push(const float* samples, int count);
    void Push(const double* samples, int count);
    // The oldest frame that was not taken; false when there is none. The newest 64 are kept.
    bool Take(VoicePitchFrame& frame);
    // Of the newest frame, at most 10, the shortest period first; valid until the next Push.
    std::span<const VoicePitchCandidate> Candidates() const;

private:
    std::unique_ptr<VoicePitchAnalysis> m_analysis;
};

}  // namespace Corvo::DSP
