#include "DSP/Equalizer/BiquadDesign.h"

#include <algorithm>
#include <cmath>
#include <numbers>

#include "DSP/Equalizer/BiquadSection.h"

namespace Corvo::DSP {
namespace {

constexpr double kPi = std::numbers::pi;
// Two slightly different roots of two, and 3 dB factors that are not quite a half and two: saved settings
// sound the way these digits make them sound.
constexpr double kSqrt2Pass = 1.414213562373;
constexpr double kSqrt2Butterworth = 1.4142135623930951;
constexpr double kHalf = 0.4999999999999999, kTwice = 2.0000000000000004;
constexpr double kNoDifference = 1.65436e-24;
constexpr double kOctavesPerQ = 0.002605816468270471;  // ln 2 / 266
constexpr double kQUnit = 0.02;
constexpr double kSteepestSlope = 3.0;

struct Polynomial {
    double p0, p1, p2;
};

double Decibels(double gain) { return 20.0 * std::log10(gain); }

BiquadSection Peak(double gain, double freq, double Q, double rate) {
    // The centre goes through the bilinear warping, which pulls high frequencies down.
    const double w = 2.0 * std::atan(kPi * freq / rate);
    const double s = std::sin(w), c = std::cos(w);
    const double alpha = std::sinh(Q * kOctavesPerQ * (w / s)) * s;
    const double A = std::sqrt(gain);
    const double n = 1.0 / (1.0 + alpha / A);
    const double middle = -2.0 * c * n;
    return {(1.0 + alpha * A) * n, middle, (1.0 - alpha * A) * n, middle, (1.0 - alpha / A) * n};
}

BiquadSection Shelf(bool high, double gain, double freq, double Q, double rate) {
    const double A = std::pow(10.0, Decibels(gain) * 0.025);
    const double w = 2.0 * kPi * freq / rate;
    const double s = std::sin(w), c = std::cos(w);
    const double slope = std::min(Q * kQUnit, kSteepestSlope);
    const double X = std::max((A + 1.0 / A) / slope - (A + 1.0 / A) + 2.0, 0.0);
    const double beta = s * std::sqrt(A * X);
    const double up = A + 1.0, down = A - 1.0;
    if (high) {
        const double a0 = up - down * c + beta;
        return {A * (up + down * c + beta) / a0, -2.0 * A * (down + up * c) / a0,
                A * (up + down * c - beta) / a0, 2.0 * (down - up * c) / a0, (up - down * c - beta) / a0};
    }
    const double a0 = up + down * c + beta;
    return {A * (up - down * c + beta) / a0, 2.0 * A * (down - up * c) / a0, A * (up - down * c - beta) / a0,
            -2.0 * (down + up * c) / a0, (up + down * c - beta) / a0};
}

// Half of a Butterworth shelf with its corner at a quarter of the sample rate.
Polynomial Prototype(double g) {
    return {g * g + 1.0 + kSqrt2Butterworth * g, -2.0 * (1.0 - g * g), g * g + 1.0 - kSqrt2Butterworth * g};
}

// Moves the corner by an all-pass: 1/z becomes (1/z + t) / (1 + t/z).
Polynomial Moved(const Polynomial& p, double t) {
    return {p.p0 + p.p1 * t + p.p2 * t * t, 2.0 * t * (p.p0 + p.p2) + (1.0 + t * t) * p.p1,
            p.p0 * t * t + p.p1 * t + p.p2};
}

BiquadSection ButterworthShelf(bool high, double gain, double freq, double rate) {
    const double t = std::tan(kPi * (freq / rate - 0.25));
    const double dB = Decibels(gain);
    const double G = std::pow(10.0, dB * 0.05);
    // The squared gain at the corner: half way for small boosts, else 3 dB from the plateau.
    const double cornerSquared = dB > -6.0 && dB < 6.0 ? G : G * G * (G > 1.0 ? kHalf : kTwice);
    const double D = G * G - cornerSquared;
    const double e = std::abs(D) <= kNoDifference ? 1.0 : std::sqrt(std::sqrt((cornerSquared - 1.0) / D));
    const double g = std::sqrt(G) * e;
    const Polynomial N = Moved(Prototype(g), t), P = Moved(Prototype(e), t);
    if (high) return {G * P.p0 / N.p0, G * P.p1 / N.p0, G * P.p2 / N.p0, N.p1 / N.p0, N.p2 / N.p0};
    return {N.p0 / P.p0, N.p1 / P.p0, N.p2 / P.p0, P.p1 / P.p0, P.p2 / P.p0};
}

BiquadSection Pass(bool high, double gain, double freq, double Q, double rate) {
    const double omega = 2.0 * rate * std::tan(kPi * freq / rate);
    const double r = 2.0 * (kSqrt2Pass / (Q * kQUnit)) / omega;
    const double u = 1.0 / (omega * omega);
    const double a0 = (r + 4.0 * u * rate) * rate + 1.0;
    const double outer = high ? 4.0 * rate * rate * u : 1.0;
    const double middle = high ? -8.0 * rate * rate * u : 2.0;
    return {outer * gain / a0, middle * gain / a0, outer * gain / a0, (2.0 - 8.0 * rate * rate * u) / a0,
            (4.0 * u * rate * rate - r * rate + 1.0) / a0};
}

}  // namespace

BiquadSection DesignBiquad(EQFilterType type, double gain, double freq, double Q, double rate) {
    switch (type) {
        case EQ_PEAK:
            return Peak(gain, freq, Q, rate);
        case EQ_LOWSHELF:
        case EQ_HIGHSHELF:
            return Shelf(type == EQ_HIGHSHELF, gain, freq, Q, rate);
        case EQ_LOWSHELF_BUTTERWORTH:
        case EQ_HIGHSHELF_BUTTERWORTH:
            return ButterworthShelf(type == EQ_HIGHSHELF_BUTTERWORTH, gain, freq, rate);
        default:
            return Pass(type != EQ_LOWPASS, gain, freq, Q, rate);
    }
}

template <typename Parameter>
void CalcolaCoefficientiBiquad(EQFilterType type, double gain, long freq, long Q,
                               coeff<Parameter>* coefficients, int sampleRate, bool immediate) {
    DesignBiquad(type, gain, static_cast<double>(freq), static_cast<double>(Q), sampleRate)
        .HandTo(*coefficients, immediate);
}

template DSP_API void CalcolaCoefficientiBiquad(EQFilterType, double, long, long, coeff<SmoothCoefficient>*,
                                                int, bool);
template DSP_API void CalcolaCoefficientiBiquad(EQFilterType, double, long, long, coeff<ManagedCoefficient>*,
                                                int, bool);

}  // namespace Corvo::DSP
