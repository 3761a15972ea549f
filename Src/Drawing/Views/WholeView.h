#pragma once

#include <algorithm>
#include <cmath>

#include "Drawing/Views/SonogramView.h"
#include "Drawing/Views/SpectrumView.h"
#include "Drawing/Views/TunerView.h"

// What the display mode says; a tuner that is on has a strip above the rest.
template <class Drawing>
void kivspectrum::DoDraw(typename Drawing::DrawTarget& target, const Corvo::RectF& rectangle) {
    using namespace Corvo;
    if (!IsDrawable(rectangle)) return;
    const _display_mode mode = m_displayMode;
    if (mode == display_tuner) return DrawTuner<Drawing>(target, rectangle);
    constexpr float kShare = 0.25f, kLeast = 36.0f, kMost = 180.0f;
    const float wanted =
        std::clamp(kShare * rectangle.height, kLeast * target.Scale(), kMost * target.Scale());
    const float strip = m_tunerVisible ? std::min(std::round(wanted), rectangle.height) : 0.0f;
    const RectF rest = Shrunk(rectangle, 0.0f, strip, 0.0f, 0.0f);
    DrawTuner<Drawing>(target, {rectangle.x, rectangle.y, rectangle.width, strip});
    if (mode == display_sonogram)
        DrawSonogramComponents<Drawing>(target, rest);
    else if (mode == display_both)
        DoDrawSonogramAndSpectrum<Drawing>(target, rest);
    else
        DoDrawSpectrum<Drawing>(target, rest);
}
