#include "Drawing/Views/AxisDrawing.h"

#include <algorithm>
#include <cmath>

#include "Drawing/Views/Look.h"
#include "Drawing/Views/Rectangles.h"
#include "Drawing/Views/ShortText.h"

namespace Corvo {

void DrawGround(DrawTarget& target, const RectF& rectangle, const RectF& plot) {
    const Ink ink{Look::kGround};
    if (!IsSnapped(rectangle)) return target.FillRectangle(rectangle, ink);
    // Under each other and the plot, so that no seam shows where a pixel is not one of the surface.
    constexpr float kUnder = 1.0f;
    const float left = plot.x + kUnder - rectangle.x, right = Right(rectangle) - Right(plot) + kUnder;
    const float top = plot.y + kUnder - rectangle.y, bottom = Bottom(rectangle) - Bottom(plot) + kUnder;
    target.FillRectangle({rectangle.x, rectangle.y, rectangle.width, top}, ink);
    target.FillRectangle({rectangle.x, Bottom(plot) - kUnder, rectangle.width, bottom}, ink);
    target.FillRectangle({rectangle.x, rectangle.y, left, rectangle.height}, ink);
    target.FillRectangle({Right(plot) - kUnder, rectangle.y, right, rectangle.height}, ink);
}

void DrawGrid(DrawTarget& target, const RectF& plot, const AxisTicks& ticks, bool upright) {
    const float width = std::max(std::round(Look::kHairline * target.Scale()), 1.0f);
    for (const AxisTick& tick : ticks.All()) {
        const float at = std::floor(tick.at);
        const float end = upright ? Right(plot) : Bottom(plot);
        if (at < (upright ? plot.x : plot.y) || at > end) continue;
        const float edge = std::min(at, end - width);
        const Ink ink{tick.rank < AxisTick::kUnlabelled ? Look::kGrid : Look::kMinorGrid};
        if (upright)
            target.FillRectangle({edge, plot.y, width, plot.height}, ink);
        else
            target.FillRectangle({plot.x, edge, plot.width, width}, ink);
    }
}

void DrawLabelRow(DrawTarget& target, const AxisTicks& ticks, float left, float right, float y) {
    const float size = Look::kLabelSize * target.Scale();
    LabelRoom room(left, right, Look::kLabelGap * target.Scale());
    for (int rank = 0; rank < AxisTick::kUnlabelled; ++rank)
        for (const AxisTick& tick : ticks.All()) {
            if (tick.rank != rank) continue;
            const float half = target.MeasureText(tick.Label(), size).width / 2.0f;
            const float middle = tick.at;
            if (room.Take(middle - half, middle + half))
                target.Text(tick.Label(), {middle, y}, TextAlign::Centre, size, {Look::kLabel});
        }
}

void DrawLabelColumn(DrawTarget& target, const AxisTicks& ticks, float top, float bottom, float x,
                     TextAlign align) {
    const float size = Look::kLabelSize * target.Scale();
    const float half = kCapHeight * size / 2.0f;
    LabelRoom room(top, bottom, Look::kGap * target.Scale());
    for (int rank = 0; rank < AxisTick::kUnlabelled; ++rank)
        for (const AxisTick& tick : ticks.All()) {
            const float middle = tick.at;
            if (tick.rank == rank && room.Take(middle - half, middle + half))
                target.Text(tick.Label(), {x, middle + half}, align, size, {Look::kLabel});
        }
}

LabelMargins MarginsFor(DrawTarget& target, bool notes) {
    const float scale = target.Scale(), size = Look::kLabelSize * scale, gap = Look::kGap * scale;
    float widest = 0.0f;
    for (const char* label : {"\u2212144", "500 Hz", "0 dB"})
        widest = std::max(widest, target.MeasureText(label, size).width);
    constexpr int kWidestOctave = 10 * 12 + 12;
    for (int note = 0; notes && note < 12; ++note)
        widest = std::max(
            widest, target.MeasureText(ShortText().AddNoteName(kWidestOctave + note).View(), size).width);
    const TextMetrics line = target.MeasureText("20 Hz", size);
    return {widest + 2.0f * gap, (kCapHeight * size + gap) / 2.0f, std::max(line.width / 2.0f, gap),
            line.ascent + line.descent + 1.25f * gap};
}

float RowBaseline(DrawTarget& target, float plotBottom) {
    const float size = Look::kLabelSize * target.Scale();
    return plotBottom + Look::kGap * target.Scale() + target.MeasureText("0", size).ascent;
}

AxisRoom RoomAlong(DrawTarget& target, float length) {
    const float scale = target.Scale();
    const float label = target.MeasureText("500", Look::kLabelSize * scale).width;
    return {length, 6.0f * scale, label + Look::kLabelGap * scale};
}

AxisRoom RoomForLevels(const DrawTarget& target, float length) {
    return {length, 6.0f * target.Scale(), Look::kLevelPitch * target.Scale()};
}

AxisRoom RoomBeside(const DrawTarget& target, float length) {
    const float scale = target.Scale();
    return {length, 6.0f * scale, (kCapHeight * Look::kLabelSize + 2.0f * Look::kGap) * scale};
}

RectF InfoBoxOf(DrawTarget& target, std::string_view text) {
    const float pad = Look::kGap * 1.5f * target.Scale();
    const TextMetrics line = target.MeasureText(text, Look::kInfoSize * target.Scale());
    return {0.0f, 0.0f, line.width + 2.0f * pad, line.ascent + line.descent + pad};
}

void DrawInfoBox(DrawTarget& target, const RectF& bounds, PointF corner, std::string_view text, Ink ink) {
    const RectF size = InfoBoxOf(target, text);
    if (size.width > bounds.width || size.height > bounds.height) return;
    const float pad = Look::kGap * 1.5f * target.Scale(), em = Look::kInfoSize * target.Scale();
    const float x = std::max(std::min(corner.x, Right(bounds) - size.width), bounds.x);
    const float y = std::max(std::min(corner.y, Bottom(bounds) - size.height), bounds.y);
    const RectF box = Snapped({x, y, size.width, size.height});
    target.FillRoundedRectangle(box, pad, {Look::kBox, 235});
    target.Text(text, {box.x + pad, box.y + pad / 2.0f + target.MeasureText(text, em).ascent},
                TextAlign::Left, em, ink);
}

void DrawPointerBox(DrawTarget& target, const RectF& plot, PointF pointer, std::string_view text,
                    std::string_view difference) {
    const float gap = Look::kGap * target.Scale();
    const RectF inner = Shrunk(plot, gap, gap, gap, gap);
    const auto box = [&](std::string_view line, float y, ColourReference colour) {
        const bool rightwards = pointer.x < Centre(plot).x;
        const float x =
            rightwards ? pointer.x + 2.0f * gap : pointer.x - 2.0f * gap - InfoBoxOf(target, line).width;
        DrawInfoBox(target, inner, {x, y}, line, {colour});
    };
    const float height = InfoBoxOf(target, text).height + gap / 2.0f;
    const float below = pointer.y + 2.0f * gap;
    if (difference.empty()) return box(text, below, Look::kText);
    const float y = std::min(below, Bottom(inner) - 2.0f * height);
    box(text, y, Look::kText);
    box(difference, y + height, Look::kMarker);
}

void DrawMarker(DrawTarget& target, const RectF& plot, PointF at, bool upright) {
    const float width = std::max(std::round(target.Scale()), 1.0f), arm = 4.0f * target.Scale();
    const Ink ink{Look::kMarker, 200};
    target.PushClip(plot);
    if (upright)
        target.FillRectangle({std::floor(at.x), plot.y, width, plot.height}, ink);
    else
        target.FillRectangle({plot.x, std::floor(at.y), plot.width, width}, ink);
    const PointF diamond[] = {{at.x - arm, at.y}, {at.x, at.y - arm}, {at.x + arm, at.y}, {at.x, at.y + arm}};
    if (Contains(plot, at)) target.FillPolygon(diamond, 4, {Look::kMarker});
    target.PopClip();
}

}  // namespace Corvo
