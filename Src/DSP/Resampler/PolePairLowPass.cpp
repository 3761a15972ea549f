#include "DSP/Resampler/PolePairLowPass.h"

#include <cmath>
#include <complex>
#include <numbers>

namespace {

// Designed in extended precision: the poles crowd around 1, and what is left of the tables after rounding
// to double is then exact to the last bit.
using Real = long double;
using Complex = std::complex<Real>;

constexpr std::size_t kOrder = 2 * PolePairLowPass::kPairs;
using Poles = std::array<Complex, kOrder>;

// In the s-plane, scaled for the bilinear transform z = (2 + s) / (2 - s).
Poles ButterworthPoles(Real cutoff) {
    constexpr auto pi = std::numbers::pi_v<Real>;
    const Real radius = 2 * std::tan(pi * cutoff);
    Poles poles;
    std::size_t found = 0;
    for (std::size_t i = 0; i < 2 * kOrder; ++i) {
        const Real angle = (static_cast<Real>(i) * pi + pi / 2) / kOrder;
        if (std::cos(angle) < 0) poles[found++] = radius * Complex(std::cos(angle), std::sin(angle));
    }
    return poles;
}

Complex ToZ(Complex s) { return (Real(2) + s) / (Real(2) - s); }

// Differences of poles in the z-plane, without the cancellation next to 1.
Complex Distance(Complex a, Complex b) { return Real(4) * (a - b) / ((Real(2) - a) * (Real(2) - b)); }
Complex DistanceToOne(Complex s) { return Real(-2) * s / (Real(2) - s); }

std::array<double, kOrder + 1> NegatedDenominator(const Poles& poles) {
    std::array<Complex, kOrder + 1> polynomial{Complex(1)};
    for (std::size_t degree = 0; degree < kOrder; ++degree) {
        const Complex pole = ToZ(poles[degree]);
        for (std::size_t i = degree + 1; i > 0; --i) polynomial[i] = polynomial[i - 1] - pole * polynomial[i];
        polynomial[0] *= -pole;
    }
    std::array<double, kOrder + 1> negated;
    for (std::size_t i = 0; i <= kOrder; ++i) negated[i] = static_cast<double>(-polynomial[i].real());
    return negated;
}

void PutTwice(double* where, Real value) { where[0] = where[1] = static_cast<double>(value); }

}  // namespace

PolePairLowPass::PolePairLowPass(int upFactor, double cutoff) {
    const Poles poles = ButterworthPoles(cutoff);
    const auto steps = static_cast<std::size_t>(upFactor);
    phases.resize(steps * kRow);
    for (std::size_t j = 0; j < steps; ++j) PutTwice(&phases[j * kRow + kLanes], Real(-0.0));

    Complex unityAtDc = 1, product = 1;
    Real delay = Real(kOrder) / 2;
    for (const Complex s : poles) {
        unityAtDc *= DistanceToOne(s) / Real(2);
        product *= ToZ(s);
        delay += (ToZ(s) / DistanceToOne(s)).real();
    }
    const Real scale = std::abs(unityAtDc);
    gain = static_cast<double>(1 / scale);
    groupDelay = static_cast<double>(delay);
    feedback = NegatedDenominator(poles);
    PutTwice(phases.data(), static_cast<Real>(upFactor) * scale / product.real());

    std::size_t pair = 0;
    for (const Complex s : poles) {
        if (s.imag() < 0) continue;
        const Complex pole = ToZ(s);
        Complex residue = scale / pole;
        for (std::size_t i = 0; i < kOrder; ++i) residue *= pole + Real(1);
        for (const Complex other : poles)
            if (other != s) residue /= Distance(s, other);
        Complex over = 1;  // p^L: over all steps between two samples
        for (std::size_t j = 0; j < steps; ++j) over *= pole;
        PutTwice(&advance[ValueAt(pair)], std::norm(Real(1) - over));
        PutTwice(&advance[ChangeAt(pair)], std::norm(over));
        Complex factor = static_cast<Real>(2 * upFactor) * residue;
        for (std::size_t j = 0; j < steps; ++j, factor *= pole) {
            double* row = &phases[j * kRow];
            PutTwice(row + ValueAt(pair), (factor * std::conj(Real(1) - over)).real());
            PutTwice(row + ChangeAt(pair), (factor * std::conj(over)).real());
        }
        ++pair;
    }
}
