#include <gtest/gtest.h>

#include <string>

#include "Drawing/Views/ShownAnalyser.h"
#include "Drawing/Views/Views.h"
#include "Support/AudioThreadRules.h"
#include "Support/NoDrawing.h"

namespace {

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
    TestSupport::NoDrawing::DrawTarget target;
    const auto play = [&] {
        for (int refresh = 0; refresh < 30; ++refresh) {
            analyser.Feed(sine.data() + refresh * 1600, 1600, 1, 1);
            analyser.Refresh();
            for (const std::int32_t style : {1, 2, 3}) {
                kivspectrum::settings.view_option_e = style;
                analyser.DoDraw<TestSupport::NoDrawing>(target, {0, 0, 1280, 720});
            }
            analyser.DrawTuner<TestSupport::NoDrawing>(target, {0, 0, 600, 300});
            analyser.DrawTuner<TestSupport::NoDrawing>(target, {0, 0, 100, 30});
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
