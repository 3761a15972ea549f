#include "Spectrum/Drawer/SpectrumDrawer.h"

#include <algorithm>
#include <cmath>
#include <numeric>

#include "Spectrum/AnalyserFixture.h"
#include "Spectrum/Drawer/VectorInterpolationFilterFloat.h"
#include "Spectrum/Scales/PowerToDecibels.h"

namespace {

using Record = kivspectrum::spectrum_settings;
using Values = std::vector<float>;

constexpr int kRate = 48000;

// With 8 bins and 100 analyses a second.
Record Small() {
    Record settings;
    settings.fft_length = settings.window_length = 16;
    settings.hop_length = 480;
    return settings;
}

// Every bin is fed these powers, one after the other.
Values Smoothed(const Record& settings, float coefficient, std::initializer_list<float> powers) {
    SpectrumDrawer drawer(settings);
    drawer.UpdateSamplingFrequency(kRate);
    VectorInterpolationFilterFloat filter;
    filter.Resize(settings.smoothing_filter_length, 8);
    Values smoothed;
    for (const float power : powers) {
        drawer.SmoothFftSpectrum(Values(8, power), coefficient, filter);
        smoothed.push_back(drawer.GetPowerSmoothed()[3]);
    }
    return smoothed;
}

// 100 analyses a second and a coefficient of 0.002 give alpha 0.2: rises take 0.32 of the way.
TEST(SpectrumDrawer, FollowsRisesFasterThanFalls) {
    const auto smoothed = Smoothed(Small(), 0.002f, {1.0f, 1.0f, 0.0f});
    EXPECT_NEAR(smoothed[1], 0.32 + 0.68 * 0.32, 1e-6);
    EXPECT_NEAR(smoothed[2], (0.32 + 0.68 * 0.32) * 0.8, 1e-6);
    Record held = Small();
    held.smoothing_type = 2;
    EXPECT_EQ(Smoothed(held, 0.002f, {1.0f, 0.25f}), (Values{0.0f, 0.0f}));
    held.time_smoothing = 0;
    EXPECT_EQ(Smoothed(held, 0.002f, {1.0f, 0.25f}), (Values{1.0f, 0.25f}));
}

// An impulse comes out as the weights, one age after the other: symmetric, highest in the middle, sum 1.
TEST(SpectrumDrawer, AveragesByAge) {
    for (const int spectra : {3, 15}) {
        Record settings = Small();
        settings.smoothing_type = 1;
        settings.smoothing_filter_length = spectra;
        const auto count = static_cast<std::size_t>(spectra);
        auto weights = Smoothed(settings, 1.0f, {1, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0});
        EXPECT_EQ(weights[count], 0.0f);
        weights.resize(count);
        EXPECT_NEAR(std::accumulate(weights.begin(), weights.end(), 0.0), 1.0, 1e-6) << spectra;
        EXPECT_EQ(std::max_element(weights.begin(), weights.end()) - weights.begin(), spectra / 2);
        for (std::size_t i = 0; i < count; ++i) EXPECT_NEAR(weights[i], weights[count - 1 - i], 1e-7);
    }
}

TEST(SpectrumDrawer, HoldsAndDropsPeaks) {
    const auto peakAfter = [&](int hold, int decay, int frames) {
        Record settings = Small();
        settings.peak_hold_mode = hold;
        settings.peak_decay_mode = decay;
        SpectrumDrawer drawer(settings);
        drawer.UpdateSamplingFrequency(kRate);
        VectorInterpolationFilterFloat none;
        drawer.SmoothFftSpectrum(Values(8, 1.0f), 1.0f, none);
        drawer.AgePeaks();
        drawer.SmoothFftSpectrum(Values(8, 0.5f), 1.0f, none);
        for (int i = 0; i < frames; ++i) drawer.AgePeaks();
        return drawer.GetPeaks()[5];
    };
    for (const auto& [decay, frames] : {std::pair{1, 90}, {2, 48}, {3, 30}}) {
        EXPECT_EQ(peakAfter(1, decay, frames), 1.0f);
        EXPECT_NEAR(peakAfter(1, decay, frames + 1), std::pow(10.0, -0.1), 1e-6);
        EXPECT_EQ(peakAfter(1, decay, 200), 0.5f);
    }
    EXPECT_EQ(peakAfter(1, 0, 1000) + peakAfter(2, 3, 1000), 2.0f) << "kept";
    EXPECT_EQ(peakAfter(0, 3, 1), 0.0f);
}

TEST(PowerToDecibels, IsTenLogarithms) {
    Values power{0.0f, -1.0f, std::nanf("")};
    for (double x = 1e-30; x < 1e30; x *= 1.0173) power.push_back(static_cast<float>(x));
    Values level(power.size());
    Corvo::PowerToDecibels(power.data(), level.data(), power.size(), 1.5f);
    for (std::size_t k = 0; k < power.size(); ++k)
        ASSERT_NEAR(level[k], k < 3 ? -298.5 : 10.0 * std::log10(power[k]) + 1.5, 1e-3) << power[k];
}

// What leaks from a louder sine below the lowest frequency is no peak, nor is the last bin; the first may be
// one.
TEST(SpectrumDrawer, FindsTheHighestPeak) {
    Record settings = Small();
    settings.time_smoothing = 0;
    settings.window_type = 0;  // full scale is a power of 64
    SpectrumDrawer drawer(settings);
    drawer.UpdateSamplingFrequency(16);  // a bin is 1 Hz wide
    VectorInterpolationFilterFloat none;
    for (const auto& [power, lowest, hz, decibels] : std::vector<std::tuple<Values, double, double, double>>{
             {{0, 64, 1, 0, 0, 0, 0, 0}, 0.0, 1.0, 0.0},
             {{99, 0, 0, 0, 0, 0, 0, 6.4f}, 0.0, 0.0, -300.0},
             {{0, 640, 40, 1, 6.4f, 1, 0, 0}, 1.1, 4.0, -10.0},
             {{0, 64, 1, 0, 0, 0, 0, 0}, std::nan(""), 1.0, 0.0},
             {{0, 0, 1, 64, 64, 1, 0, 0}, 0.0, 3.5, 10.0 / 4.0 * std::log10(64.0) / 2.0}}) {
        drawer.SmoothFftSpectrum(power, 1.0f, none);
        EXPECT_NEAR(drawer.HighestPeak(lowest).frequency, hz, 1e-6);
        EXPECT_NEAR(drawer.HighestPeak(lowest).level, decibels, 1e-4) << hz;
    }
}

}  // namespace
