#pragma once

#include <array>
#include <cstddef>
#include <span>

namespace Corvo::DSP {

constexpr std::size_t kMostPeriods = 10;

// A period that a frame could have.
struct PeriodCandidate {
    double seconds;
    double log2Seconds;
    double value;
    double cost;  // of choosing it in this frame alone
};

// The cheapest path through the frames: each frame takes one of its candidates or is unvoiced, and every
// change from frame to frame costs.
class VoicePitchPath {
public:
    void Clear() { m_before = 0; }
    // Index of the candidate that the path ends in, -1 when it is unvoiced. `hops` is the distance to the
    // frame before in units of 5.3 ms.
    int Advance(std::span<const PeriodCandidate> candidates, double hops);

private:
    // State 0 is unvoiced; the candidates follow.
    std::array<double, kMostPeriods + 1> m_costs{};
    std::array<double, kMostPeriods + 1> m_periods{};  // log2 of seconds
    std::size_t m_before = 0;                          // states of the frame before; 0 at the start
};

}  // namespace Corvo::DSP
