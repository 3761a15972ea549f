#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <limits>

#include "Drawing/Views/Look.h"
#include "Drawing/Views/ShownAnalyser.h"
#include "Spectrum/Scales/CoordinatesAndFrequencies.h"
#include "Spectrum/Scales/SpectrumScales.h"

using namespace Corvo;
using TestSupport::DrawingSurface;

namespace {

constexpr int kWidth = 640, kHeight = 360;
constexpr RectF kWhole{0, 0, kWidth, kHeight};

void OnlyTheCurve() {
    auto& view = kivspectrum::settings;
    view.view_flag_b = view.view_option_c = view.view_flag_c = view.peak_hold_mode = 0;
    view.time_smoothing = 0;
}

}  // namespace

template <typename Drawing>
class Views : public ViewTest {};
TYPED_TEST_SUITE(Views, TestSupport::DrawingBackends);

// Catches scales that run the wrong way, are off by a margin, or are not what the drawer uses.
TYPED_TEST(Views, SpectrumPeaksAtTheFrequencyAndLevelOfASine) {
    for (const int scale : {0, 1, 4})
        for (const auto& [hz, level] : {std::pair{1000.0, -20.0}, {6000.0, 0.0}, {187.5, -60.0}}) {
            SCOPED_TRACE(testing::Message() << "scale " << scale << ", " << hz << " Hz, " << level << " dB");
            OnlyTheCurve();
            kivspectrum::settings.view_option_a = scale;
            ShownAnalyser shown;
            shown.Hear(hz, std::pow(10.0, level / 20.0));
            DrawingSurface<TypeParam> surface(kWidth, kHeight);
            surface.Paint(96.0f, [&](auto& target) {
                shown.analyser.template DoDrawSpectrum<TypeParam>(target, kWhole);
            });
            const auto map = SpectrumMap(kWhole, kivspectrum::settings, ShownAnalyser::kRate);
            int topX = -1, topY = kHeight;
            for (int y = kHeight - 1; y >= 0; --y)
                for (int x = 0; x < kWidth; ++x)
                    if (ColourDistance(surface.Pixel(x, y), RgbFromColour(Look::kCurve)) < 64) {
                        topX = x;
                        topY = y;
                    }
            EXPECT_NEAR(topX, map.FrequencyToX(hz), 3.0);
            EXPECT_NEAR(topY, map.LevelToY(level), 2.5);
        }
}

// Catches rows upside down, columns at the wrong end, and colours of another level, order or scheme.
TYPED_TEST(Views, SonogramLightsTheRowOfASineInTheColourOfItsLevel) {
    for (const int scheme : {0, 2})
        for (const double level : {0.0, -60.0}) {
            SCOPED_TRACE(testing::Message() << "scheme " << scheme << ", " << level << " dB");
            OnlyTheCurve();
            Sonogram::SetColourScheme(scheme);
            ShownAnalyser shown;
            shown.analyser.ShowSonogram(true);
            DrawingSurface<TypeParam> surface(kWidth, kHeight);
            const auto draw = [&](auto& target) {
                shown.analyser.template DrawSonogramComponents<TypeParam>(target, kWhole);
            };
            surface.Paint(96.0f, draw);
            shown.Hear(3000.0, std::pow(10.0, level / 20.0));
            surface.Paint(96.0f, draw);
            const auto& map = shown.analyser.GetSonogram()->GetFrequencyMap();
            const int row = kHeight - 1 - static_cast<int>(map.FrequencyToX(3000.0));
            const auto expected =
                shown.analyser.GetSonogram()->ColorFromAmplitude(static_cast<float>(level), false);
            EXPECT_LE(ColourDistance(surface.Pixel(kWidth - 1, row), expected), 6);
            EXPECT_EQ(surface.Pixel(kWidth - 1, row / 2), 0u) << "above";
            EXPECT_EQ(surface.Pixel(0, row), RgbFromColour(Look::kPlot)) << "never heard";
        }
}

