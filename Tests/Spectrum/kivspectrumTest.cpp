#include "Spectrum/kivspectrum.h"

#include <cmath>
#include <cstddef>
#include <limits>
#include <numbers>

#include "Spectrum/AnalyserFixture.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"
#include "Spectrum/MessagePoster.h"
#include "Spectrum/Tuner/Tuner.h"
#include "Support/AudioThreadRules.h"

namespace {

using Record = kivspectrum::spectrum_settings;
using Values = std::vector<float>;

class kivspectrumTest : public AnalyserTest {};

// The record is copied whole across module borders: every field at its place.
TEST_F(kivspectrumTest, KeepsTheRecordsLayoutAndDefaults) {
    EXPECT_EQ(offsetof(Record, window_type), 4u * 4);
    EXPECT_EQ(offsetof(Record, gain), 10u * 4);
    EXPECT_EQ(offsetof(Record, peak_hold_mode), 12u * 4);
    EXPECT_EQ(offsetof(Record, overlap), 16u * 4);
    EXPECT_EQ(offsetof(Record, time_smoothing), 18u * 4);
    EXPECT_EQ(offsetof(Record, view_flag_d), 19u * 4);
    EXPECT_EQ(offsetof(Record, smoothing_filter_length), 23u * 4);
    EXPECT_EQ(Settings().fft_length, 4096);
    EXPECT_EQ(Settings().hop_length, -1);
    EXPECT_EQ(Settings().window_type, 4);
    EXPECT_EQ(int{kivspectrum::window_types_num}, 5);  // by value: the DLL exports no constants
    EXPECT_EQ(kivspectrum::GetRefreshRatePeriod(), 30);
}

TEST_F(kivspectrumTest, ShapesPeriodicWindows) {
    const auto window = [](int type, int length = 8) {
        Settings().window_type = type;
        Settings().window_length = length;
        return kivspectrum().GetWindow();
    };
    EXPECT_EQ(window(0), Values(8, 1.0f));
    EXPECT_EQ(window(1), (Values{0, 0.25f, 0.5f, 0.75f, 1, 0.75f, 0.5f, 0.25f}));
    const double sums[] = {1.0, 0.5, 0.5, 0.54, 0.42};
    for (int type = 0; type < 5; ++type) {
        const auto shape = window(type, 512);
        double sum = 0.0;
        for (const float w : shape) sum += w;
        EXPECT_NEAR(sum / 512, sums[type], 1e-6) << type;
        EXPECT_NEAR(shape[256], 1.0, 1e-6) << type;
        EXPECT_EQ(shape[100], shape[412]) << type;
    }
    EXPECT_NEAR(window(3)[0], 0.08, 1e-7);
    EXPECT_EQ(window(5), Values(8, 0.0f));
}

TEST_F(kivspectrumTest, DerivesTheHopFromTheOverlap) {
    struct Case {
        float overlap, stored;
        int hop;
    };
    for (const Case& c : {Case{1.0f, 0.99f, 40},
                          {0.75f, 0.75f, 1024},
                          {0.0f, 0.0f, 4096},
                          {-1.0f, -1.0f, 8192},
                          {0.995f, 0.995f, 40},
                          {std::nanf(""), 0.99f, 40}}) {
        kivspectrum::SetAnalysisWindowsOverlap(c.overlap);
        EXPECT_EQ(Settings().overlap, c.stored) << c.overlap;
        EXPECT_EQ(Settings().hop_length, c.hop) << c.overlap;
    }
}

// Until a frame's worth of samples came there is nothing to draw; afterwards the newest samples count.
TEST_F(kivspectrumTest, TransformsTheNewestWindow) {
    Settings().window_length = 256;
    Settings().window_type = 0;
    Settings().time_smoothing = 0;
    kivspectrum analyser;
    EXPECT_FALSE(analyser.GetOn());
    Feed(analyser, Values(256, 1.0f));
    EXPECT_FALSE(Prepare(analyser));
    analyser.SetOn(true);
    EXPECT_TRUE(analyser.GetSpectrumDrawer()->GetOn());
    EXPECT_TRUE(analyser.PrepareFFTForDrawing(48000, true, false, false, true));
    EXPECT_TRUE(Prepare(analyser));
    EXPECT_FALSE(Prepare(analyser));

    Values expected(128, 0.0f);
    expected[0] = 256.0f * 256.0f;
    EXPECT_EQ(analyser.GetPower(), expected);
    EXPECT_EQ(analyser.GetSpectrumDrawer()->GetPowerSmoothed(), expected);

    Values nyquist(255);
    for (std::size_t i = 0; i < nyquist.size(); ++i) nyquist[i] = i % 2 ? 1.0f : -1.0f;
    Feed(analyser, nyquist);
    EXPECT_FALSE(Prepare(analyser));
    Feed(analyser, {1.0f});
    EXPECT_TRUE(Prepare(analyser));
    EXPECT_EQ(analyser.GetPower(), expected);

    Values sine(256);
    for (std::size_t i = 0; i < sine.size(); ++i)
        sine[i] =
            static_cast<float>(std::sin(2.0 * std::numbers::pi * 16.0 * static_cast<double>(i) / 256.0));
    Feed(analyser, sine);
    EXPECT_TRUE(Prepare(analyser));
    for (std::size_t k = 0; k < 128; ++k)
        EXPECT_NEAR(analyser.GetPower()[k], k == 16 ? 128.0 * 128.0 : 0.0, 0.02) << k;
}

}  // namespace
