#include <algorithm>
#include <cmath>

#include "Drawing/Views/Look.h"
#include "Drawing/Views/Rectangles.h"
#include "Drawing/Views/SonogramView.h"
#include "Drawing/Views/SpectrumView.h"
#include "Drawing/Views/ViewAccess.h"
#include "Drawing/Views/Views.h"

// What is made of several views.
namespace Corvo {

void DrawSonogramAndSpectrum(kivspectrum& analyser, DrawTarget& target, const RectF& rectangle) {
    if (!IsDrawable(rectangle)) return;
    ViewAccess::ForgetPlots(analyser);
    constexpr float kSpectrum = 0.4f;
    const float height = std::round(kSpectrum * rectangle.height);
    const RectF upper{rectangle.x, rectangle.y, rectangle.width, height};
    const RectF lower = Shrunk(rectangle, 0.0f, height, 0.0f, 0.0f);
    SpectrumSettings view = kivspectrum::GetSettings();
    // Labels on both or on neither, so that the plots stand flush.
    if (!LayOutSpectrum(target, upper, view).labels ||
        !IsDrawable(LayOutSonogram(target, lower, view).timeline))
        view.view_flag_b = 0;
    DrawSpectrumAs(analyser, target, upper, view);
    DrawSonogramAs(analyser, target, lower, view);
}

void DrawWhole(kivspectrum& analyser, DrawTarget& target, const RectF& rectangle) {
    if (!IsDrawable(rectangle)) return;
    const auto mode = analyser.GetDisplayMode();
    if (mode == kivspectrum::display_tuner) ViewAccess::ForgetPlots(analyser);
    if (mode == kivspectrum::display_tuner) return DrawTuner(analyser, target, rectangle);
    constexpr float kShare = 0.25f, kLeast = 36.0f, kMost = 180.0f;
    const float wanted =
        std::clamp(kShare * rectangle.height, kLeast * target.Scale(), kMost * target.Scale());
    const bool tuner = ViewAccess::IsTunerVisible(analyser);
    const float strip = tuner ? std::min(std::round(wanted), rectangle.height) : 0.0f;
    const RectF rest = Shrunk(rectangle, 0.0f, strip, 0.0f, 0.0f);
    DrawTuner(analyser, target, {rectangle.x, rectangle.y, rectangle.width, strip});
    if (mode == kivspectrum::display_sonogram)
        DrawSonogram(analyser, target, rest);
    else if (mode == kivspectrum::display_both)
        DrawSonogramAndSpectrum(analyser, target, rest);
    else
        DrawSpectrum(analyser, target, rest);
}

}  // namespace Corvo
