#include <algorithm>
#include <cmath>
#include <limits>

#include "Spectrum/AnalyserFixture.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"

namespace {

constexpr int kRate = 48000, kLength = 4096;
constexpr double kPerBin = static_cast<double>(kRate) / kLength;

class SpectrumPeakTest : public AnalyserTest {
protected:
    struct Tone {
        double bin, level;  // dB
    };
    Corvo::SpectrumPeak PeakOf(std::initializer_list<Tone> tones, double lowestHz = 0.0) {
        Settings().time_smoothing = 0;
        kivspectrum analyser;
        analyser.SetOn(true);
        std::vector<float> sum(kLength, 0.0f);
        for (const auto& [bin, level] : tones) {
            const auto sine =
                TestSupport::Sine<float>(kLength, bin * kPerBin, kRate, std::pow(10.0, level / 20.0));
            for (std::size_t i = 0; i < sum.size(); ++i) sum[i] += sine[i];
        }
        Feed(analyser, sum);
        EXPECT_TRUE(Prepare(analyser, kRate));
        return analyser.GetSpectrumDrawer()->HighestPeak(lowestHz);
    }
};

// Catches a peak read from another bin, between the wrong two, or at a level that is not the sine's. Next to
// 0 Hz and to half the rate a sine's own image reaches into its bin, at most -20 dB below it.
TEST_F(SpectrumPeakTest, IsWhereTheSineIs) {
    for (const double bin : {1.0, 2.0, 3.0, 10.0, 85.0, 85.3, 511.5, 1000.8, 2040.0, 2046.0, 2047.0})
        for (const double level : {0.0, -50.0}) {
            const bool end = bin < 4.0 || bin > 2044.0;
            const auto peak = PeakOf({{bin, level}});
            EXPECT_NEAR(peak.frequency / kPerBin, bin, end ? 0.35 : 0.06) << bin;
            EXPECT_NEAR(peak.level, level, end ? 1.0 : 0.15) << bin;
        }
}

// Catches what leaks from a louder sine below the lowest frequency, a limit taken in another unit, and
// peaks out of nothing.
TEST_F(SpectrumPeakTest, IsAboveTheLowestFrequency) {
    const std::initializer_list<Tone> tones{{3.0, 0.0}, {100.0, -30.0}};
    EXPECT_NEAR(PeakOf(tones).frequency / kPerBin, 3.0, 0.35);
    EXPECT_NEAR(PeakOf(tones, 3.0 * kPerBin).frequency / kPerBin, 3.0, 0.35);
    for (const double lowest : {3.1, 4.0, 5.0, 50.0, 100.0})
        EXPECT_NEAR(PeakOf(tones, lowest * kPerBin).frequency / kPerBin, 100.0, 0.06) << lowest;
    for (const double lowest : {101.0 * kPerBin, 1e300, std::numeric_limits<double>::infinity()})
        EXPECT_LT(PeakOf(tones, lowest).level, -80.0) << lowest;
    EXPECT_EQ(PeakOf({}).level, -300.0);
    EXPECT_EQ(PeakOf({}).frequency, 0.0);
}

}  // namespace
