#include "DSP/Resampler/Dither.h"

#include <gtest/gtest.h>

#include <cmath>
#include <complex>
#include <numbers>
#include <vector>

#include "DSP/Resampler/SamplingFrequencyConverter.h"
#include "Support/Signals.h"

namespace {

int g_draws = 0;
int Sequence() { return g_draws++ * 7919 % 32768; }

// While it lives, the random numbers are known.
struct KnownRandom {
    KnownRandom() : previous(SetDitherRandom(Sequence)) { g_draws = 0; }
    ~KnownRandom() { SetDitherRandom(previous); }
    DitherRandom previous;
};

TEST(DitherTest, FeedsBackTheErrorsOfEarlierSamples) {
    const KnownRandom known;
    auto dither = MakeDither(DitherCurve::Gentle, 24);
    std::vector<double> errors;  // newest last
    for (int i = 0; i < 40; ++i) {
        const double v = 0.3 * std::sin(i * 0.2);
        double shaped = v;
        for (std::size_t k = 0; k < 5 && k < errors.size(); ++k)
            shaped += dither.coefficients[k] * errors[errors.size() - 1 - k];
        const double r1 = 2 * i * 7919 % 32768, r2 = (2 * i + 1) * 7919 % 32768;
        const double expected = shaped + (r1 + r2 - 32767) * dither.amplitude;
        ASSERT_NEAR(ApplyDither(dither, v), expected, 1e-15) << i;
        errors.push_back(std::trunc(expected * 8388608) / 8388608 - shaped);
    }
}

// A shaper moves noise, it cannot remove any: the logarithm of a minimum-phase curve averages to 0. It
// must be deep where the ear is keen. Catches a coefficient typed wrong and a flipped sign.
TEST(DitherTest, CurvesDipWhereTheEarIsKeen) {
    for (const auto curve : {DitherCurve::Gentle, DitherCurve::Strong}) {
        const auto dither = MakeDither(curve, 16);
        const auto response = [&](double hz) {
            std::complex<double> sum = 1.0;
            for (int k = 0; k < dither.shapingOrder; ++k)
                sum += dither.coefficients[static_cast<std::size_t>(k)] *
                       std::polar(1.0, -2.0 * std::numbers::pi * hz / 44100 * (k + 1));
            return 20 * std::log10(std::abs(sum));
        };
        double mean = 0.0;
        for (int i = 0; i < 2000; ++i) mean += response((i + 0.5) * 22050 / 2000) / 2000;
        EXPECT_NEAR(mean, 0.0, 0.05);
        EXPECT_LT(response(3800), curve == DitherCurve::Gentle ? -9.0 : -15.0);
        EXPECT_GT(response(20000), 10.0);
    }
}

// Channel by channel, as hosts that feed a sequence of their own expect, and each with its own state.
TEST(DitherTest, ConverterDrawsTwoNumbersASampleChannelByChannel) {
    const KnownRandom known;
    SamplingFrequencyConverter converter;
    converter.InitConversionByFactors(1, 1);
    converter.Init(2);
    CDither<double> dither[] = {MakeDither(DitherCurve::Flat, 16), MakeDither(DitherCurve::Flat, 24)};
    double in[6]{}, out[6]{};
    converter.sfreq_conversion_core_block<tipo_doublebit, tipo_doublebit_outd>(
        3, reinterpret_cast<char*>(in), reinterpret_cast<char*>(out), 2, 16, 16, dither);
    converter.FreeRings();
    for (int channel = 0; channel < 2; ++channel)
        for (int i = 0; i < 3; ++i) {
            const int draw = 2 * (3 * channel + i);
            const double sum = draw * 7919 % 32768 + (draw + 1) * 7919 % 32768;
            EXPECT_DOUBLE_EQ(out[2 * i + channel], (sum - 32767) / 32767 / (channel == 0 ? 32768 : 8388608));
        }
    auto off = MakeDither(DitherCurve::None, 16);
    EXPECT_EQ(ApplyDither(off, 0.25), 0.25);
    EXPECT_EQ(g_draws, 12);
    EXPECT_FALSE(MakeDither(DitherCurve::Strong, 32).enabled);
}

// What a word-length reduction adds, in steps squared: truncation towards zero errs by 1/3, triangular dither
// adds 1/6. With the platform's random numbers.
TEST(DitherTest, NoiseFloorIsTruncationPlusTriangle) {
    for (const auto curve : {DitherCurve::None, DitherCurve::Flat}) {
        auto dither = MakeDither(curve, 16);
        double sum = 0.0;
        for (const double x : TestSupport::Sine<double>(20000, 997.0, 44100, 0.7))
            sum += std::pow(std::trunc(ApplyDither(dither, x) * 32768) - x * 32768, 2);
        EXPECT_NEAR(sum / 20000, curve == DitherCurve::None ? 1.0 / 3 : 1.0 / 3 + 1.0 / 6, 0.01);
    }
}

}  // namespace
