#pragma once

#include <cmath>
#include <cstdint>
#include <numbers>

#include "Picture/DrawingBitmap.h"

// The tuner panel's images, drawn with smoothed edges. Colours are 0xRRGGBB. Arcs lie around the panel's
// circle like ripples, bar 0 innermost, those on the left for notes that are too low.
namespace Corvo {

constexpr int kTunerBars = 4;
constexpr float kArcHalfAngle = std::numbers::pi_v<float> * 34.0f / 180.0f;

// Where an arc lies, in units of the circle's radius and seen from its centre.
struct TunerBarShape {
    float left, top, width, height;
    float radius, thickness;
};

inline TunerBarShape TunerBarOf(int bar, bool onTheLeft) {
    constexpr float kFirst = 1.30f, kStep = 0.27f, kThickness = 0.13f;
    const float radius = kFirst + kStep * static_cast<float>(bar);
    const float inner = radius * std::cos(kArcHalfAngle) - kThickness / 2.0f,
                outer = radius + kThickness / 2.0f;
    const float reach = radius * std::sin(kArcHalfAngle) + kThickness / 2.0f;
    return {onTheLeft ? -outer : inner, -reach, outer - inner, 2.0f * reach, radius, kThickness};
}

// The whole pixels that an arc of a circle of so many pixels touches, from the circle's centre, which lies
// between pixels.
struct TunerBarPixels {
    int left, top, width, height;
};

inline TunerBarPixels TunerBarPixelsOf(int bar, bool onTheLeft, int circleRadius) {
    const TunerBarShape shape = TunerBarOf(bar, onTheLeft);
    const auto unit = static_cast<float>(circleRadius);
    const auto before = [&](float edge) { return static_cast<int>(std::floor(edge * unit)); };
    const auto after = [&](float edge) { return static_cast<int>(std::ceil(edge * unit)); };
    const int left = before(shape.left), top = before(shape.top);
    return {left, top, after(shape.left + shape.width) - left, after(shape.top + shape.height) - top};
}

void DrawPanelCircle(DrawingBitmap& bitmap, int diameter, std::uint32_t rgb);
// As large as TunerBarPixelsOf says.
void DrawPanelArc(DrawingBitmap& bitmap, int circleRadius, int bar, bool onTheLeft, std::uint32_t rgb);
// An upright bar with round ends.
void DrawPanelBar(DrawingBitmap& bitmap, int width, int height, std::uint32_t rgb);
// A triangle with its tip to the right or the left.
void DrawPanelArrow(DrawingBitmap& bitmap, int side, bool tipOnTheRight, std::uint32_t rgb);

}  // namespace Corvo
