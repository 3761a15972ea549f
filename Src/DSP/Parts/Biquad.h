#pragma once

#include <algorithm>
#include <cmath>
#include <numbers>

namespace Corvo::DSP {

// A second-order section, transposed direct form II. The designs are the bilinear transforms of the analogue
// low- and high-pass of the same resonance; `hz` is limited to below half the rate.
class Biquad {
public:
    static Biquad LowPass(double hz, double q, double rate) { return Design(-1.0, hz, q, rate); }
    static Biquad HighPass(double hz, double q, double rate) { return Design(1.0, hz, q, rate); }
    // Resonances of the two sections that make a Butterworth filter of fourth order.
    static constexpr double kFirstOfFour = 0.5411961001461969, kSecondOfFour = 1.3065629648763764;

    void Clear() { m_z1 = m_z2 = 0.0; }
    double operator()(double x) {
        const double y = m_b0 * x + m_z1;
        m_z1 = m_b1 * x - m_a1 * y + m_z2;
        m_z2 = m_b0 * x - m_a2 * y;
        return y;
    }

private:
    static Biquad Design(double sign, double hz, double q, double rate) {
        constexpr double kHighestShare = 0.45;
        const double w = 2.0 * std::numbers::pi * std::min(hz / rate, kHighestShare);
        const double cosine = std::cos(w), alpha = std::sin(w) / (2.0 * q), scale = 1.0 / (1.0 + alpha);
        Biquad section;
        section.m_b0 = (1.0 + sign * cosine) / 2.0 * scale;
        section.m_b1 = -sign * 2.0 * section.m_b0;
        section.m_a1 = -2.0 * cosine * scale;
        section.m_a2 = (1.0 - alpha) * scale;
        return section;
    }

    double m_b0 = 1.0, m_b1 = 0.0, m_a1 = 0.0, m_a2 = 0.0;
    double m_z1 = 0.0, m_z2 = 0.0;
};

}  // namespace Corvo::DSP
