#include "Spectrum/kivspectrum.h"

#include <cmath>
#include <complex>
#include <numbers>
#include <tuple>

#include "Spectrum/AnalyserFixture.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"

namespace {

using Complex = std::complex<double>;

class kivspectrumTest : public AnalyserFixture {};

double Window(int type, double turn) {
    constexpr double kTerms[5][3] = {{1, 0, 0}, {}, {0.5, 0.5, 0}, {0.54, 0.46, 0}, {0.42, 0.5, 0.08}};
    if (type == 1) return 1.0 - std::abs(2.0 * turn - 1.0);
    const auto cosine = [&](double n) { return std::cos(2.0 * std::numbers::pi * n * turn); };
    return kTerms[type][0] - kTerms[type][1] * cosine(1) + kTerms[type][2] * cosine(2);
}

// A sine between two bins, by the transform's definition: every bin around it, and what is read off as its
// peak. Catches a wrong window, scale, bin or padding.
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
            const auto sine = TestSupport::Sine<float>(kLength, kBin * kRate / kLength, kRate, kAmplitude);
            Feed(analyser, sine);
            ASSERT_TRUE(Prepare(analyser, kRate));
            double sum = 0.0;
            for (int i = 0; i < kLength; ++i) sum += Window(type, 1.0 * i / kLength);
            for (int k = 95 * padding; k <= 106 * padding; ++k) {
                Complex bin = 0.0;
                for (int i = 0; i < kLength; ++i)
                    bin += Window(type, 1.0 * i / kLength) *
                           static_cast<double>(sine[static_cast<std::size_t>(i)]) *
                           std::polar(1.0, -2.0 * std::numbers::pi * k * i / (kLength * padding));
                EXPECT_NEAR(analyser.GetPower()[static_cast<std::size_t>(k)], std::norm(bin),
                            1e-5 * std::norm(kAmplitude / 2.0 * sum))
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
