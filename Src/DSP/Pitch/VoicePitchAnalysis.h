#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <span>
#include <utility>

#include "DSP/Parts/Arena.h"
#include "DSP/Parts/Biquad.h"
#include "DSP/Parts/SampleHistory.h"
#include "DSP/Pitch/VoicePitchDetector.h"
#include "DSP/Pitch/VoicePitchPath.h"
#include "DSP/Pitch/VoicePitchTables.h"

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
    // Throws std::bad_alloc.
    explicit VoicePitchAnalysis(const VoicePitchSettings& settings);
    // Takes the memory to work in, or makes its own.
    void Prepare(Arena& arena);
    void Prepare() {
        ReserveFor(m_memory, [this](Arena& arena) { Prepare(arena); });
    }
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
    void Forward();
    void Inverse();
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
    std::shared_ptr<const VoicePitchTables> m_tables;
    double m_analysisRate;  // of the decimated samples
    int m_decimation, m_step, m_hop;
    int m_length;        // of the frame, in decimated samples
    int m_longestPiece;  // of the second measurement, in samples

    Biquad m_highPass, m_low1, m_low2, m_alias1, m_alias2;
    SampleHistory<float> m_low;              // at full rate
    SampleHistory<float> m_lowSlow, m_full;  // decimated
    std::int64_t m_given = 0, m_frameEnd = 0;
    int m_untilDecimated = 0, m_untilStep = 0, m_stepInHop = 0;

    Arena m_memory;                   // where it has its own
    float* m_work = nullptr;          // of the transform
    std::span<float> m_magnitudes;    // of the flattened spectrum
    std::span<float> m_spectrum;      // packed, then an autocorrelation
    std::span<float> m_nsdf, m_flat;  // by lag, of the low band and of the flattened spectrum
    double* m_sums = nullptr;         // of squares in front of each sample of the frame
    double* m_pieceSums = nullptr;
    bool m_loud = false;

    VoicePitchPath m_path;
    std::array<PeriodCandidate, kMostPeriods> m_periods{};
    std::array<VoicePitchCandidate, kMostPeriods> m_candidates{};
    std::size_t m_count = 0;
    VoicePitchFrame* m_frames = nullptr;  // kKept
    std::uint64_t m_made = 0, m_taken = 0;
};

}  // namespace Corvo::DSP
