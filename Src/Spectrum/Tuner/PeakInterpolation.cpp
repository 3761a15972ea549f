#include "Spectrum/Tuner/PeakInterpolation.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <numbers>

namespace Corvo {
namespace {

enum WindowType { kRectangular, kTriangular, kHann, kHamming, kBlackman };

// a0 + a1 cos + a2 cos of the double, seen from the window's middle; half the width of the main lobe in bins
// of the window's own length.
struct CosineSum {
    double a0, a1, a2;
    double lobe;
};
constexpr std::array kCosineSums{
    CosineSum{1.0, 0.0, 0.0, 1.0},   CosineSum{1.0, 0.0, 0.0, 2.0},   CosineSum{0.5, 0.5, 0.0, 2.0},
    CosineSum{0.54, 0.46, 0.0, 2.0}, CosineSum{0.42, 0.5, 0.08, 3.0},
};
// The triangle is a rectangle of half the length folded with itself.
constexpr double kTriangleHalf = 0.5;

const CosineSum& SumOf(int type) { return kCosineSums[static_cast<std::size_t>(type)]; }

double Sinc(double x) {
    const double angle = std::numbers::pi * x;
    return std::abs(x) < 1e-9 ? 1.0 : std::sin(angle) / angle;
}

// A cosine in the window adds the rectangle's transform half as high one bin to either side.
template <typename Kernel>
double SumKernel(const CosineSum& w, double x, Kernel kernel) {
    return w.a0 * kernel(x) + 0.5 * w.a1 * (kernel(x - 1.0) + kernel(x + 1.0)) +
           0.5 * w.a2 * (kernel(x - 2.0) + kernel(x + 2.0));
}

}  // namespace

// Amplitude of the window's transform for long windows, scaled by its length.
double PeakInterpolation::Shape(double bins) const {
    const double x = bins * m_windowBins;
    if (m_windowType == kTriangular) return std::pow(Sinc(kTriangleHalf * x), 2.0) * kTriangleHalf;
    return SumKernel(SumOf(m_windowType), x, Sinc);
}

double PeakInterpolation::LobeWidth() const { return SumOf(m_windowType).lobe / m_windowBins; }

// The sidelobes' envelope: the sine that all terms share up to its sign, taken as 1.
double PeakInterpolation::Leakage(double bins) const {
    const double x = std::max(bins * m_windowBins, SumOf(m_windowType).lobe);
    const auto envelope = [](double at) { return 1.0 / (std::numbers::pi * at); };
    double amplitude = 0.0;
    if (m_windowType == kTriangular) {
        amplitude = std::pow(envelope(kTriangleHalf * x), 2.0) * kTriangleHalf;
    } else {
        // Shifted by one bin the sine changes its sign. Past the main lobe's edge, or a term is infinite.
        const double at = std::max(x, SumOf(m_windowType).lobe + 0.25);
        CosineSum signs = SumOf(m_windowType);
        signs.a1 = -signs.a1;
        amplitude = SumKernel(signs, at, envelope);
    }
    const double ratio = amplitude / Shape(0.0);
    return ratio * ratio;
}

double PeakInterpolation::Measure(double before, double at, double after) const {
    if (m_windowType == kRectangular) {
        const double larger = std::sqrt(std::max(before, after) / at);
        return after < before ? -larger : larger;
    }
    constexpr double kSmallest = std::numeric_limits<float>::min();
    const double a = std::log(std::max(before, kSmallest)), b = std::log(std::max(at, kSmallest)),
                 c = std::log(std::max(after, kSmallest));
    const double curvature = a - 2.0 * b + c;
    return curvature < 0.0 ? 0.5 * (a - c) / curvature : 0.0;
}

void PeakInterpolation::Prepare(int windowType, int windowLength, int fftLength) {
    m_windowType = windowType >= kRectangular && windowType <= kBlackman ? windowType : kBlackman;
    m_windowBins = std::clamp(static_cast<double>(windowLength) / fftLength, 1e-6, 1.0);
    const auto measured = [this](double offset) {
        const auto power = [this](double bins) { return std::pow(Shape(bins), 2.0); };
        return Measure(power(-1.0 - offset), power(-offset), power(1.0 - offset));
    };
    // Exactly between two bins, by symmetry, the parabola's top is there as well.
    m_lowestMeasure = measured(1e-9);
    m_measureStep = (measured(0.5) - m_lowestMeasure) / kSteps;
    for (int i = 0; i <= kSteps; ++i) {
        const double wanted = m_lowestMeasure + i * m_measureStep;
        double low = 0.0, high = 0.5;
        for (int halving = 0; halving < 40; ++halving) {
            const double middle = 0.5 * (low + high);
            (measured(middle) < wanted ? low : high) = middle;
        }
        m_offsets[static_cast<std::size_t>(i)] = 0.5 * (low + high);
    }
}

double PeakInterpolation::InterpolateMax(const float* peak) const {
    const double before = peak[-1], at = peak[0], after = peak[1];
    if (!(at > 0.0 && at >= before && at >= after)) return 0.0;
    const double measure = Measure(before, at, after);
    const double place =
        std::clamp((std::abs(measure) - m_lowestMeasure) / m_measureStep, 0.0, static_cast<double>(kSteps));
    const auto step = std::min(static_cast<std::size_t>(place), static_cast<std::size_t>(kSteps - 1));
    const double share = place - static_cast<double>(step);
    return std::copysign(m_offsets[step] + share * (m_offsets[step + 1] - m_offsets[step]), measure);
}

}  // namespace Corvo
