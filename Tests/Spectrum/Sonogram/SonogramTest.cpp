#include "Spectrum/Sonogram/Sonogram.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdlib>
#include <limits>
#include <tuple>

#include "Spectrum/AnalyserFixture.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"
#include "Spectrum/Drawer/VectorInterpolationFilterFloat.h"
#include "Spectrum/Scales/SpectrumScales.h"
#include "Support/AudioThreadRules.h"

namespace {

using Corvo::RectF;
using Values = std::vector<float>;

constexpr int kRate = 48000, kBins = 256;
constexpr float kRange = 90.0f, kLevelStep = kRange / 255.0f;

RectF Size(float width, float height) { return {0.0f, 0.0f, width, height}; }

// The largest difference between two colours' red, green or blue.
int Difference(std::uint32_t a, std::uint32_t b) {
    int largest = 0;
    for (int shift = 0; shift < 24; shift += 8)
        largest = std::max(
            largest, std::abs(static_cast<int>(a >> shift & 0xFF) - static_cast<int>(b >> shift & 0xFF)));
    return largest;
}

// A sonogram and the drawer it is fed from, which hands spectra on as they are.
class SonogramTest : public AnalyserTest {
protected:
    SonogramTest() : m_drawer(Record()) {
        m_drawer.UpdateSamplingFrequency(kRate);
        m_sonogram.CheckPixelBufferSize(Size(40, 30), 0);
    }
    static kivspectrum::spectrum_settings Record() {
        kivspectrum::spectrum_settings settings;
        settings.fft_length = settings.window_length = 2 * kBins;
        settings.time_smoothing = 0;
        return settings;
    }
    // The power that shows as a level.
    static float Power(double decibels) {
        return static_cast<float>(Corvo::FullScalePower(Record()) * std::pow(10.0, decibels / 10.0));
    }
    static Values Spike(std::size_t bin) {
        Values spectrum(kBins);
        spectrum[bin] = Power(0.0);
        return spectrum;
    }
    void Show(const Values& spectrum) {
        VectorInterpolationFilterFloat none;
        m_drawer.SmoothFftSpectrum(spectrum, 1.0f, none);
    }
    bool Step(const Values& spectrum, float pitch = 0.0f) {
        Show(spectrum);
        return m_sonogram.Step(m_drawer, true, pitch);
    }
    bool Step(double decibels, float pitch = 0.0f) { return Step(Values(kBins, Power(decibels)), pitch); }
    Values NoiseSpectrum(std::uint64_t seed) const {
        auto spectrum = TestSupport::Noise<float>(kBins, 1.0, seed);
        for (float& power : spectrum) power = Power(45.0 * power - 45.0);
        return spectrum;
    }
    // In the picture, column counted from the newest.
    float LevelAt(int back, int row) const {
        const auto& picture = m_sonogram.GetBitmap();
        return m_sonogram.GetPointAmplitude(
            static_cast<float>(picture.width - 1 - back) + 0.5f, static_cast<float>(row) + 0.5f,
            Size(static_cast<float>(picture.width), static_cast<float>(picture.height)));
    }

