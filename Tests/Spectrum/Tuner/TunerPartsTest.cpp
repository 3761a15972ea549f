#include <gtest/gtest.h>

#include <vector>

#include "Spectrum/Tuner/HarmonicProduct.h"

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
    };
    // clang-format off
    for (const Case& c : {
             Case{"misses the peak",                 {9, 1, 5, 100, 4, 1, 9},       0, 7, 20.0,                3},
             Case{"accepts less than the limit",     {9, 1, 5, 100, 4, 1, 9},       0, 7, 20.001,             -1},
             Case{"takes the deeper of two valleys", {9, 1, 8, 4, 100, 2, 8, 1, 9}, 0, 9, 15.4846,            -1},
             Case{"averages the valleys otherwise",  {9, 1, 8, 4, 100, 2, 8, 1, 9}, 0, 9, 15.4845,             4},
             Case{"takes the last bin for a valley", {9, 1, 5, 100, 4},             0, 5, 0.0,                -1},
             Case{"takes the first for a valley",    {1, 100, 1, 9, 1, 9},          0, 6, 0.0,                -1},
             Case{"searches outside the range",      {1000, 1, 9, 1, 100, 1, 999},  1, 6, 0.0,                 4},
             Case{"reads outside",                   {9, 1, 100, 1, 9},            -5, 50, 0.0,                2},
             Case{"searches nothing",                {9, 1, 100, 1, 9},             4, 3, 0.0,                -1},
         }) {
        // clang-format on
        HarmonicProduct product;  // of a single spectrum: the spectrum
        product.HarmonicProductSepctrumComputation(c.values, 1, false);
        double prominence = -1.0;
        EXPECT_EQ(product.SearchMaximunInRange(c.start, c.end, c.limit, prominence), c.bin) << c.fault;
        EXPECT_EQ(prominence > 0.0, c.bin > 0) << c.fault;
    }
}

}  // namespace
