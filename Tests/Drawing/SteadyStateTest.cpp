#include <gtest/gtest.h>

#include <string>

#include "Drawing/ShownAnalyser.h"
#include "Drawing/Views.h"
#include "Support/AudioThreadRules.h"

namespace {

// A back-end that only measures, so that what a graphics library allocates does not count.
struct NoDrawing {
    struct DrawTarget {
        float Scale() const { return 1.0f; }
        void Clear(Corvo::ColourReference) {}
        void Line(Corvo::PointF, Corvo::PointF, const Corvo::Stroke&) {}
        void Polyline(const Corvo::PointF*, int, const Corvo::Stroke&) {}
        void FillPolygon(const Corvo::PointF*, int, Corvo::Ink) {}
        void FillRectangle(const Corvo::RectF&, Corvo::Ink) {}
        void OutlineRectangle(const Corvo::RectF&, const Corvo::Stroke&) {}
        void FillRoundedRectangle(const Corvo::RectF&, float, Corvo::Ink) {}
        Corvo::TextMetrics MeasureText(std::string_view text, float size) {
            return {0.6f * size * static_cast<float>(text.size()), size, 0.25f * size};
        }
        void Text(std::string_view, Corvo::PointF, Corvo::TextAlign, float, Corvo::Ink) {}
        void Bitmap(const Corvo::DrawingBitmap&, const Corvo::RectF&, std::uint8_t) {}
        void PushClip(const Corvo::RectF&) {}
        void PopClip() {}
    };
};
static_assert(Corvo::IsDrawTarget<NoDrawing::DrawTarget>);

class SteadyState : public ViewTest {};

// Catches vectors and strings made anew for every picture, whatever the style of the curve.
TEST_F(SteadyState, NothingIsAllocatedPerFrame) {
    if (!TestSupport::AudioThreadRules::CanCount()) GTEST_SKIP() << "a sanitizer counts instead";
    ShownAnalyser shown;
    kivspectrum& analyser = shown.analyser;
    analyser.SetTunerOn(true);
    analyser.ObserverUpdate();
    analyser.ShowSonogram(true);
    const auto sine = TestSupport::Sine<float>(30 * 1600, 445.0, ShownAnalyser::kRate);
    NoDrawing::DrawTarget target;
    const auto play = [&] {
        for (int refresh = 0; refresh < 30; ++refresh) {
            analyser.Feed(sine.data() + refresh * 1600, 1600, 1, 1);
            analyser.Refresh();
            for (const std::int32_t style : {1, 2, 3}) {
                kivspectrum::settings.view_option_e = style;
                analyser.DoDraw<NoDrawing>(target, {0, 0, 1280, 720});
            }
            analyser.DrawTuner<NoDrawing>(target, {0, 0, 600, 300});
            analyser.DrawTuner<NoDrawing>(target, {0, 0, 100, 30});
        }
    };
    play();
    ASSERT_TRUE(analyser.GetTuner()->IsTuned());
    const TestSupport::AudioThreadRules rules;
    play();
    const std::string broken = rules.Broken();
    EXPECT_EQ(broken.find("alloc"), std::string::npos) << broken;
    EXPECT_EQ(broken.find("free"), std::string::npos) << broken;
}

}  // namespace
