#pragma once

#include <array>
#include <cstdint>
#include <span>

#include "DSP/Effects/Denoiser/Rings.h"
#include "DSP/Effects/Denoiser/SizeSets.h"
#include "DSP/Effects/Denoiser/SpectrumKernels.h"
#include "DSP/Effects/Denoiser/WindowTables.h"

namespace Corvo::DSP::Denoising {

constexpr std::size_t kMostChannels = 2;

// The noise's power per bin as the frame at hand sees it: between two spectra. Without any, all is noise.
struct NoiseAt {
    const float *before, *after;
    float share;  // of `after`
};

// The settings that the gains follow.
struct GainSettings {
    float detailDb = 12.0f;
    float whitening = 0.0f;        // 0..1
    bool keepMasked = false;       // what the signal masks
    float maskingOffsetDb = 0.0f;  // how far below the signal
};

// Shrinks the spectrum of one window length towards the floor where there is only noise.
//
// Of every bin, the ratio of its power to the noise's is averaged over a few frames and compared with what
// noise alone would give; how likely signal is there decides, smoothed over its neighbours, between Wiener's
// gain and the floor. Averages reach up to `ahead` frames ahead, so a frame's gain is found some frames
// later: what is given back with frame t is frame t - Delay().
//
// A frame's work is a number of steps, to be done in their order, so that the caller can spread them.
class SizeReducer {
public:
    // Memory for windows of plan.length * scale.
    void Prepare(Arena& arena, const SizePlan& plan, WindowTables& tables, std::size_t channels);

    // The floor's curves, and the profile's offset per bin as a factor; live as long as they are in use.
    void SetCurves(const float* curve, const float* floor, const float* logFloor) {
        m_curve = curve;
        m_floor = floor;
        m_logFloor = logFloor;
    }
    // From the next frame on.
    void SetGains(const GainSettings& settings) { m_next = settings; }

    int Steps() const { return static_cast<int>(2 * m_channels + 4 * m_pieces + 1); }
    // Nanoseconds or so.
    float Cost(int step) const;
    struct Job {
        std::int64_t frame;
        std::span<const SampleRing> input, output;
        std::array<NoiseAt, kMostChannels> noise;
        float logReference;  // where the residual's whitening pivots
    };
    void Run(int step, const Job& job);

    int Hop() const { return m_tables->length / kOverlap; }
    int Delay() const { return m_plan.ahead + 2 * SupportAhead() + EstimateAhead(); }
    // Of frame t - Delay(), in bands; valid for the newest kRisks frames.
    float Risk(std::int64_t frame, std::size_t band) const { return m_risks[frame][band]; }
    static constexpr std::int64_t kRisks = 64;

private:
    enum class Stage { Analyse, Ratio, Presence, Gain, Mask, Risk, Synthesise };
    struct Step {
        Stage stage;
        std::size_t index;  // channel or piece
    };
    Step At(int step) const;
    void Analyse(std::size_t channel, const Job& job);
    void Ratios(std::size_t piece, const Job& job);
    void Whiten(std::size_t from, std::size_t to, float reference);
    void Support(std::size_t pass, std::size_t piece, std::int64_t newest, float* presence);
    void Presences(std::size_t piece, std::int64_t newest);
    void Gains(std::size_t piece, std::int64_t newest);
    void Mask(std::int64_t frame);
    void Risks(std::size_t piece, std::int64_t frame);
    void Synthesise(std::size_t channel, const Job& job);

    int SupportAhead() const { return std::min(m_plan.ahead, 3); }
    int EstimateAhead() const { return std::min(m_plan.ahead, 1); }
    std::size_t From(std::size_t piece) const { return piece * kPiece; }
    std::size_t To(std::size_t piece) const { return std::min(m_values, (piece + 1) * kPiece); }
    // Presences have room for the edges that smoothing over bins reads.
    float* Padded(float* presence) const { return presence + kEdge; }
    void PadEdges(float* padded) const;

    static constexpr std::size_t kPiece = 1024, kEdge = 16;

    const SpectrumKernels* m_kernels = nullptr;
    SizePlan m_plan{};
    WindowTables* m_tables = nullptr;
    std::size_t m_channels = 0, m_values = 0, m_pieces = 0;
    GainSettings m_settings{}, m_next{};  // the frame's at hand, and the next one's
    const float *m_curve = nullptr, *m_floor = nullptr, *m_logFloor = nullptr;

    std::array<float, 32> m_evidenceWeights{};
    std::array<float, 7> m_supportWeights{};
    std::array<float, 3> m_estimateWeights{};

    std::array<FrameRing, kMostChannels> m_re, m_im;
    FrameRing m_ratio, m_evidence, m_unlikely, m_support[2], m_presence, m_estimate, m_risks;
    float *m_raw[2]{}, *m_power[kMostChannels]{}, *m_meanNoise = nullptr, *m_gain = nullptr,
                                                  *m_risk = nullptr;
    float *m_whiteFloor = nullptr, *m_logWhiteFloor = nullptr;
};

}  // namespace Corvo::DSP::Denoising
