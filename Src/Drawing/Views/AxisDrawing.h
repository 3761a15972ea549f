#pragma once

#include <algorithm>
#include <cmath>

#include "Drawing/Views/Axis.h"
#include "Drawing/Views/Look.h"
#include "Drawing/Views/ShortText.h"

// Grid lines and labels of scales. `position` turns a tick's value into x or y.
namespace Corvo {

template <typename Target, typename Position>
void DrawGrid(Target& target, const RectF& plot, const AxisTicks& ticks, bool upright, Position position) {
    const float width = std::max(std::round(Look::kHairline * target.Scale()), 1.0f);
    for (const AxisTick& tick : ticks.All()) {
        const float at = std::floor(position(tick.value));
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

// Labels under a plot, centred on their places, their baseline at y; all within left..right.
template <typename Target, typename Position>
void DrawLabelRow(Target& target, const AxisTicks& ticks, float left, float right, float y,
                  Position position) {
    const float size = Look::kLabelSize * target.Scale();
    LabelRoom room(left, right, Look::kLabelGap * target.Scale());
    for (int rank = 0; rank < AxisTick::kUnlabelled; ++rank)
        for (const AxisTick& tick : ticks.All()) {
            if (tick.rank != rank) continue;
            const float half = target.MeasureText(tick.Label(), size).width / 2.0f;
            const float middle = position(tick.value);
            if (room.Take(middle - half, middle + half))
                target.Text(tick.Label(), {middle, y}, TextAlign::Centre, size, {Look::kLabel});
        }
}

// Labels beside a plot, from or up to x, centred on their places; all within top..bottom.
template <typename Target, typename Position>
void DrawLabelColumn(Target& target, const AxisTicks& ticks, float top, float bottom, float x,
                     TextAlign align, Position position) {
    const float size = Look::kLabelSize * target.Scale();
    const float half = kCapHeight * size / 2.0f;
    LabelRoom room(top, bottom, Look::kGap * target.Scale());
    for (int rank = 0; rank < AxisTick::kUnlabelled; ++rank)
        for (const AxisTick& tick : ticks.All()) {
            const float middle = position(tick.value);
            if (tick.rank == rank && room.Take(middle - half, middle + half))
                target.Text(tick.Label(), {x, middle + half}, align, size, {Look::kLabel});
        }
}

// Around a plot with labels to its left and below it: what those take, and half of the outermost ones.
struct LabelMargins {
    float left, top, right, bottom;
};

template <typename Target>
LabelMargins MarginsFor(Target& target, bool notes) {
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

// Where a row of labels under a plot has its baseline.
template <typename Target>
float RowBaseline(Target& target, float plotBottom) {
    const float size = Look::kLabelSize * target.Scale();
    return plotBottom + Look::kGap * target.Scale() + target.MeasureText("0", size).ascent;
}

template <typename Target>
AxisRoom RoomAlong(Target& target, float length) {
    const float scale = target.Scale();
    const float label = target.MeasureText("500", Look::kLabelSize * scale).width;
    return {length, 6.0f * scale, label + Look::kLabelGap * scale};
}

// Levels are read off less closely than frequencies.
template <typename Target>
AxisRoom RoomForLevels(Target& target, float length) {
    return {length, 6.0f * target.Scale(), Look::kLevelPitch * target.Scale()};
}

template <typename Target>
AxisRoom RoomBeside(Target& target, float length) {
    const float scale = target.Scale();
    return {length, 6.0f * scale, (kCapHeight * Look::kLabelSize + 2.0f * Look::kGap) * scale};
}

// A line of text in a box of its own.
template <typename Target>
RectF InfoBoxOf(Target& target, std::string_view text) {
    const float pad = Look::kGap * 1.5f * target.Scale();
    const TextMetrics line = target.MeasureText(text, Look::kInfoSize * target.Scale());
    return {0.0f, 0.0f, line.width + 2.0f * pad, line.ascent + line.descent + pad};
}

// Moved to stay within `bounds`; left out where it does not fit.
template <typename Target>
void DrawInfoBox(Target& target, const RectF& bounds, PointF corner, std::string_view text, Ink ink) {
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

// Beside the pointer, on the side where there is more room.
template <typename Target>
void DrawPointerBox(Target& target, const RectF& plot, PointF pointer, std::string_view text) {
    const float gap = Look::kGap * target.Scale();
    const bool rightwards = pointer.x < Centre(plot).x;
    const float x =
        rightwards ? pointer.x + 2.0f * gap : pointer.x - 2.0f * gap - InfoBoxOf(target, text).width;
    DrawInfoBox(target, Shrunk(plot, gap, gap, gap, gap), {x, pointer.y + 2.0f * gap}, text, {Look::kText});
}

}  // namespace Corvo
