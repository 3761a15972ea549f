#pragma once

#include "DSP/Pitch/ClassicKernel.h"

// Loops that the compiler makes vectors of. Included by one source file per instruction set, which is
// compiled for it; everything is local to that file, so that no copy is shared between instruction sets.
namespace Corvo::DSP::ClassicPitch {

namespace {

constexpr double kPi = 3.141592653589793;

// To the nearest integer for |x| below 2^51.
inline double Nearest(double x) {
    constexpr double kShift = 6755399441055744.0;
    return x + kShift - kShift;
}

// Cosine to 1e-10, which is far below the float that becomes of it, for |x| up to a little over pi. Without a
// call, so that the loop around it fills the registers.
inline double Cosine(double x) {
    const double halfTurns = Nearest(x * (1.0 / kPi));  // -1, 0 or 1
    const double r = x - halfTurns * kPi, r2 = r * r;
    constexpr double kTerms[] = {1.0 / 479001600.0, -1.0 / 3628800.0, 1.0 / 40320.0,
                                 -1.0 / 720.0,      1.0 / 24.0,       -0.5};
    double sum = -1.0 / 87178291200.0;
    for (const double term : kTerms) sum = sum * r2 + term;
    const double cosine = 1.0 + sum * r2;
    return halfTurns == 0.0 ? cosine : -cosine;
}

template <typename Number>
void Analyse(const Analysis<Number>& a, std::size_t bins) {
    const auto count = static_cast<std::int32_t>(bins);
    for (std::int32_t k = 0; k < count; ++k) {
        const auto value = static_cast<float>(static_cast<double>(a.input[k]) * a.window[k]);
        const auto bits = __builtin_bit_cast(std::int32_t, value);  // the sign of -0 counts too
        const bool changed = (bits ^ a.last[k]) < 0;
        const Number same = a.steady[k], down = a.fell[k], up = a.rose[k];
        const Number moved = bits < 0 ? down : up;
        a.last[k] = bits;
        a.found[k] = changed ? moved : same;
    }
    // A loop of its own: with too many arrays to tell apart the compiler makes no vectors.
    for (std::int32_t k = 0; k < count; ++k)
        a.strength[k] = 2.0f * __builtin_fabsf(__builtin_bit_cast(float, a.last[k]));
}

void Place(const Placement& p, std::size_t bins) {
    const auto count = static_cast<std::int32_t>(bins);
    const auto beyond = static_cast<float>(count);
    for (std::int32_t k = 0; k < count; ++k) {
        const float place = static_cast<float>(k) * p.pitch;
        p.target[k] = static_cast<std::int32_t>(place > -1.0f && place < beyond ? place : beyond);
    }
}

// A quotient whose divisor is a power of two is a product to the last bit, and much sooner there.
struct AnyDivisor {
    double value;
    double Under(double x) const { return x / value; }
};
struct PowerOfTwo {
    double inverse;
    explicit PowerOfTwo(double value) : inverse(1.0 / value) {}
    double Under(double x) const { return x * inverse; }
};

// run(divisor) with the quicker one.
template <typename Run>
void WithDivisor(double value, Run run) {
    const auto whole = static_cast<std::uint32_t>(value);
    if ((whole & (whole - 1)) == 0)
        run(PowerOfTwo(value));
    else
        run(AnyDivisor{value});
}

void TakeAdvance(const Advance& a, std::size_t bins) {
    WithDivisor(a.oversampling, [&](auto oversampling) {
        const double binWidth = a.binWidth, expected = a.expectedPhase;
        const auto count = static_cast<std::int32_t>(bins);
        for (std::int32_t k = 0; k < count; ++k) {
            const auto bin = static_cast<double>(a.target[k]);
            const auto frequency = static_cast<double>(a.frequency[k] * a.pitch);
            const double off = (frequency - bin * binWidth) / binWidth;
            a.advance[k] = oversampling.Under(off * (2.0 * kPi)) + bin * expected;
        }
    });
}

// Three short loops: in one long one a processor waits for the results of the few bins it has in hand.
void Synthesise(const Synthesis& s, std::size_t bins) {
    const auto count = static_cast<std::int32_t>(bins);
    for (std::int32_t k = 0; k < count; ++k) {
        const double sum = s.phase[k] + s.advance[k];
        s.phase[k] = sum - 2.0 * kPi * Nearest(sum * (0.5 / kPi));
    }
    for (std::int32_t k = 0; k < count; ++k)
        s.level[k] = static_cast<float>(static_cast<double>(s.level[k]) * Cosine(s.phase[k]));
    WithDivisor(s.scale, [&](auto scale) {
        for (std::int32_t k = 0; k < count; ++k) {
            const double added = scale.Under(2.0 * s.window[k] * static_cast<double>(s.level[k]));
            s.accumulator[k] = static_cast<float>(static_cast<double>(s.accumulator[k]) + added);
        }
    });
}

constexpr Kernels kKernels{Analyse<float>, Analyse<double>, Place, TakeAdvance, Synthesise};

}  // namespace
}  // namespace Corvo::DSP::ClassicPitch
