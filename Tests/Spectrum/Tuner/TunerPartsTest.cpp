#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <vector>

#include "Spectrum/Tuner/HarmonicProduct.h"
#include "Spectrum/Tuner/SpectrumFloor.h"
#include "Support/Signals.h"

namespace {

using Corvo::HarmonicProduct;

// Each overtone counts as 1 at least, the fundamental as it is.
TEST(HarmonicProductTest, MultipliesCompressedSpectra) {
    const std::vector<float> spectrum{2, 0.5f, 0.25f, 10, 4, 3, 8, 1, 6, 1.5f, 7, 7};
    HarmonicProduct product;
    product.HarmonicProductSepctrumComputation(spectrum, 3, false);
    EXPECT_EQ(product.Values(), (std::vector<double>{8, 0.5 * 1 * 10, 0.25 * 4 * 8, 10 * 8 * 1.5}));
    product.HarmonicProductSepctrumComputation(spectrum, 3, true);
    EXPECT_EQ(product.Values(), (std::vector<double>{2, 0.5 * 1 * 5, 0.25 * 2 * 4, 10 * 4 * 1}));
}

TEST(HarmonicProductTest, SearchesAPeakBetweenValleys) {
    struct Case {
        const char* fault;
        std::vector<float> values;
        int start, end;
        double limit;
        int bin;
        double prominence;
    };
    constexpr double kInfinite = std::numeric_limits<double>::infinity(), kUneven = 20.0 - 4.515449934959718;
    // clang-format off
    for (const Case& c : {
             Case{"misses the peak",                      {9, 1, 5, 100, 4, 1, 9},         0, 7, 20.0,    3, 20.0},
             Case{"accepts less than the limit",          {9, 1, 5, 100, 4, 1, 9},         0, 7, 20.001, -1, 0.0},
             Case{"takes the deeper of two valleys",      {9, 1, 8, 4, 100, 2, 8, 1, 9},   0, 9, 0.0,     4, kUneven},
             Case{"wants valleys deeper than both sides", {9, 4, 4, 100, 2, 2, 9},         0, 7, 0.0,     3, kUneven},
             Case{"takes the last bin for a valley",      {9, 1, 5, 100, 4},               0, 5, 0.0,    -1, 0.0},
             Case{"takes the first bin for a valley",     {1, 100, 1, 9, 1, 9},            0, 6, 0.0,    -1, 0.0},
             Case{"searches outside the range",           {1000, 1, 9, 1, 100, 1, 999},    1, 6, 0.0,     4, 20.0},
             Case{"refuses a clean tone",                 {9, 0, 100, 0, 9},               0, 5, 55.0,    2, kInfinite},
             Case{"reads outside",                        {9, 1, 100, 1, 9},              -5, 50, 0.0,    2, 20.0},
             Case{"searches nothing",                     {9, 1, 100, 1, 9},               4, 3, 0.0,    -1, 0.0},
         }) {
        // clang-format on
        HarmonicProduct product;  // of a single spectrum: the spectrum
        product.HarmonicProductSepctrumComputation(c.values, 1, false);
        double prominence = -1.0;
        EXPECT_EQ(product.SearchMaximunInRange(c.start, c.end, c.limit, prominence), c.bin) << c.fault;
        EXPECT_TRUE(prominence == c.prominence || std::abs(prominence - c.prominence) < 1e-9) << c.fault;
    }
}

// The floor is the mean power of white noise, and no more than the rest's when half the bins are peaks.
TEST(SpectrumFloorTest, FindsTheNoiseBelowThePeaks) {
    constexpr std::size_t kBins = 4096;
    TestSupport::Random random;
    std::vector<float> power(kBins), floor(kBins);
    Corvo::SpectrumFloor measure;
    measure.Prepare(kBins, 1.0);
    for (const bool tones : {false, true}) {
        double sum = 0.0;
        for (int frame = 0; frame < 50; ++frame) {
            for (std::size_t k = 0; k < kBins; ++k)
                power[k] =
                    tones && k % 10 < 5 ? 1e6f : static_cast<float>(-3.0 * std::log(1.0 - random.Unit()));
            measure.Measure(power, floor);
            for (const float value : floor) sum += value / (50.0 * kBins * 3.0);
        }
        // Half the bins gone, the quarter is the half of those that are left: ln 2 instead of ln 4/3.
        const double expected = tones ? std::log(2.0) / std::log(4.0 / 3.0) : 1.0;
        EXPECT_NEAR(10.0 * std::log10(sum / expected), 0.0, 1.0);
    }
}

}  // namespace
