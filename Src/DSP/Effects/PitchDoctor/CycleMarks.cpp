#include "DSP/Effects/PitchDoctor/CycleMarks.h"

#include <algorithm>
#include <cmath>
#include <numbers>

#include "DSP/Parts/Correlation.h"

namespace Corvo::DSP {
namespace {

constexpr double kUnvoicedSeconds = 0.005, kLowPassHz = 2000.0, kStepRate = 24000.0;
constexpr double kSearch = 0.06, kAlike = 0.5;  // of a period; correlation from which it counts
constexpr double kPull = 0.05, kMostPull = 0.01;
constexpr double kNear = 0.3;  // of the distance without voice: marks no closer, and no further off it
constexpr int kMargin = 8;

}  // namespace

CycleMarks::CycleMarks(double rate, double longestPeriod, int latency)
    : m_rate(rate),
      m_longestPeriod(longestPeriod),
      m_latency(latency),
      m_step(std::max(static_cast<int>(std::lround(rate / kStepRate)), 1)),
      m_unvoicedDistance(kUnvoicedSeconds * rate),
      m_low1(Biquad::LowPass(kLowPassHz, Biquad::kFirstOfFour, rate)),
      m_low2(Biquad::LowPass(kLowPassHz, Biquad::kSecondOfFour, rate)) {}

void CycleMarks::Prepare(Arena& arena) {
    const auto most =
        static_cast<std::int64_t>(3.0 * m_longestPeriod + 4.0 * m_unvoicedDistance) + m_latency + 64;
    m_low.Prepare(arena, most);
    m_energy.Prepare(arena, most);
    m_sums = arena.Take<double>(static_cast<std::size_t>(1.5 * m_longestPeriod) + 64);
    m_marks = {arena.Take<Mark>(kKept), kKept};
}

void CycleMarks::Clear() {
    m_low1.Clear();
    m_low2.Clear();
    m_last = 0.0;
    m_low.Clear();
    m_energy.Clear();
    m_first = m_end = 0;
    Add({0.0, m_unvoicedDistance, false});
}

void CycleMarks::Push(double sample) {
    m_low.Push(static_cast<float>(m_low2(m_low1(sample))));
    const double step = sample - m_last;
    m_energy.Push(static_cast<float>(step * step));
    m_last = sample;
}

void CycleMarks::Rebase(std::int64_t samples) {
    m_low.Rebase(samples);
    m_energy.Rebase(samples);
    for (auto& mark : m_marks) mark.place -= static_cast<double>(samples);
}

void CycleMarks::Forget(double place, std::int64_t keep) {
    while (m_first + 1 < std::min(keep, m_end - 2) && At(m_first + 1).place < place) ++m_first;
}

std::int64_t CycleMarks::Nearest(double place, std::int64_t from) const {
    std::int64_t number = m_end - 1;
    while (number > m_first && At(number - 1).place >= place) --number;
    if (number > m_first && std::abs(At(number - 1).place - place) <= std::abs(At(number).place - place))
        --number;
    return std::max(number, from);
}

void CycleMarks::Extend(const PitchTrack& track) {
    const auto full = static_cast<std::int64_t>(m_marks.size());
    while (m_end - m_first < full && (At(m_end - 1).voiced ? ExtendVoiced(track) : ExtendUnvoiced(track))) {
    }
}

bool CycleMarks::ExtendUnvoiced(const PitchTrack& track) {
    const Mark last = At(m_end - 1);
    const auto end = static_cast<double>(m_low.End());
    const double next = last.place + m_unvoicedDistance;
    const double decided = std::max(track.Known(), end - m_latency + 2.0 * m_unvoicedDistance);
    if (next > decided || next > end - kMargin) return false;
    if (!track.IsVoiced(next)) {
        Add({next, m_unvoicedDistance, false});
        return true;
    }
    const double period = track.Period(next), reach = 0.5 * period + 1.0;
    if (next + reach > end) return false;
    double place = next;
    for (int round = 0; round < 3; ++round) place += FromEnergy(place, period);
    if (place > next + kNear * m_unvoicedDistance) {  // too far for one grain: unvoiced once more
        Add({next, m_unvoicedDistance, false});
        return true;
    }
    place = std::max(place, last.place + kNear * m_unvoicedDistance + 1.0);
    if (place + reach > end) return false;
    Add({place, period, true});
    return true;
}

bool CycleMarks::ExtendVoiced(const PitchTrack& track) {
    const Mark last = At(m_end - 1);
    const auto end = static_cast<double>(m_low.End());
    const double period = track.Period(last.place + 0.5 * track.Period(last.place));
    double next = last.place + period;
    if (!track.IsVoiced(next)) {
        if (next > end - kMargin) return false;
        Add({next, m_unvoicedDistance, false});
        return true;
    }
    // Half a cycle and the search.
    if (std::round(next) + std::floor(0.5 * period) + std::max(2.0, kSearch * period) + 1.0 >= end)
        return false;
    next += FromLikeness(last.place, next, period);
    next += std::clamp(kPull * FromEnergy(next, period), -kMostPull * period, kMostPull * period);
    Add({next, period, true});
    return true;
}

// How far the centre of a cycle's energy is behind `place`: the phase of its first harmonic.
double CycleMarks::FromEnergy(double place, double period) const {
    const std::int64_t from = std::llround(place - 0.5 * period), to = std::llround(place + 0.5 * period);
    if (to >= m_energy.End()) return 0.0;
    const float* const energy = m_energy.At(from);
    const double w = 2.0 * std::numbers::pi / period, stepCos = std::cos(w), stepSin = std::sin(w);
    double c = std::cos(w * (static_cast<double>(from) - place)),
           s = std::sin(w * (static_cast<double>(from) - place)), real = 0.0, imaginary = 0.0;
    for (std::int64_t i = 0; i < to - from; ++i) {
        const double e = energy[i];
        real += e * c;
        imaginary += e * s;
        const double turned = c * stepCos - s * stepSin;
        s = s * stepCos + c * stepSin;
        c = turned;
    }
    return period * std::atan2(imaginary, real) / (2.0 * std::numbers::pi);
}

// How far from `next` the cycle is most like the one around `place`; 0 where none is.
double CycleMarks::FromLikeness(double place, double next, double period) {
    const int half = static_cast<int>(0.5 * period), reach = std::max(2, static_cast<int>(kSearch * period));
    const int length = 2 * half;
    const double from = std::round(place), to = std::round(next);
    const float* const a = m_low.At(static_cast<std::int64_t>(from) - half);
    const float* const b = m_low.At(static_cast<std::int64_t>(to) - half - reach);
    const double energy = DotProduct(a, a, length);
    for (std::size_t i = 0; i < static_cast<std::size_t>(length + 2 * reach); ++i)
        m_sums[i + 1] = m_sums[i] + static_cast<double>(b[i]) * static_cast<double>(b[i]);
    const Peak peak = FindPeak(0, 2 * reach, m_step, [&](int lag) {
        const double other =
            m_sums[static_cast<std::size_t>(lag + length)] - m_sums[static_cast<std::size_t>(lag)];
        return DotProduct(a, b + lag, length) / std::sqrt(energy * other + 1e-12);
    });
    if (!peak.inside || !(peak.height > kAlike)) return 0.0;
    const double offset = peak.place - reach + (to - next) - (from - place);
    return std::clamp(offset, -1.0 * reach, 1.0 * reach);
}

}  // namespace Corvo::DSP
