#include "Spectrum/Sonogram/Sonogram.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <tuple>

#include "Spectrum/AnalyserFixture.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"
#include "Spectrum/Drawer/VectorInterpolationFilterFloat.h"
#include "Spectrum/Scales/SpectrumScales.h"

namespace {

using Corvo::RectF;
using Values = std::vector<float>;

constexpr int kRate = 48000, kBins = 256;
constexpr float kRange = 90.0f, kLevelStep = kRange / 255.0f;
const float kNan = std::nanf("");

RectF Size(float width, float height) { return {0.0f, 0.0f, width, height}; }

void ExpectColour(std::uint32_t colour, std::uint32_t expected) {
    for (const int shift : {0, 8, 16}) EXPECT_NEAR(colour >> shift & 0xFF, expected >> shift & 0xFF, 1.0);
}

// A sonogram and the drawer it is fed from, which hands spectra on as they are.
class SonogramTest : public AnalyserFixture {
protected:
    SonogramTest() {
        m_record.fft_length = m_record.window_length = 2 * kBins;
        m_record.time_smoothing = 0;
        m_drawer.UpdateSettings(m_record);
        m_drawer.UpdateSamplingFrequency(kRate);
        m_sonogram.CheckPixelBufferSize(Size(40, 30), 0);
    }
    void Choose(std::int32_t kivspectrum::spectrum_settings::*field, std::int32_t value) {
        m_record.*field = value;
        m_drawer.UpdateSettings(m_record);
    }
    // The power that shows as a level.
    float Power(double decibels) const {
        return static_cast<float>(Corvo::FullScalePower(m_record) * std::pow(10.0, decibels / 10.0));
    }
    Values Spike(std::size_t bin) const {
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
    bool Step(double decibels) { return Step(Values(kBins, Power(decibels))); }
    // In the picture, column counted from the newest.
    float LevelAt(int back, int row) const {
        const auto& picture = m_sonogram.GetBitmap();
        return m_sonogram.GetPointAmplitude(
            static_cast<float>(picture.width - 1 - back) + 0.5f, static_cast<float>(row) + 0.5f,
            Size(static_cast<float>(picture.width), static_cast<float>(picture.height)));
    }

    kivspectrum::spectrum_settings m_record;
    SpectrumDrawer m_drawer{{}};
    Corvo::Sonogram m_sonogram;
};

TEST_F(SonogramTest, BringsTheColumnsOfItsSpeed) {
    m_sonogram.CheckPixelBufferSize(Size(500, 4), 0);
    constexpr int kColumns[] = {5, 10, 15, 30, 60, 90, 150, 300, 450};
    for (int index = 0; index < 9; ++index) {
        Corvo::Sonogram::SetSpeedIndex(index);
        m_sonogram.Clear();
        for (int refresh = 0; refresh < 30; ++refresh) Step(0.0);
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
    for (const int scheme : {6, 5, 4, 3, 2, 1, 0, 7}) {
        const auto& [low, high] = kInner[scheme % 7];
        Corvo::Sonogram::SetColourScheme(scheme);
        EXPECT_EQ(m_sonogram.ColorFromAmplitude(-60.0f, false), low) << scheme;
        EXPECT_EQ(m_sonogram.ColorFromAmplitude(-30.0f, false), high) << scheme;
    }
    EXPECT_EQ(m_sonogram.ColorFromAmplitude(kNan, false), 0u);
    EXPECT_EQ(m_sonogram.ColorFromAmplitude(10.0f, false), 0xFFFFFFu);
    EXPECT_EQ(m_sonogram.ColorFromAmplitude(-22.5f, true), 0x404FE5u) << "blue comes first";
}

// Bins denser and wider than rows, on every scale: a spike in any bin reaches full scale in the row of its
// frequency, or in the lowest.
TEST_F(SonogramTest, LosesNoBin) {
    for (int scale = -1; scale <= 5; ++scale)
        for (const int height : {1, 50, 1000}) {
            Choose(&kivspectrum::spectrum_settings::view_option_a, scale);
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

// What passes while another view is shown is heard, too; what passes while it is frozen is a gap.
TEST_F(SonogramTest, AdvancesWhileShownAndNotFrozen) {
    kivspectrum analyser;
    analyser.SetOn(true);
    analyser.GetSonogram()->CheckPixelBufferSize(Size(20, 300), 0);
    Feed(analyser, Values(8192, 0.5f));
    EXPECT_TRUE(analyser.Refresh());
    for (const auto& [shown, frozen] : {std::pair{false, false}, {true, false}, {true, true}}) {
        analyser.ShowSonogram(shown);
        analyser.SetFrozen(frozen);
        EXPECT_EQ(analyser.AdvanceSonogram(), shown && !frozen);
    }
    const Corvo::Sonogram& sonogram = *analyser.GetSonogram();
    EXPECT_EQ(sonogram.GetHeardColumns(), 3) << "Refresh, hidden, shown";
    for (int i = 0; i < 4; ++i) analyser.AdvanceSonogram();
    EXPECT_EQ(sonogram.GetHeardColumns(), 3) << "it stands";
    analyser.SetFrozen(false);
    EXPECT_TRUE(analyser.AdvanceSonogram());
    EXPECT_EQ(sonogram.GetHeardColumns(), 9);
    const auto loudest = [&](int column) {
        std::uint32_t pixel = 0;
        for (int y = 0; y < 300; ++y) pixel = std::max(pixel, sonogram.GetBitmap().Row(y)[column] >> 24);
        return pixel;
    };
    EXPECT_GT(loudest(13), 0u) << "the last before the gap";
    for (int column = 14; column < 19; ++column) EXPECT_EQ(loudest(column), 0u) << column;
}

// Catches a past that moves or loses a pixel when it is left and returned to in any way, and one without end.
TEST_F(SonogramTest, LooksBackToThePixel) {
    const auto pixels = [&] { return m_sonogram.GetBitmap().pixels; };
    const auto size = [&](float width, float height) {
        m_sonogram.CheckPixelBufferSize(Size(width, height), 0);
        return pixels();
    };
    const auto step = [&](int i) { Step(-1.3 * (i * 7 % 60)); };
    for (int i = 0; i < 160; ++i) step(i);
    const auto past = pixels();
    for (int i = 160; i < 200; ++i) step(i);
    const auto present = pixels();
    m_sonogram.SetTimeAtRightEdge(5.0);
    m_sonogram.LookBack(40.0 / 30.0);
    EXPECT_EQ(size(40, 30), past);
    EXPECT_NEAR(m_sonogram.GetTimeAtRightEdge(), 5.0 - 40.0 / 30.0, 1e-9);
    m_sonogram.LookBack(0.0);
    EXPECT_EQ(size(40, 30), present);
    m_sonogram.LookBack(1.32);
    step(200);
    EXPECT_NEAR(m_sonogram.GetSecondsBack(), 41.0 / 30.0, 1e-9) << "it stays while time goes on";
    for (const auto& [width, height, speed] :
         {std::tuple{50, 30, 3}, {17, 9, 3}, {40, 211, 3}, {40, 30, 7}, {40, 30, 1}}) {
        Corvo::Sonogram::SetSpeedIndex(speed);
        const auto other = size(static_cast<float>(width), static_cast<float>(height));
        EXPECT_EQ(other[static_cast<std::size_t>(width) - 1] >> 24 > past[39] >> 24, speed == 1)
            << "three columns in one";
        Corvo::Sonogram::SetSpeedIndex(3);
        EXPECT_EQ(size(40, 30), past) << width << " " << height << " " << speed;
    }
    m_sonogram.LookBack(190.0 / 30.0);
    EXPECT_EQ(m_sonogram.GetHeardColumns(), 11) << "what was not heard may stand at the left";
    m_sonogram.LookBack(1e300);
    EXPECT_NEAR(m_sonogram.GetSecondsBack(), 200.0 / 30.0, 1e-9);
    m_sonogram.LookBack(kNan);
    size(1, 16384);
    for (int i = 0; i < 1100; ++i) m_sonogram.Step(m_drawer, false, 0.0f);
    m_sonogram.LookBack(1e300);
    EXPECT_NEAR(m_sonogram.GetSecondsBack(), 1023.0 / 30.0, 1e-9) << "16 MiB";
}

// A frame that comes between two columns waits for the next one.
TEST_F(SonogramTest, LeadsFromOneSpectrumToTheNext) {
    Corvo::Sonogram::SetSpeedIndex(7);
    Step(-80.0);
    Step(-10.0);
    for (int back = 0; back < 11; ++back) EXPECT_NEAR(LevelAt(back, 10), -10.0 - 7.0 * back, kLevelStep);
    m_sonogram.Step(m_drawer, false, 0.0f);
    for (int back = 0; back < 11; ++back) EXPECT_NEAR(LevelAt(back, 10), -10.0, kLevelStep);
    Corvo::Sonogram::SetSpeedIndex(2);
    EXPECT_FALSE(Step(-30.0));
    EXPECT_TRUE(m_sonogram.Step(m_drawer, false, 0.0f));
    EXPECT_NEAR(LevelAt(0, 10), -30.0, kLevelStep);
}

// Other colours, another range: the levels stay what they were, silence included.
TEST_F(SonogramTest, RecoloursThePast) {
    Step(-50.0);
    const auto version = m_sonogram.GetBitmap().version;
    Corvo::Sonogram::SetColourScheme(6);
    m_sonogram.CheckPixelBufferSize(Size(40, 30), 0);
    EXPECT_NE(m_sonogram.GetBitmap().version, version);
    ExpectColour(m_sonogram.GetBitmap().Row(3)[39], m_sonogram.ColorFromAmplitude(LevelAt(0, 3), false));
    Choose(&kivspectrum::spectrum_settings::view_option_d, 2);
    m_sonogram.Step(m_drawer, false, 0.0f);
    for (const int back : {0, 1}) EXPECT_NEAR(LevelAt(back, 3), -50.0, 0.5);
    EXPECT_EQ(LevelAt(2, 3), -120.0f);
}

// Another size or frequency scale: a tone and the pitch heard stay at their time and frequency.
TEST_F(SonogramTest, KeepsThePastInPlace) {
    for (int i = 0; i < 4; ++i) Step(Spike(100), 440.0f);
    Step(Values(kBins));
    const auto toneAt = [&](int back) {
        const auto& map = m_sonogram.GetFrequencyMap();
        const int row = m_sonogram.GetBitmap().height - 1 -
                        static_cast<int>(map.FrequencyToX(100.0 * kRate / (2 * kBins)));
        return LevelAt(back, row);
    };
    for (const auto& [width, height] : {std::tuple{60, 100}, {5, 40}, {9, 17}}) {
        m_sonogram.CheckPixelBufferSize(Size(static_cast<float>(width), static_cast<float>(height)), 0);
        EXPECT_EQ(toneAt(1), 0.0f) << width;
        EXPECT_EQ(toneAt(0), -kRange);
        EXPECT_EQ(m_sonogram.GetPitch(width - 2), 440.0f);
    }
    Choose(&kivspectrum::spectrum_settings::view_option_a, 0);
    Show(Spike(100));
    m_sonogram.Step(m_drawer, false, kNan);
    EXPECT_EQ(toneAt(0), 0.0f) << "the column too is of the new scale";
    EXPECT_NEAR(m_sonogram.GetFrequencyMap().FrequencyToX(12000.0), 8.5, 1e-3);
    EXPECT_EQ(toneAt(2), 0.0f);
    EXPECT_EQ(m_sonogram.GetPitch(6), 440.0f);
    m_sonogram.Clear();
    EXPECT_EQ(toneAt(2), -kRange);
    EXPECT_EQ(m_sonogram.GetPitch(6), 0.0f);
}

TEST_F(SonogramTest, StandsAnySize) {
    Corvo::Sonogram::SetSpeedIndex(8);
    for (const auto& [wide, high, width] :
         {std::tuple{-5.0f, 10.0f, 0}, {kNan, kNan, 0}, {INFINITY, 2.0f, 16384}, {30.0f, 25.0f, 30}}) {
        m_sonogram.CheckPixelBufferSize(Size(wide, high), 0);
        EXPECT_EQ(m_sonogram.GetBitmap().width, width);
        EXPECT_EQ(Step(std::nan("")), width > 0);
        m_sonogram.ScrollPixels(std::numeric_limits<int>::max());
    }
    for (const auto& [x, y] : {std::tuple{-0.1f, 5.0f}, {40.0f, 5.0f}, {5.0f, 30.0f}, {5.0f, kNan}})
        EXPECT_EQ(m_sonogram.GetPointAmplitude(x, y, Size(40, 30)), -kRange);
}

TEST_F(SonogramTest, DrawsItsIntensityScaleOnce) {
    const auto& bar = m_sonogram.PrepareIntensityScale(3, 91);
    const auto version = bar.version;
    m_sonogram.PrepareIntensityScale(3, 91);
    EXPECT_EQ(bar.version, version);
    for (int y = 0; y < 91; ++y)
        ExpectColour(bar.Row(y)[2], m_sonogram.ColorFromAmplitude(static_cast<float>(-y), false));
    Corvo::Sonogram::SetColourScheme(4);
    EXPECT_NE(m_sonogram.PrepareIntensityScale(3, 91).version, version);
}

}  // namespace
