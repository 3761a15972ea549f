#include "Spectrum/kivspectrum.h"

#include <cmath>
#include <complex>
#include <numbers>
#include <tuple>

#include "Spectrum/AnalyserFixture.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"

namespace {

using Complex = std::complex<double>;

class kivspectrumTest : public AnalyserTest {};

// Transforms of the windows at `bins` bins of their own, by their definitions.
Complex Rectangle(double bins, double length) {
    const double x = std::numbers::pi * bins;
    const double size = std::abs(bins) < 1e-9 ? length : std::sin(x) / std::sin(x / length);
    return std::polar(size, -x * (length - 1.0) / length);
}
Complex WindowTransform(int type, double bins, double length) {
    // A triangle is a rectangle of half the length folded with itself, one sample late.
    if (type == 1)
        return std::pow(Rectangle(bins / 2.0, length / 2.0), 2) *
               std::polar(2.0 / length, -2.0 * std::numbers::pi * bins / length);
    constexpr double kTerms[5][3] = {{1, 0, 0}, {}, {0.5, -0.5, 0}, {0.54, -0.46, 0}, {0.42, -0.5, 0.08}};
    Complex sum = kTerms[type][0] * Rectangle(bins, length);
    for (const int n : {1, 2})
        sum += kTerms[type][n] / 2.0 * (Rectangle(bins - n, length) + Rectangle(bins + n, length));
    return sum;
}

// A sine between two bins, by closed form: every bin around it, and what is read off as its peak. Catches a
// wrong window, scale, bin or padding.
TEST_F(kivspectrumTest, ShowsASineThroughItsWindow) {
    constexpr int kRate = 48000, kLength = 1024;
    constexpr double kBin = 100.3, kAmplitude = 0.25;
    for (int type = 0; type < 5; ++type)
        for (const int padding : {1, 4}) {
            Settings() = {};
            Settings().window_type = type;
            Settings().window_length = kLength;
            Settings().fft_length_auto = 0;
            Settings().fft_length = kLength * padding;
            Settings().time_smoothing = 0;
            kivspectrum analyser;
            analyser.SetOn(true);
            Feed(analyser, TestSupport::Sine<float>(kLength, kBin * kRate / kLength, kRate, kAmplitude));
            ASSERT_TRUE(Prepare(analyser, kRate));
            const double peak = std::norm(kAmplitude / 2.0 * WindowTransform(type, 0.0, kLength));
            for (int k = 95 * padding; k <= 106 * padding; ++k) {
                const double at = static_cast<double>(k) / padding;
                const Complex bin =
                    kAmplitude / Complex(0.0, 2.0) *
                    (WindowTransform(type, at - kBin, kLength) - WindowTransform(type, at + kBin, kLength));
                EXPECT_NEAR(analyser.GetPower()[static_cast<std::size_t>(k)], std::norm(bin), 1e-5 * peak)
                    << "window " << type << ", bin " << k << " of " << padding;
            }
            if (type < 2) continue;  // a parabola fits the lobes of the others
            const auto read = analyser.GetSpectrumDrawer()->HighestPeak();
            EXPECT_NEAR(read.frequency * kLength / kRate, kBin, 0.03) << type;
            EXPECT_NEAR(read.level, 20.0 * std::log10(kAmplitude), 0.2) << type;
        }
}

TEST_F(kivspectrumTest, DerivesTheHopFromTheOverlap) {
    for (const auto& [overlap, stored, hop] : {std::tuple{1.0f, 0.99f, 40},
                                               {-1.0f, -1.0f, 8192},
                                               {0.995f, 0.995f, 40},
                                               {std::nanf(""), 0.99f, 40}}) {
        kivspectrum::SetAnalysisWindowsOverlap(overlap);
        EXPECT_EQ(Settings().overlap, stored) << overlap;
        EXPECT_EQ(Settings().hop_length, hop) << overlap;
    }
}

}  // namespace
