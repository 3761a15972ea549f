#include "Spectrum/Tuner/TunerPanelBitmaps.h"

#include <algorithm>
#include <cmath>

namespace Corvo {
namespace {

std::uint32_t Premultiplied(std::uint32_t rgb, float alpha) {
    const auto part = [&](int shift) {
        const float value = static_cast<float>(rgb >> shift & 0xFFu) * alpha;
        return static_cast<std::uint32_t>(std::lround(value)) << shift;
    };
    return static_cast<std::uint32_t>(std::lround(255.0f * alpha)) << 24 | part(16) | part(8) | part(0);
}

// Colours every pixel by how far its centre is outside the shape (pixels; negative inside): the edge is one
// pixel wide.
template <typename Distance>
void Fill(DrawingBitmap& bitmap, int width, int height, std::uint32_t rgb, Distance distance) {
    bitmap.Size(width, height);
    bitmap.opaque = false;
    bitmap.Changed();
    for (int y = 0; y < bitmap.height; ++y)
        for (int x = 0; x < bitmap.width; ++x) {
            const float outside = distance(static_cast<float>(x) + 0.5f, static_cast<float>(y) + 0.5f);
            bitmap.Row(y)[x] = Premultiplied(rgb, std::clamp(0.5f - outside, 0.0f, 1.0f));
        }
}

// From the part of a circle that lies within half an angle of the x axis, as thick as a pen with a round tip.
float ArcDistance(float x, float y, float radius, float thickness) {
    const float up = std::abs(y);
    const float endX = radius * std::cos(kArcHalfAngle), endY = radius * std::sin(kArcHalfAngle);
    const bool besideArc = std::atan2(up, x) <= kArcHalfAngle;
    const float away = besideArc ? std::abs(std::hypot(x, up) - radius) : std::hypot(x - endX, up - endY);
    return away - thickness / 2.0f;
}

}  // namespace

void DrawPanelCircle(DrawingBitmap& bitmap, int diameter, std::uint32_t rgb) {
    const float radius = static_cast<float>(diameter) / 2.0f;
    Fill(bitmap, diameter, diameter, rgb,
         [&](float x, float y) { return std::hypot(x - radius, y - radius) - radius; });
}

void DrawPanelArc(DrawingBitmap& bitmap, int circleRadius, int bar, bool onTheLeft, std::uint32_t rgb) {
    const TunerBarShape shape = TunerBarOf(bar, onTheLeft);
    const TunerBarPixels pixels = TunerBarPixelsOf(bar, onTheLeft, circleRadius);
    const auto unit = static_cast<float>(circleRadius);
    Fill(bitmap, pixels.width, pixels.height, rgb, [&](float x, float y) {
        const float right = x + static_cast<float>(pixels.left), down = y + static_cast<float>(pixels.top);
        return ArcDistance(onTheLeft ? -right : right, down, shape.radius * unit, shape.thickness * unit);
    });
}

void DrawPanelBar(DrawingBitmap& bitmap, int width, int height, std::uint32_t rgb) {
    const float half = static_cast<float>(width) / 2.0f;
    const float last = std::max(static_cast<float>(height) - half, half);
    Fill(bitmap, width, height, rgb,
         [&](float x, float y) { return std::hypot(x - half, y - std::clamp(y, half, last)) - half; });
}

void DrawPanelArrow(DrawingBitmap& bitmap, int side, bool tipOnTheRight, std::uint32_t rgb) {
    const auto length = static_cast<float>(side);
    const float slope = std::hypot(1.0f, 0.5f);
    Fill(bitmap, side, side, rgb, [&](float x, float y) {
        const float fromTip = tipOnTheRight ? length - x : x;
        return (std::abs(y - length / 2.0f) - fromTip / 2.0f) / slope;
    });
}

}  // namespace Corvo
