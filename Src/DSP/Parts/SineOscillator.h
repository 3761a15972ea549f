#pragma once

#include <array>
#include <bit>
#include <cmath>
#include <cstddef>
#include <cstdint>

namespace Corvo::DSP {

// What `steps` additions of `increment`, one after the other, make of `phase`: the same bits, mostly at
// once. Between two powers of two every sum is rounded alike, so that all of them move the phase by the same
// amount.
inline double PhaseAfter(double phase, double increment, int steps) {
    const auto binade = [](double value) { return std::bit_cast<std::uint64_t>(value) >> 52; };
    const double next = phase + increment, step = next - phase, end = phase + step * steps;
    // Where the increment lies half way between two neighbours, only the second step shows the amount.
    const bool even = (next + increment) - next == step;
    if (even && phase >= 0.0 && increment >= 0.0 && binade(phase) == binade(end)) return end;
    for (; steps > 0; --steps) phase += increment;
    return phase;
}

// A sine whose phase moves by the same increment with every frame. The phase is exactly what adding the
// increment frame by frame gives. The sine is the library's at the first frame of a piece and turned from
// there by known angles: within 1e-13 of the library's sine of the running phase, as long as that stays
// below 16.
class SineOscillator {
public:
    static constexpr int kPiece = 64;
    static constexpr double kTwoPi = 6.283185307179586;

    // Builds the turns by 0 to kPiece increments, unless they are there already.
    void SetIncrement(double radians) {
        if (radians == m_increment) return;
        m_increment = radians;
        for (std::size_t size = 1; size <= kPiece; size *= 2) {
            const double angle = radians * static_cast<double>(size);
            const double cosine = std::cos(angle), sine = std::sin(angle);
            for (std::size_t i = 0; i < size && size + i <= kPiece; ++i) {
                m_cosines[size + i] = m_cosines[i] * cosine - m_sines[i] * sine;
                m_sines[size + i] = m_sines[i] * cosine + m_cosines[i] * sine;
            }
        }
    }
    double Increment() const { return m_increment; }

    double Phase() const { return m_phase; }
    void SetPhase(double radians) { m_phase = radians; }
    void ReducePhase() { m_phase = std::fmod(m_phase, kTwoPi); }

    // The sines of the `frames` phases after this one, at most kPiece; the last of them becomes the phase.
    void StepAndTakeSines(double* sines, int frames) {
        const double sine = std::sin(m_phase), cosine = std::cos(m_phase);
        const double *cosines = m_cosines.data() + 1, *sinesOfTurns = m_sines.data() + 1;
        for (int i = 0; i < frames; ++i) sines[i] = sine * cosines[i] + cosine * sinesOfTurns[i];
        m_phase = PhaseAfter(m_phase, m_increment, frames);
    }

    // Steps up to `frames` times; ends early with the step that reaches `cycle`, which is taken off the
    // phase. Returns how often.
    int StepWithin(double cycle, int frames) {
        const double end = PhaseAfter(m_phase, m_increment, frames);
        if (end < cycle) {
            m_phase = end;
            return frames;
        }
        int taken = 1;
        for (m_phase += m_increment; m_phase < cycle; ++taken) m_phase += m_increment;
        m_phase -= cycle;
        return taken;
    }
    // Cosines and sines of 0 to kPiece increments, for those who turn by themselves.
    const double* TurnedCosines() const { return m_cosines.data(); }
    const double* TurnedSines() const { return m_sines.data(); }

private:
    double m_phase = 0.0, m_increment = 0.0;
    // Of 0, 1, 2 ... kPiece increments; the turn by nothing is what others are built from.
    std::array<double, kPiece + 1> m_cosines = AllOnes(), m_sines{};

    static constexpr std::array<double, kPiece + 1> AllOnes() {
        std::array<double, kPiece + 1> ones{};
        ones.fill(1.0);
        return ones;
    }
};

}  // namespace Corvo::DSP
