#pragma once

#include <algorithm>
#include <cmath>

#include "Drawing/Axis.h"
#include "Drawing/Look.h"
#include "Drawing/ShortText.h"

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

// Labels under or over a plot, their baseline at y, between left and right.
template <typename Target, typename Position>
void DrawLabelRow(Target& target, const AxisTicks& ticks, float left, float right, float y,
                  Position position) {
    const float size = Look::kLabelSize * target.Scale();
    LabelRoom room(left, right, Look::kLabelGap * target.Scale());
    for (int rank = 0; rank < AxisTick::kUnlabelled; ++rank)
        for (const AxisTick& tick : ticks.All()) {
            if (tick.rank != rank) continue;
            const float half = target.MeasureText(tick.Label(), size).width / 2.0f;
            const float at = position(tick.value);
            if (at < left - half || at > right + half) continue;
            // The ones at the ends move in; the others stand where they belong.
            const float middle = std::max(std::min(at, right - half), left + half);
            if (room.Take(middle - half, middle + half))
                target.Text(tick.Label(), {middle, y}, TextAlign::Centre, size, {Look::kLabel});
        }
}

// Labels beside a plot, from or up to x, between top and bottom.
template <typename Target, typename Position>
void DrawLabelColumn(Target& target, const AxisTicks& ticks, float top, float bottom, float x,
                     TextAlign align, Position position) {
    const float size = Look::kLabelSize * target.Scale();
    const TextMetrics line = target.MeasureText("0", size);
    const float height = line.ascent + line.descent;
    LabelRoom room(top, bottom, 1.0f);
    for (int rank = 0; rank < AxisTick::kUnlabelled; ++rank)
        for (const AxisTick& tick : ticks.All()) {
            if (tick.rank != rank) continue;
            const float at = position(tick.value);
            if (at < top - height / 2.0f || at > bottom + height / 2.0f) continue;
            const float baseline = at + kCapHeight * size / 2.0f;
            const float highest = top + line.ascent, lowest = bottom - line.descent;
            const float y = std::max(std::min(baseline, lowest), highest);
            if (room.Take(y - line.ascent, y + line.descent))
                target.Text(tick.Label(), {x, y}, align, size, {Look::kLabel});
        }
}

// What the labels of levels, round frequencies and, with `notes`, notes take beside a plot.
template <typename Target>
float LabelWidth(Target& target, bool notes) {
    const float size = Look::kLabelSize * target.Scale();
    float widest = target.MeasureText("\u2212144", size).width;
    constexpr int kWidestOctave = 10 * 12 + 12;
    for (int note = 0; notes && note < 12; ++note)
        widest = std::max(
            widest, target.MeasureText(ShortText().AddNoteName(kWidestOctave + note).View(), size).width);
    return widest;
}

// A line of text in a box whose corner (right for `rightwards` false) is at `corner`, moved to stay within
// `bounds`; left out where it does not fit.
template <typename Target>
void DrawInfoBox(Target& target, const RectF& bounds, PointF corner, bool rightwards, std::string_view text) {
    const float size = Look::kInfoSize * target.Scale();
    const float pad = Look::kGap * 1.5f * target.Scale();
    const TextMetrics line = target.MeasureText(text, size);
    const float width = line.width + 2.0f * pad, height = line.ascent + line.descent + pad;
    if (width > bounds.width || height > bounds.height) return;
    const float x = std::clamp(rightwards ? corner.x : corner.x - width, bounds.x, Right(bounds) - width);
    const float y = std::clamp(corner.y, bounds.y, Bottom(bounds) - height);
    const RectF box = Snapped({x, y, width, height});
    target.FillRoundedRectangle(box, pad, {Look::kBox, 235});
    target.Text(text, {box.x + pad, box.y + pad / 2.0f + line.ascent}, TextAlign::Left, size, {Look::kText});
}

}  // namespace Corvo
