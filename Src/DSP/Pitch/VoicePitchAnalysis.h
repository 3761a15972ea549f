#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <span>
#include <utility>
#include <vector>

#include "DSP/Parts/Biquad.h"
#include "DSP/Parts/SampleHistory.h"
#include "DSP/Pitch/VoicePitchDetector.h"
#include "DSP/Pitch/VoicePitchPath.h"
#include "Spectrum/Fft/CorvoFFT.h"

namespace Corvo::DSP {

// The work of VoicePitchDetector, in steps at fixed places of the stream. A frame's work is spread over the
// steps of a hop:
//
//   last but one  the full band of the frame to come is transformed,
//   last          flattened, and transformed back;
//   first         the low band is transformed: here the frame ends,
//   second        and back;
//   third         the candidates are found, and the pitch is decided.
//
// So the flattened spectrum is two steps older than the rest, which shortens the delay by as much.
class VoicePitchAnalysis {
public:
    explicit VoicePitchAnalysis(const VoicePitchSettings& settings);
    void Clear();
    void SetHighest(double hz);
    void SetSilence(double decibels);

    int Hop() const { return m_hop; }
    int Step() const { return m_step; }
    int Delay() const { return kDecideStep * m_step; }

    template <typename Sample>
    void Push(const Sample* samples, int count) {
        while (count > 0) {
            const int piece = count < m_untilStep ? count : m_untilStep;
            for (int i = 0; i < piece; ++i) Take(static_cast<double>(samples[i]));
            samples += piece;
            count -= piece;
            if ((m_untilStep -= piece) > 0) continue;
            m_untilStep = m_step;
            Work();
        }
    }
    bool TakeFrame(VoicePitchFrame& frame);
    std::span<const VoicePitchCandidate> Candidates() const { return {m_candidates.data(), m_count}; }

private:
    static constexpr std::size_t kKept = 64;
    static constexpr int kDecideStep = 2;

    void Take(double sample);
    void Work();
    void TransformFull();
    void CorrelateFull();
    void Flatten();
    void TransformLow();
    void CorrelateLow();
    void FindCandidates();
    PeriodCandidate CandidateAt(int lag) const;
    void Decide();
    // Period in samples, and the length of the piece that it was measured on.
    std::pair<double, int> Measure(double period);

    double m_rate, m_lowestHz, m_highestHz = 0.0, m_silencePower = 0.0;
    int m_decimation, m_step, m_hop;
    double m_analysisRate;         // of the decimated samples
    int m_length, m_lags, m_size;  // of frame and transform, in decimated samples
    int m_longestPiece;            // of the second measurement, in samples

    Biquad m_highPass, m_low1, m_low2, m_alias1, m_alias2;
    SampleHistory<float> m_low;              // at full rate
    SampleHistory<float> m_lowSlow, m_full;  // decimated
    std::int64_t m_given = 0, m_frameEnd = 0;
    int m_untilDecimated = 0, m_untilStep = 0, m_stepInHop = 0;

    CorvoFFT m_fft;
    std::vector<float> m_window, m_overlap;   // the window's own autocorrelation
    std::vector<float> m_band, m_magnitudes;  // of the flattened spectrum
    int m_meanBins = 1;
    std::vector<float> m_spectrum;      // packed, then an autocorrelation
    std::vector<float> m_nsdf, m_flat;  // by lag, of the low band and of the flattened spectrum
    std::vector<double> m_sums;         // of squares in front of each sample of the frame
    std::vector<double> m_pieceSums;
    bool m_loud = false;

    VoicePitchPath m_path;
    std::array<PeriodCandidate, kMostPeriods> m_periods{};
    std::array<VoicePitchCandidate, kMostPeriods> m_candidates{};
    std::size_t m_count = 0;
    std::array<VoicePitchFrame, kKept> m_frames{};
    std::uint64_t m_made = 0, m_taken = 0;
};

}  // namespace Corvo::DSP