// Catches divisions by nothing, casts of what is not a number, and buffers sized by either.
TYPED_TEST(Views, EveryRoutineTakesEveryRectangle) {
    constexpr float kNan = std::numeric_limits<float>::quiet_NaN();
    constexpr float kInfinite = std::numeric_limits<float>::infinity();
    const RectF rectangles[] = {{0, 0, 0, 0},         {3, 3, 1, 1},          {0, 0, 1, 200},
                                {0, 0, 200, 1},       {0, 0, -5, 20},        {kNan, 0, 10, 10},
                                {0, 0, kNan, 10},     {0, 0, kInfinite, 10}, {-1e30f, 0, 10, 10},
                                {0, 0, 1e30f, 1e30f}, {0, 0, 17, 9},         {-50, -50, 90, 90},
                                {600, 300, 400, 400}, {0, 0, 60, 300},       {0, 0, 300, 60}};
    ShownAnalyser shown;
    kivspectrum& analyser = shown.analyser;
    analyser.SetTunerOn(true);
    analyser.ShowSonogram(true);
    analyser.SetPointer(20, 20);
    shown.Hear(440.0, 0.5);
    DrawingSurface<TypeParam> surface(64, 48);
    for (const RectF& r : rectangles)
        for (const float dpi : {96.0f, 192.0f, 384.0f, 0.0f, kNan, 1e9f})
            surface.Paint(dpi, [&](auto& target) {
                analyser.template DoDraw<TypeParam>(target, r);
                analyser.template DoDrawSonogramAndSpectrum<TypeParam>(target, r);
                analyser.template DrawSonogramIntensityScale<TypeParam>(target, r);
                analyser.template DrawTuner<TypeParam>(target, r);
                analyser.template DoDrawBigLetter<TypeParam>(target, r);
                analyser.template DrawTunerBigLetter<TypeParam>(target, r);
                analyser.template DrawTunerWithNeedle<TypeParam>(target, r);
                analyser.template DrawNeedle<TypeParam>(target, r);
                analyser.template DrawNeedleInfo<TypeParam>(target, r);
                auto& sonogram = *analyser.GetSonogram();
                sonogram.template Draw<TypeParam>(target, r);
                sonogram.template DrawFrequencyScale<TypeParam>(target, r, true);
                sonogram.template DrawTimeline<TypeParam>(target, r);
                sonogram.template DrawPitchTrace<TypeParam>(target, r);
            });
    // What lies outside the rectangle stays as it was.
    DrawingSurface<TypeParam> other(64, 48);
    other.Paint(96.0f, [&](auto& target) {
        analyser.template DoDrawSpectrum<TypeParam>(target, {10, 10, 30, 20});
    });
    EXPECT_EQ(other.Pixel(9, 15), 0u);
    EXPECT_EQ(other.Pixel(40, 15), 0u);
    EXPECT_EQ(other.Pixel(15, 30), 0u);
    EXPECT_NE(other.Pixel(15, 28), 0u);
}

// Catches bars lit on the wrong side, the circle that stays dark in tune, and a panel without a note that
// still shows one.
TYPED_TEST(Views, TunerLightsTheSideOfTheError) {
    struct Case {
        const char* what;
        double hz;
        bool left, right, centre;
    };
    for (const Case& c :
         {Case{"flat", 440.0 * std::exp2(-20.0 / 1200.0), true, false, false},
          Case{"sharp", 440.0 * std::exp2(20.0 / 1200.0), false, true, false},
          Case{"in tune", 440.0, false, false, true}, Case{"silence", 0.0, false, false, false}}) {
        SCOPED_TRACE(c.what);
        ShownAnalyser shown;
        shown.analyser.SetTunerOn(true);
        shown.analyser.ObserverUpdate();
        shown.Hear(c.hz, 0.5, 1.0);
        DrawingSurface<TypeParam> surface(kWidth, kHeight);
        surface.Paint(96.0f, [&](auto& target) {
            shown.analyser.template DrawTunerBigLetter<TypeParam>(target, kWhole);
        });
        const auto brightness = [&](int x, int y) {
            const std::uint32_t pixel = surface.Pixel(x, y);
            return std::max({pixel >> 16, pixel >> 8 & 0xFFu, pixel & 0xFFu});
        };
        const auto brightest = [&](int from, int to) {
            std::uint32_t most = 0;
            for (int x = from; x < to; ++x) most = std::max(most, brightness(x, kHeight / 2));
            return most > 160;
        };
        constexpr int kRipples = kHeight * 45 / 100;  // from the centre to before the innermost
        EXPECT_EQ(brightest(0, kWidth / 2 - kRipples), c.left);
        EXPECT_EQ(brightest(kWidth / 2 + kRipples, kWidth), c.right);
        EXPECT_EQ(brightness(kWidth / 2, kHeight / 2 - kHeight / 5) > 160, c.centre);
    }
}