    SpectrumDrawer m_drawer;
    Corvo::Sonogram m_sonogram;
};

TEST_F(SonogramTest, BringsTheColumnsOfItsSpeed) {
    m_sonogram.CheckPixelBufferSize(Size(500, 4), 0);
    constexpr int kColumns[] = {5, 10, 15, 30, 60, 90, 150, 300, 450},
                  kCounters[] = {6, 3, 2, 1, -1, -2, -4, -9, -14};
    for (int index = 0; index < 9; ++index) {
        Corvo::Sonogram::SetSpeedIndex(index);
        EXPECT_EQ(Corvo::Sonogram::GetColumnsPerSecond(), kColumns[index]);
        m_sonogram.Clear();
        for (int refresh = 0; refresh < 30; ++refresh) Step(0.0);
        EXPECT_EQ(m_sonogram.GetDrawCounter(), kCounters[index]);
        int columns = 0;
        for (int back = 0; back < 500; ++back) columns += LevelAt(back, 2) > -kRange;
        EXPECT_EQ(columns, kColumns[index]);
    }
}

// Black, two colours and white at equal distances, 30 dB apart, blended by their codes between.
TEST_F(SonogramTest, ColoursLevels) {
    constexpr std::uint32_t kInner[][2] = {{0x1E00FF, 0xDC1400}, {0x0000FF, 0x00FF32}, {0xFF4500, 0xFFFF00},
                                           {0xFF0000, 0xFF0032}, {0x00FF00, 0x00FF32}, {0x0000FF, 0x0032FF},
                                           {0x404040, 0x919191}};
    for (const int scheme : {6, 5, 4, 3, 2, 1, 0, 7, -1}) {
        const auto& [low, high] = kInner[scheme < 0 || scheme > 6 ? 0 : scheme];
        Corvo::Sonogram::SetColourScheme(scheme);
        const std::uint32_t stops[] = {0x000000, low, high, 0xFFFFFF};
        for (int i = 0; i < 4; ++i)
            EXPECT_EQ(m_sonogram.ColorFromAmplitude(30.0f * static_cast<float>(i) - kRange, false), stops[i])
                << scheme;
    }
    // clang-format off
    for (const auto& [decibels, rgb, reference] :
         {std::tuple{-45.0f, 0x7D0A80u, 0x800A7Du}, {-22.5f, 0xE54F40u, 0x404FE5u}, {-200.0f, 0u, 0u},
          {std::nanf(""), 0u, 0u}, {10.0f, 0xFFFFFFu, 0xFFFFFFu}}) {
        // clang-format on
        EXPECT_EQ(m_sonogram.ColorFromAmplitude(decibels, false), rgb) << decibels;
        EXPECT_EQ(m_sonogram.ColorFromAmplitude(decibels, true), reference) << decibels;
    }
}

// Bins denser and wider than rows, on every scale: a spike in any bin reaches full scale in the row of its
// frequency, or in the lowest.
TEST_F(SonogramTest, LosesNoBin) {
    for (int scale = -1; scale <= 5; ++scale)
        for (const int height : {1, 50, 1000}) {
            auto settings = Record();
            settings.view_option_a = scale;
            m_drawer.UpdateSettings(settings);
            m_sonogram.CheckPixelBufferSize(Size(1, 77), height);
            Step(-20.0);
            for (std::size_t bin = 0; bin < kBins; ++bin) {
                m_sonogram.ComputeColumn(Spike(bin), height);
                const double hz = static_cast<double>(bin) * kRate / (2 * kBins);
                double share = hz / (kRate / 2.0);
                if (scale != 0) share = std::log(std::max(hz, 20.0) / 20.0) / std::log(kRate / 40.0);
                if (scale == 4) share = std::log1p(hz / 700.0) / std::log1p(kRate / 1400.0);
                // The note scale is widened to whole semitones, of which it has 123.
                const int reach = scale == 5 ? 1 + height / 123 : 1;
                const int row = height - 1 - static_cast<int>(share * height);
                const float* const column = m_sonogram.GetColumn();
                const float highest = *std::max_element(column + std::max(row - reach, 0),
                                                        column + std::min(row + reach + 1, height));
                ASSERT_NEAR(highest, 0.0, 1e-3) << scale << " " << bin;
            }
        }
}

// From the samples to the pixel: full scale is white, 60 dB below it the colour of a third of the range.
TEST_F(SonogramTest, LightsASineInItsRow) {
    for (const auto& [amplitude, colour] : {std::tuple{1.0, 0xFFFFFFu}, {0.001, 0x1E00FFu}}) {
        Settings() = Record();
        kivspectrum analyser;
        analyser.SetOn(true);
        auto& sonogram = *analyser.GetSonogram();
        sonogram.CheckPixelBufferSize(Size(20, 300), 0);
        Feed(analyser, TestSupport::Sine<float>(2 * kBins, 40.0 * kRate / (2 * kBins), kRate, amplitude));
        ASSERT_TRUE(Prepare(analyser, kRate));
        EXPECT_FALSE(analyser.AdvanceSonogram());  // not shown
        analyser.ShowSonogram(true);
        EXPECT_TRUE(analyser.AdvanceSonogram());
        EXPECT_TRUE(analyser.Refresh());  // no new frame: the column again
        const auto& picture = sonogram.GetBitmap();
        const int row = 299 - static_cast<int>(300.0 * std::log(3750.0 / 20.0) / std::log(24000.0 / 20.0));
        for (const int column : {18, 19}) EXPECT_LE(Difference(picture.Row(row)[column], colour), 1);
        EXPECT_EQ(picture.Row(row)[17], 0u);
        EXPECT_EQ(picture.Row(row - 60)[19] & 0xFFFFFF, 0u);
        analyser.SetFrozen(true);
        EXPECT_FALSE(analyser.AdvanceSonogram());
        // And the pitch, while the tuner is on.
        analyser.ToggleTuner();
        analyser.set_parameters(kRate);
        Feed(analyser, TestSupport::Sine<float>(8192, 330.0, kRate));
        for (const bool on : {true, false}) {
            analyser.SetTunerOn(on);
            EXPECT_TRUE(analyser.Refresh());
            EXPECT_NEAR(sonogram.GetPitch(19), on ? 330.0 : 0.0, 0.1);
        }
    }
}

// Fifteen columns moved at once leave the same picture as fifteen moved one by one, wherever rows end; the
// picture moves as one block.
TEST_F(SonogramTest, ScrollsSeveralColumnsAtOnce) {
    for (const float width : {1.0f, 7.0f, 15.0f, 16.0f, 40.0f}) {
        Corvo::Sonogram fast, slow;
        for (std::uint64_t i = 0; i < 5; ++i) {
            // A new height: the first columns after it are not led to.
            for (auto* sonogram : {&fast, &slow})
                sonogram->CheckPixelBufferSize(Size(width, 30.0f + static_cast<float>(i)), 0);
            Show(NoiseSpectrum(i));
            Corvo::Sonogram::SetSpeedIndex(8);
            fast.Step(m_drawer, true, 0.0f);
            Corvo::Sonogram::SetSpeedIndex(3);
            for (int column = 0; column < 15; ++column) slow.Step(m_drawer, column == 0, 0.0f);
            ASSERT_EQ(fast.GetBitmap().pixels, slow.GetBitmap().pixels) << width;
            auto expected = slow.GetBitmap().pixels;
            std::copy(expected.begin() + 1, expected.end(), expected.begin());
            slow.ScrollPixels();
            ASSERT_EQ(slow.GetBitmap().pixels, expected) << width;
            fast.ScrollPixels();
        }
    }
}

TEST_F(SonogramTest, LeadsFromOneSpectrumToTheNext) {
    Corvo::Sonogram::SetSpeedIndex(7);
    Step(-80.0);
    Step(-10.0);
    for (int back = 0; back < 11; ++back) EXPECT_NEAR(LevelAt(back, 10), -10.0 - 7.0 * back, kLevelStep);
    m_sonogram.Step(m_drawer, false, 0.0f);
    for (int back = 0; back < 11; ++back) EXPECT_NEAR(LevelAt(back, 10), -10.0, kLevelStep);
}

TEST_F(SonogramTest, GivesBackItsLevels) {
    for (float decibels = 0.0f; decibels > -kRange; decibels -= 0.37f) {
        Step(decibels);
        EXPECT_NEAR(LevelAt(0, 7), decibels, 0.6 * kLevelStep);
    }
    for (const auto& [x, y] : {std::tuple{-0.1f, 5.0f}, {40.0f, 5.0f}, {5.0f, 30.0f}, {5.0f, std::nanf("")}})
        EXPECT_EQ(m_sonogram.GetPointAmplitude(x, y, Size(40, 30)), -kRange);
    EXPECT_EQ(m_sonogram.GetPointAmplitude(5.0f, 5.0f, Size(0, 0)), -kRange);
}

// Other colours, another range: the levels stay what they were, silence included.
TEST_F(SonogramTest, RecoloursThePast) {
    for (std::uint64_t i = 0; i < 39; ++i) Step(NoiseSpectrum(i));
    Step(-50.0);
    const auto before = m_sonogram.GetBitmap();
    Corvo::Sonogram::SetColourScheme(6);
    m_sonogram.CheckPixelBufferSize(Size(40, 30), 0);
    EXPECT_NE(m_sonogram.GetBitmap().version, before.version);
    for (int row = 0; row < 30; ++row)
        for (int column = 0; column < 40; ++column) {
            const std::uint32_t pixel = m_sonogram.GetBitmap().Row(row)[column];
            EXPECT_EQ(pixel >> 24, before.Row(row)[column] >> 24);
            EXPECT_LE(Difference(pixel, m_sonogram.ColorFromAmplitude(LevelAt(39 - column, row), false)), 1);
        }
    m_sonogram.Clear();
    Step(-50.0);
    auto settings = Record();
    settings.view_option_d = 2;
    m_drawer.UpdateSettings(settings);
    m_sonogram.Step(m_drawer, false, 0.0f);
    EXPECT_EQ(m_sonogram.GetRange(), 120.0f);
    for (const int back : {0, 1}) EXPECT_NEAR(LevelAt(back, 3), -50.0, 0.5);
    EXPECT_EQ(LevelAt(2, 3), -120.0f);
}

// Another size or frequency scale: a tone and the pitch heard stay at their time and frequency.
TEST_F(SonogramTest, KeepsThePastInPlace) {
    Step(Spike(100), 440.0f);
    Step(Values(kBins));
    const auto toneAt = [&](int back) {
        const auto& map = m_sonogram.GetFrequencyMap();
        const int row = m_sonogram.GetBitmap().height - 1 -
                        static_cast<int>(map.FrequencyToX(100.0 * kRate / (2 * kBins)));
        return LevelAt(back, row);
    };
    for (const auto& [width, height] :
         {std::tuple{40.0f, 30.0f}, {60.0f, 100.0f}, {5.0f, 40.0f}, {9.0f, 17.0f}}) {
        m_sonogram.CheckPixelBufferSize(Size(width, height), 0);
        EXPECT_EQ(m_sonogram.GetBitmap().width, static_cast<int>(width));
        EXPECT_EQ(toneAt(1), 0.0f) << width;
        EXPECT_EQ(toneAt(0), -kRange);
        EXPECT_EQ(m_sonogram.GetPitch(static_cast<int>(width) - 2), 440.0f);
        EXPECT_EQ(m_sonogram.GetPitch(static_cast<int>(width) - 1), 0.0f);
    }
    Step(Values(kBins));
    auto settings = Record();
    settings.view_option_a = 0;
    m_drawer.UpdateSettings(settings);
    Show(Spike(100));
    m_sonogram.Step(m_drawer, false, std::nanf(""));  // the column too is of the new scale
    EXPECT_EQ(toneAt(0), 0.0f);
    EXPECT_NEAR(m_sonogram.GetFrequencyMap().FrequencyToX(12000.0), 8.5, 1e-3);
    EXPECT_EQ(toneAt(3), 0.0f);
    EXPECT_EQ(m_sonogram.GetPitch(5), 440.0f);
    EXPECT_EQ(m_sonogram.GetPitch(8), 0.0f);
    m_sonogram.Clear();
    EXPECT_EQ(toneAt(3), -kRange);
    EXPECT_EQ(m_sonogram.GetPitch(5), 0.0f);
}

TEST_F(SonogramTest, StandsAnySize) {
    const float nan = std::nanf(""), infinite = std::numeric_limits<float>::infinity();
    constexpr int kMost = std::numeric_limits<int>::max();
    struct Case {
        RectF rectangle;
        int rows, width, height;
    };
    for (const auto& [rectangle, rows, width, height] :
         {Case{Size(-5, 10), 0, 0, 10}, Case{Size(nan, nan), 0, 0, 0}, Case{Size(infinite, 2), 0, 16384, 2},
          Case{Size(2, 1e30f), 0, 2, 16384}, Case{Size(3, 50), kMost, 3, 16384},
          Case{Size(30, 1000), 25, 30, 25}}) {
        m_sonogram.CheckPixelBufferSize(rectangle, rows);
        EXPECT_EQ(m_sonogram.GetBitmap().width, width);
        EXPECT_EQ(m_sonogram.GetBitmap().height, height);
        EXPECT_EQ(Step(nan), width > 0);
        EXPECT_EQ(m_sonogram.Step(SpectrumDrawer({}), true, 0.0f), width > 0);
        m_sonogram.ScrollPixels(std::numeric_limits<int>::max());
        m_sonogram.Clear();
        m_sonogram.PrepareIntensityScale(width, height);
    }
    m_sonogram.ComputeColumn(Values(5, infinite), -1);
    EXPECT_EQ(m_sonogram.GetColumnHeight(), 0);
    EXPECT_EQ(Corvo::DrawingBitmap::LimitedHeight(1 << 30, 1 << 30), 4096);
}

// In steady state nothing is allocated.
TEST_F(SonogramTest, DrawsItsIntensityScaleOnce) {
    const auto version = m_sonogram.PrepareIntensityScale(3, 91).version;
    const auto& bar = m_sonogram.PrepareIntensityScale(3, 91);
    EXPECT_EQ(bar.version, version);
    for (int y = 0; y < 91; ++y)
        EXPECT_LE(Difference(bar.Row(y)[2], m_sonogram.ColorFromAmplitude(static_cast<float>(-y), false)), 1);
    Corvo::Sonogram::SetColourScheme(4);
    EXPECT_NE(m_sonogram.PrepareIntensityScale(3, 91).version, version);
    if (!TestSupport::AudioThreadRules::CanCount()) GTEST_SKIP() << "allocations cannot be counted here";
    Corvo::Sonogram::SetSpeedIndex(8);
    Step(-10.0);
    Step(-20.0);
    const TestSupport::AudioThreadRules rules;
    for (int refresh = 0; refresh < 5; ++refresh) {
        m_sonogram.CheckPixelBufferSize(Size(40, 30), 0);
        m_sonogram.Step(m_drawer, refresh % 2 == 0, 440.0f);
        m_sonogram.PrepareIntensityScale(3, 91);
        Corvo::Sonogram::SetColourScheme(refresh);
    }
    EXPECT_EQ(rules.Broken(), "");
}

}  // namespace
