#include <gtest/gtest.h>

#include <vector>

#include "Spectrum/Fft/CorvoFFT.h"

namespace {

// Catches an inverse that goes, or changes its length, with a forward transform that is built anew; and one
// that stays when all is released.
TEST(CorvoFFTSetUp, ReplacesOnlyWhatItBuilds) {
    CorvoFFT fft;
    fft.Allocate(4, 1);
    fft.Allocate(2, 0);
    std::vector<double> points{1, 0, 2, 0, 3, 0, 4, 0};
    fft.DoFFT(points.data(), 0, 0);
    EXPECT_EQ(points, (std::vector<double>{3, 0, -1, 0, 3, 0, 4, 0}));
    points = {4, 0, 0, 0, 0, 0, 0, 0};
    fft.DoIFFT(points.data(), 0, 0);
    EXPECT_EQ(points, (std::vector<double>{1, 0, 1, 0, 1, 0, 1, 0}));
    fft.Free();
    fft.DoIFFT(points.data(), 0, 0);
    EXPECT_EQ(points, (std::vector<double>{1, 0, 1, 0, 1, 0, 1, 0}));
}

}  // namespace
