#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <limits>
#include <string>

#include "Drawing/Views/Look.h"
#include "Drawing/Views/Rectangles.h"
#include "Drawing/Views/ShownAnalyser.h"
#include "Support/AudioThreadRules.h"
#include "Support/RecordingDrawing.h"

// What holds for every view, whatever it shows.

using namespace Corvo;
using TestSupport::NoDrawing;
using Recording = TestSupport::RecordingDrawing;

namespace {

constexpr float kNan = std::numeric_limits<float>::quiet_NaN();
constexpr float kInfinite = std::numeric_limits<float>::infinity();

class Views : public ViewTest {
protected:
    Views() {
        analyser.SetTunerOn(true);
        analyser.ObserverUpdate();
        analyser.ShowSonogram(true);
    }

    ShownAnalyser m_shown;
    kivspectrum& analyser = m_shown.analyser;
};

void ExpectApartAndInside(const std::vector<Recording::Text>& texts, const RectF& whole) {
    constexpr float kTouch = 0.51f;
    for (std::size_t i = 0; i < texts.size(); ++i) {
        const auto& [text, box, middle] = texts[i];
        EXPECT_TRUE(box.x >= whole.x - 0.5f && Right(box) <= Right(whole) + 0.5f) << text;
        EXPECT_TRUE(box.y >= whole.y - 0.5f && Bottom(box) <= Bottom(whole) + 0.5f) << text;
        for (std::size_t j = 0; j < i; ++j) {
            const RectF& other = texts[j].box;
            EXPECT_TRUE(std::min(Right(box), Right(other)) - std::max(box.x, other.x) <= kTouch ||
                        std::min(Bottom(box), Bottom(other)) - std::max(box.y, other.y) <= kTouch)
                << "\"" << text << "\" and \"" << texts[j].text << "\"";
        }
    }
}

// Catches labels cut at an edge or over each other, at any size, resolution and scale.
TEST_F(Views, TextsStayApartAndInside) {
    Tuner::SetTemperament(10);
    m_shown.Hear(466.16, 0.5, 0.6);
    ASSERT_TRUE(analyser.GetTuner()->IsTuned());
    std::size_t texts = 0;
    for (const RectF& size : {RectF{0, 0, 1280, 720}, {0, 0, 420, 260}, {7, 11, 160, 120}})
        for (const float dpi : {96.0f, 144.0f, 192.0f})
            for (int scale = -1; scale <= 5; ++scale)
                for (const bool notes : {false, true}) {
                    SCOPED_TRACE(testing::Message() << size.width << "x" << size.height << " at " << dpi
                                                    << " dpi, scale " << scale << (notes ? ", notes" : ""));
                    kivspectrum::settings.view_option_a = scale;
                    kivspectrum::settings.view_flag_d = notes;
                    m_shown.Hear(466.16, 0.5, 0.04);
                    Recording::DrawTarget both(dpi), tuner(dpi);
                    analyser.DoDrawSonogramAndSpectrum<Recording>(both, size);
                    analyser.DrawTuner<Recording>(tuner, size);
                    ExpectApartAndInside(both.texts, size);
                    ExpectApartAndInside(tuner.texts, size);
                    texts += both.texts.size() + tuner.texts.size();
                }
    EXPECT_GT(texts, 1000u);
}

// Catches divisions by nothing, casts of what is not a number, and buffers sized by either.
TEST_F(Views, EveryRoutineTakesEveryRectangle) {
    const RectF rectangles[] = {{0, 0, 0, 0},     {3, 3, 1, 1},          {0, 0, 1, 200},
                                {0, 0, 200, 1},   {0, 0, -5, 20},        {kNan, 0, 10, 10},
                                {0, 0, kNan, 10}, {0, 0, kInfinite, 10}, {-1e30f, 0, 1e30f, 1e30f},
                                {0, 0, 17, 9},    {-50, -50, 90, 90},    {0, 0, 300, 60}};
    analyser.SetPointer(20, 20);
    m_shown.Hear(440.0, 0.5);
    Sonogram& sonogram = *analyser.GetSonogram();
    for (const RectF& r : rectangles)
        for (const float dpi : {96.0f, 192.0f, 384.0f, 0.0f, kNan, 1e9f}) {
            Recording::DrawTarget target(dpi);
            analyser.DoDraw<Recording>(target, r);
            analyser.DoDrawSonogramAndSpectrum<Recording>(target, r);
            analyser.DrawSonogramIntensityScale<Recording>(target, r);
            analyser.DrawTuner<Recording>(target, r);
            analyser.DoDrawBigLetter<Recording>(target, r);
            analyser.DrawTunerBigLetter<Recording>(target, r);
            analyser.DrawTunerWithNeedle<Recording>(target, r);
            analyser.DrawNeedle<Recording>(target, r);
            analyser.DrawNeedleInfo<Recording>(target, r);
            sonogram.Draw<Recording>(target, r);
            sonogram.DrawFrequencyScale<Recording>(target, r, true);
            sonogram.DrawTimeline<Recording>(target, r);
            sonogram.DrawPitchTrace<Recording>(target, r);
            for (const auto& [b, colour] : target.rectangles)
                ASSERT_TRUE(std::isfinite(b.x + b.y + b.width + b.height));
        }
}

// Catches vectors and strings made anew for every picture, whatever the style of the curve, and an audio
// thread that waits.
TEST_F(Views, NothingIsAllocatedPerFrame) {
    if (!TestSupport::AudioThreadRules::CanCount()) GTEST_SKIP() << "a sanitizer counts instead";
    const auto sine = TestSupport::Sine<float>(30 * 1600, 445.0, ShownAnalyser::kRate);
    NoDrawing::DrawTarget target;
    const auto draw = [&] {
        analyser.Refresh();
        for (const std::int32_t style : {1, 2, 3}) {
            kivspectrum::settings.view_option_e = style;
            analyser.DoDraw<NoDrawing>(target, {0, 0, 1280, 720});
        }
        analyser.DrawTuner<NoDrawing>(target, {0, 0, 600, 300});
        analyser.DrawTuner<NoDrawing>(target, {0, 0, 100, 30});
    };
    for (int refresh = 0; refresh < 60; ++refresh) {
        const float* const heard = sine.data() + refresh % 30 * 1600;
        EXPECT_EQ(TestSupport::BrokenBy([&] { analyser.Feed(heard, 1600, 1, 1); }), "");
        const std::string broken = TestSupport::BrokenBy(draw);
        if (refresh < 30) continue;
        EXPECT_EQ(broken.find("alloc"), std::string::npos) << broken;
        EXPECT_EQ(broken.find("free"), std::string::npos) << broken;
    }
    EXPECT_TRUE(analyser.GetTuner()->IsTuned());
}

}  // namespace
