#include "Spectrum/Drawer/SpectrumDrawer.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <numeric>
#include <optional>
#include <tuple>

#include "Spectrum/AnalyserFixture.h"
#include "Spectrum/Drawer/VectorInterpolationFilterFloat.h"
#include "Spectrum/Scales/CoordinatesAndFrequencies.h"
#include "Spectrum/Scales/PowerToDecibels.h"

namespace {

using Corvo::FrequencyScale;
using Corvo::LevelScale;
using Record = kivspectrum::spectrum_settings;
using Values = std::vector<float>;

constexpr Corvo::RectF kRectangle{10.0f, 20.0f, 500.0f, 200.0f};
constexpr int kRate = 48000;

// Settings with 8 bins and 100 analyses a second.
Record Small() {
    Record settings;
    settings.fft_length = settings.window_length = 16;
    settings.hop_length = 480;
    return settings;
}

Values Smoothed(const Record& settings, float coefficient, std::initializer_list<float> powers) {
    SpectrumDrawer drawer(settings);
    drawer.UpdateSamplingFrequency(kRate);
    VectorInterpolationFilterFloat filter;
    filter.Resize(settings.smoothing_filter_length, 8);
    Values first;
    for (const float power : powers) {
        drawer.SmoothFftSpectrum(Values(8, power), coefficient, filter);
        first.push_back(drawer.GetPowerSmoothed()[3]);
    }
    return first;
}

// 100 analyses a second and a coefficient of 0.002 give alpha 0.2: rises take 0.32 of the way.
TEST(SpectrumDrawer, FollowsRisesFasterThanFalls) {
    const auto smoothed = Smoothed(Small(), 0.002f, {1.0f, 1.0f, 0.0f});
    EXPECT_NEAR(smoothed[0], 0.32, 1e-6);
    EXPECT_NEAR(smoothed[1], 0.32 + 0.68 * 0.32, 1e-6);
    EXPECT_NEAR(smoothed[2], (0.32 + 0.68 * 0.32) * 0.8, 1e-6);
    EXPECT_EQ(Smoothed(Small(), 0.02f, {1.0f, 0.25f}), (Values{1.0f, 0.25f}));  // alpha limited to 1
    Record unsmoothed = Small();
    unsmoothed.time_smoothing = 0;
    EXPECT_EQ(Smoothed(unsmoothed, 0.002f, {1.0f, 0.25f}), (Values{1.0f, 0.25f}));
    Record held = Small();
    held.smoothing_type = 2;
    EXPECT_EQ(Smoothed(held, 0.002f, {1.0f, 0.25f}), (Values{0.0f, 0.0f}));
}

// An impulse comes out as the weights, one age after the other: symmetric, highest in the middle, sum 1.
TEST(SpectrumDrawer, AveragesByAge) {
    for (const int spectra : {3, 5, 7, 9, 15}) {
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

TEST(SpectrumDrawer, TimesThePeaks) {
    const Values power(1024);
    // Peak hold, decay mode, time smoothing; frames.
    // clang-format off
    for (const auto& [hold, decay, smoothing, frames] :
         {std::tuple{0, 1, 1, 1}, {1, 1, 1, 90}, {1, 2, 1, 48}, {1, 3, 1, 30}, {2, 1, 1, 90}, {1, 0, 1, 0},
          {1, 9, 1, 0}, {1, 1, 0, 70}, {1, 3, 0, 23}}) {
        // clang-format on
        Record settings;
        settings.peak_hold_mode = hold;
        settings.peak_decay_mode = decay;
        settings.time_smoothing = smoothing;
        SpectrumDrawer drawer(settings);
        drawer.UpdateSamplingFrequency(kRate);
        EXPECT_EQ(drawer.power_decay_length(power), frames) << hold << decay << smoothing;
        EXPECT_EQ(drawer.GetActualRefreshRate(power), smoothing ? 30 : 46);
    }
}

TEST(SpectrumDrawer, HoldsAndDropsPeaks) {
    Record settings = Small();
    settings.peak_decay_mode = 3;  // 30 frames
    const auto peakAfter = [&](int hold, int frames) {
        settings.peak_hold_mode = hold;
        SpectrumDrawer drawer(settings);
        drawer.UpdateSamplingFrequency(kRate);
        VectorInterpolationFilterFloat none;
        drawer.SmoothFftSpectrum(Values(8, 1.0f), 1.0f, none);
        drawer.AgePeaks();
        drawer.SmoothFftSpectrum(Values(8, 0.5f), 1.0f, none);
        for (int i = 0; i < frames; ++i) drawer.AgePeaks();
        const float peak = drawer.GetPeaks()[5];
        drawer.peak_reset();
        EXPECT_EQ(drawer.GetPeaks()[5], 0.0f);
        return peak;
    };
    EXPECT_EQ(peakAfter(1, 30), 1.0f);
    EXPECT_NEAR(peakAfter(1, 31), std::pow(10.0, -0.1), 1e-6);
    EXPECT_EQ(peakAfter(1, 100), 0.5f);
    EXPECT_EQ(peakAfter(2, 1000), 1.0f);
    EXPECT_EQ(peakAfter(0, 1), 0.0f);
    settings.peak_decay_mode = 0;
    EXPECT_EQ(peakAfter(1, 1000), 1.0f);
}

TEST(SpectrumDrawer, LosesItsHistoryWithTheRateOnly) {
    SpectrumDrawer drawer(Small());
    VectorInterpolationFilterFloat none;
    drawer.UpdateSamplingFrequency(kRate);
    drawer.SmoothFftSpectrum(Values(8, 1.0f), 1.0f, none);
    for (const int rate : {kRate, 44100}) {
        drawer.UpdateSamplingFrequency(rate);
        EXPECT_EQ(drawer.GetPowerSmoothed(), Values(8, rate == kRate ? 1.0f : 0.0f));
    }
}

TEST(PowerToDecibels, IsTenLogarithms) {
    Values power, level;
    for (double x = 1e-30; x < 1e30; x *= 1.0173) power.push_back(static_cast<float>(x));
    level.resize(power.size());
    Corvo::PowerToDecibels(power.data(), level.data(), power.size(), 1.5f);
    for (std::size_t k = 0; k < power.size(); ++k)
        ASSERT_NEAR(level[k], 10.0 * std::log10(power[k]) + 1.5, 1e-4) << power[k];
    Values odd{0.0f, -1.0f, std::nanf(""), 1.0f};
    Corvo::PowerToDecibels(odd.data(), odd.data(), odd.size(), 0.0f);
    for (std::size_t k = 0; k < 3; ++k) EXPECT_NEAR(odd[k], -300.0, 1e-3);
    EXPECT_EQ(odd[3], 0.0f);
}

// Both ways, on every scale, from edge to edge.
TEST(CoordinatesAndFrequencies, MapsThereAndBack) {
    for (int scale = -1; scale <= 5; ++scale)
        for (int levels = 0; levels < 3; ++levels) {
            const CoordinatesAndFrequencies map(kRectangle, 20.0, 20000.0, static_cast<FrequencyScale>(scale),
                                                static_cast<LevelScale>(levels), 90.0f);
            EXPECT_NEAR(map.FrequencyToX(map.GetLowest()), 10.0, 1e-3);
            EXPECT_NEAR(map.FrequencyToX(map.GetHighest()), 510.0, 1e-3);
            for (double x = 10.0; x <= 510.0; x += 12.5) {
                EXPECT_NEAR(map.FrequencyToX(map.XToFrequency(x)), x, 1e-3) << scale;
                EXPECT_LT(map.XToFrequency(x), map.XToFrequency(x + 1.0)) << scale;
            }
            for (double y = 20.0; y <= 220.0; y += 12.5)
                EXPECT_NEAR(map.LevelToY(map.YToLevel(y)), y, 1e-3) << levels;
        }
    const auto map = [](FrequencyScale scale, LevelScale levels) {
        return CoordinatesAndFrequencies(kRectangle, 20.0, 20000.0, scale, levels, 90.0f);
    };
    EXPECT_NEAR(map(FrequencyScale::Linear, LevelScale::Power).FrequencyToX(10010.0), 260.0, 1e-3);
    EXPECT_NEAR(map(FrequencyScale::Automatic, LevelScale::Power).XToFrequency(260.0), 632.4555, 1e-3);
    EXPECT_NEAR(map(FrequencyScale::Notes, LevelScale::Power).GetLowest(), 440 * std::exp2(-54.5 / 12), 1e-9);
    EXPECT_EQ(map(FrequencyScale::Mel, LevelScale::Decibels).LevelToY(-45.0), 120.0f);
    EXPECT_EQ(map(FrequencyScale::Mel, LevelScale::Decibels).LevelToY(-500.0), 220.0f);
    EXPECT_EQ(map(FrequencyScale::Mel, LevelScale::Amplitude).LevelToY(2.0), 20.0f);
}

class Curve : public AnalyserTest {
protected:
    // The curve of a full-scale sine in the middle of `bin`.
    void Draw(std::size_t bin, double lowest, FrequencyScale scale, LevelScale levels, int length = 4096,
              float gain = 1.0f) {
        Settings().window_length = length;
        Settings().time_smoothing = 0;
        Settings().gain = gain;
        m_analyser.emplace();
        m_analyser->SetOn(true);
        Feed(*m_analyser, TestSupport::Sine<float>(static_cast<std::size_t>(length),
                                                   static_cast<double>(bin) * kRate / length, kRate, 1.0));
        ASSERT_TRUE(Prepare(*m_analyser, kRate));
        m_map.emplace(kRectangle, lowest, 20000.0, scale, levels, 90.0f);
        int count = 0;
        m_points.resize(1001);
        m_analyser->GetSpectrumDrawer()->ComputeSpectrumPoints(kRectangle, m_points.data(), count, *m_map,
                                                               kivspectrum::display_spectrum, 1001, 0.0f);
        m_points.resize(static_cast<std::size_t>(count));
        ASSERT_GE(count, 2);
    }
    std::size_t Highest() const {
        const auto lower = [](const auto& a, const auto& b) { return a.y > b.y; };
        return static_cast<std::size_t>(std::max_element(m_points.begin(), m_points.end(), lower) -
                                        m_points.begin());
    }
    int BinOf(std::size_t point) const { return m_analyser->GetSpectrumDrawer()->GetFFTPoints()[point]; }

    std::optional<kivspectrum> m_analyser;
    std::optional<CoordinatesAndFrequencies> m_map;
    std::vector<Corvo::PointF> m_points;
};

// A full-scale sine touches the top at its own frequency on every scale, wherever bins are denser or wider
// than pixels, and no column is without a point.
TEST_F(Curve, ShowsASineAtItsPlace) {
    for (const auto scale :
         {FrequencyScale::Linear, FrequencyScale::Logarithmic, FrequencyScale::Mel, FrequencyScale::Notes})
        for (const auto levels : {LevelScale::Decibels, LevelScale::Power, LevelScale::Amplitude})
            for (const std::size_t bin : {std::size_t{20}, std::size_t{400}, std::size_t{1500}}) {
                Draw(bin, 20.0, scale, levels);
                ASSERT_EQ(m_points.size(), 500u);
                const auto top = Highest();
                EXPECT_NEAR(m_points[top].y, 20.0, 0.2) << bin;
                EXPECT_NEAR(m_points[top].x, m_map->FrequencyToX(static_cast<double>(bin) * kRate / 4096),
                            1.0);
                EXPECT_EQ(BinOf(top), static_cast<int>(bin));
                for (std::size_t i = 0; i < m_points.size(); ++i) {
                    EXPECT_NEAR(m_points[i].x, 10.5 + static_cast<double>(i), 1e-3);
                    EXPECT_GE(m_points[i].y, 20.0f);
                    EXPECT_LE(m_points[i].y, 220.0f);
                }
            }
    Draw(400, 20.0, FrequencyScale::Linear, LevelScale::Amplitude, 4096, 0.5f);
    EXPECT_NEAR(m_points[Highest()].y, 120.0, 0.2);
}

// 128 samples over 500 pixels: the bins' own levels are met and nothing overshoots them.
TEST_F(Curve, PassesSmoothlyBetweenWideBins) {
    Draw(20, 0.0, FrequencyScale::Linear, LevelScale::Amplitude, 128);
    EXPECT_EQ(m_points.size(), 500u);
    EXPECT_NEAR(m_points[Highest()].y, 20.0, 1e-3);
    float largestStep = 0.0f;
    for (std::size_t i = 1; i < m_points.size(); ++i)
        largestStep = std::max(largestStep, std::abs(m_points[i].y - m_points[i - 1].y));
    EXPECT_LT(largestStep, 40.0f);  // a bin is 9 pixels wide and 200 high
}

// The sine's whole power is in its band, and only there.
TEST_F(Curve, CollectsBands) {
    for (const auto scale : {FrequencyScale::Octaves, FrequencyScale::ThirdOctaves}) {
        Draw(85, 20.0, scale, LevelScale::Decibels);  // 996 Hz
        const double half = scale == FrequencyScale::Octaves ? std::sqrt(2.0) : std::exp2(1.0 / 6.0);
        const auto top = Highest();
        EXPECT_NEAR(m_map->YToLevel(m_points[top].y), 0.0, 0.05);
        EXPECT_NEAR(m_points[top].x, m_map->FrequencyToX(1000.0 / half), 1.0);
        EXPECT_NEAR(m_points[top + 1].x, m_map->FrequencyToX(1000.0 * half), 1.0);
        EXPECT_EQ(m_points[top + 1].y, m_points[top].y);
        EXPECT_LT(m_map->YToLevel(m_points[top + 2].y), -60.0);
    }
}

TEST_F(Curve, DrawsWhatItIsAskedTo) {
    Draw(100, 20.0, FrequencyScale::Linear, LevelScale::Power);
    auto& drawer = *m_analyser->GetSpectrumDrawer();
    int count = -1;
    EXPECT_EQ(drawer.ComputeSpectrumPoints(kRectangle, m_points.data(), count, *m_map,
                                           kivspectrum::display_sonogram, 1000, 0.0f),
              0);
    const Values silence(2048, 0.0f);
    drawer.ComputeSpectrumPoints(kRectangle, m_points.data(), count, *m_map, kivspectrum::display_both, 7,
                                 0.0f, &silence);
    EXPECT_EQ(count, 7);
    EXPECT_EQ(drawer.GetXYPoints().size(), 500u);
    for (const auto& point : drawer.GetXYPoints()) EXPECT_EQ(point.y, 220.0f);
    EXPECT_EQ(drawer.GetPeaks()[100], drawer.GetPowerSmoothed()[100]);
}

// Catches what leaks from a louder sine below the lowest frequency, and peaks out of nothing. Next to 0 Hz
// and to half the rate a sine's own image reaches into its bin, at most -20 dB below it.
TEST_F(Curve, FindsTheHighestPeak) {
    struct Tone {
        double bin, level;
    };
    constexpr double kPerBin = kRate / 4096.0;
    const auto peakOf = [&](std::initializer_list<Tone> tones, double lowestBin = 0.0) {
        Settings().time_smoothing = 0;
        kivspectrum analyser;
        analyser.SetOn(true);
        Values sum(4096, 0.0f);
        for (const auto& [bin, level] : tones) {
            const auto sine =
                TestSupport::Sine<float>(sum.size(), bin * kPerBin, kRate, std::pow(10.0, level / 20.0));
            for (std::size_t i = 0; i < sum.size(); ++i) sum[i] += sine[i];
        }
        Feed(analyser, sum);
        EXPECT_TRUE(Prepare(analyser, kRate));
        auto peak = analyser.GetSpectrumDrawer()->HighestPeak(lowestBin * kPerBin);
        peak.frequency /= kPerBin;
        return peak;
    };
    for (const double bin : {1.0, 2.0, 3.0, 2046.0}) {
        const auto peak = peakOf({{bin, -50.0}});
        EXPECT_NEAR(peak.frequency, bin, 0.35) << bin;
        EXPECT_NEAR(peak.level, -50.0, 1.0) << bin;
    }
    const std::initializer_list<Tone> tones{{3.0, 0.0}, {100.0, -30.0}};
    for (const double lowest : {0.0, 3.0}) EXPECT_NEAR(peakOf(tones, lowest).frequency, 3.0, 0.35);
    for (const double lowest : {3.1, 50.0, 100.0})
        EXPECT_NEAR(peakOf(tones, lowest).frequency, 100.0, 0.06) << lowest;
    for (const double lowest : {101.0, 1e300, std::numeric_limits<double>::infinity()})
        EXPECT_LT(peakOf(tones, lowest).level, -80.0) << lowest;
    EXPECT_EQ(peakOf({}).level, -300.0);
    EXPECT_EQ(peakOf({}).frequency, 0.0);
}

}  // namespace
