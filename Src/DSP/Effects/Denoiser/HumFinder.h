#pragma once

#include <cstdint>

#include "DSP/Effects/Denoiser/Rings.h"

namespace Corvo::DSP::Denoising {

// Finds lines that hum steadily, which the tracker of the noise's floor takes for signal. A line stands out
// of its neighbourhood, hardly changes over some seconds, and is let go when it has been gone for 0.4 s.
class HumFinder {
public:
    void Prepare(Arena& arena, std::size_t bins, std::size_t values);
    // Forgets what it heard and found.
    void Start();
    // Speech lets lines in after 2 s; music, whose notes are steady too, after 4 s of greater steadiness.
    void SetMaterial(bool music, double hopSeconds);

    // Frame after frame, in this order: takes its power; looks for lines when a piece of the time is
    // complete, over the tracker's estimate `floor`; raises `noise` to the lines.
    void Listen(const float* power);
    void Look(const float* floor);
    void Raise(float* noise);

private:
    static constexpr std::size_t kPieces = 8;

    std::size_t m_bins = 0;
    float m_smoothing = 0.0f, m_hopSeconds = 0.0f, m_steady = 0.0f;
    int m_framesPerPiece = 2, m_framesInPiece = 0;
    std::int64_t m_pieces = 0;  // complete ones
    bool m_begun = false;
    float *m_smooth = nullptr, *m_minimum = nullptr, *m_sum = nullptr;
    FrameRing m_minima, m_means;
    float *m_lowest = nullptr, *m_valley = nullptr, *m_mean = nullptr, *m_found = nullptr;
    float *m_level = nullptr,
          *m_low = nullptr;  // of a line, 0 where there is none; seconds since it was heard
};

}  // namespace Corvo::DSP::Denoising
