#pragma once

#include <array>
#include <cmath>

#include "Drawing/DrawTarget.h"

namespace TestSupport {

constexpr int kSceneWidth = 480, kSceneHeight = 300;

// A picture with every primitive in it, in the colours and sizes that the drawing routines use.
template <typename Target>
void PaintScene(Target& target) {
    using namespace Corvo;
    constexpr ColourReference kGround = ColourFromRgb(0x14181D), kGrid = ColourFromRgb(0x39424E);
    constexpr ColourReference kCurve = ColourFromRgb(0x4FC3F7), kText = ColourFromRgb(0xE6EBF0);
    constexpr ColourReference kWarm = ColourFromRgb(0xFFB347);
    constexpr RectF kPlot{40, 20, 420, 160};

    target.Clear(kGround);
    target.PushClip(kPlot);
    for (int i = 0; i <= 8; ++i) {
        const float y = kPlot.y + 20.0f * static_cast<float>(i) + 0.5f;
        target.Line({kPlot.x, y}, {kPlot.x + kPlot.width, y}, {{kGrid}, 1.0f});
    }
    std::array<PointF, 216> curve;
    for (std::size_t i = 0; i < 212; ++i) {
        const auto x = static_cast<float>(i);
        curve[i] = {kPlot.x + 2.0f * x, 100.0f + 70.0f * std::sin(x * 0.09f) * std::exp(-x * 0.008f)};
    }
    target.Polyline(curve.data(), 212, {{kCurve}, 2.0f});
    curve[212] = {kPlot.x + kPlot.width, kPlot.y + kPlot.height};
    curve[213] = {kPlot.x, kPlot.y + kPlot.height};
    target.FillPolygon(curve.data(), 214, {kCurve, 60});
    target.PopClip();
    target.OutlineRectangle(kPlot, {{kGrid}, 1.0f});

    target.FillRoundedRectangle({40, 200, 130, 80}, 10.0f, {ColourFromRgb(0x232B34)});
    target.Text("A#4", {105, 258}, TextAlign::Centre, 48.0f, {kText});
    target.FillRectangle({190, 200, 60, 30}, {kWarm});
    target.FillRectangle({220, 215, 60, 30}, {kCurve, 128});
    target.OutlineRectangle({190, 250, 90, 30}, {{kWarm}, 3.0f});
    constexpr PointF kNeedle[] = {{300, 280}, {345, 200}, {350, 203}, {312, 280}};
    target.FillPolygon(kNeedle, 4, {kWarm});
    target.Line({370, 275}, {440, 205}, {{kCurve}, 4.0f});
    constexpr const char* kLabels[] = {"0", "-20", "-40", "-60", "-80"};
    for (int i = 0; i < 5; ++i) {
        const float baseline = kPlot.y + 32.0f * static_cast<float>(i) + 16.0f;
        target.Text(kLabels[i], {34, baseline}, TextAlign::Right, 12.0f, {kText});
    }
    target.Text("440.0 Hz, 12.5 cents", {300, 196}, TextAlign::Left, 12.0f, {kText});

    DrawingBitmap bitmap;
    bitmap.Size(16, 16);
    for (std::uint32_t i = 0; i < 256; ++i) {
        const std::uint32_t alpha = (i % 16) * 17, share = (i / 16) * alpha / 15;
        bitmap.pixels[i] = alpha << 24 | alpha << 16 | share << 8;
    }
    target.Bitmap(bitmap, {450, 200, 16, 16}, 255);
    target.Bitmap(bitmap, {386, 230, 80, 50}, 200);
}

}  // namespace TestSupport
