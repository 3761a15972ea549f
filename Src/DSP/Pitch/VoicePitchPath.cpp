#include "DSP/Pitch/VoicePitchPath.h"

#include <algorithm>
#include <cmath>

namespace Corvo::DSP {
namespace {

constexpr double kUnvoiced = 0.42, kVoicing = 0.18, kPerOctave = 1.2;

}  // namespace

int VoicePitchPath::Advance(std::span<const PeriodCandidate> candidates, double hops) {
    const std::size_t states = candidates.size() + 1;
    std::array<double, kMostPeriods + 1> costs{}, periods{};
    for (std::size_t to = 0; to < states; ++to) {
        costs[to] = to == 0 ? kUnvoiced : candidates[to - 1].cost;
        periods[to] = to == 0 ? 0.0 : candidates[to - 1].log2Seconds;
        if (m_before == 0) continue;
        double cheapest = 0.0;
        for (std::size_t from = 0; from < m_before; ++from) {
            double cost = m_costs[from];
            if ((from == 0) != (to == 0))
                cost += kVoicing;
            else if (to != 0)
                cost += kPerOctave * hops * std::abs(m_periods[from] - periods[to]);
            if (from == 0 || cost < cheapest) cheapest = cost;
        }
        costs[to] += cheapest;
    }
    const auto best = std::min_element(costs.begin(), costs.begin() + static_cast<std::ptrdiff_t>(states));
    const double least = *best;
    for (std::size_t to = 0; to < states; ++to) m_costs[to] = costs[to] - least;
    m_periods = periods;
    m_before = states;
    return static_cast<int>(best - costs.begin()) - 1;
}

}  // namespace Corvo::DSP
