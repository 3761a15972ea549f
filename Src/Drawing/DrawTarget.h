#pragma once

#include <concepts>
#include <cstdint>
#include <string_view>

#include "Picture/DrawingBitmap.h"
#include "Picture/DrawingColour.h"
#include "Picture/Geometry.h"

namespace Corvo {

struct Ink {
    ColourReference colour;
    std::uint8_t opacity = 255;  // 0 clear .. 255
};

// A line of `width` pixels along a path; joins and ends are round.
struct Stroke {
    Ink ink;
    float width;
};

enum class TextAlign { Left, Centre, Right };

// Of one line of text, in pixels. Ascent and descent are the font's, above and below the baseline.
struct TextMetrics {
    float width, ascent, descent;
};

// Height of capitals and digits as a share of the text's size; close enough for every plain sans-serif.
constexpr float kCapHeight = 0.7f;

// The primitives that every back-end's DrawTarget has; the drawing routines use nothing else.
//
// A target stands for one surface while one picture is drawn. Coordinates are device pixels, x to the right,
// y down; whole numbers are pixel edges. Edges are smoothed, and what lies outside the clip is left alone.
// Text is UTF-8 without line breaks, cut after the last whole character of 95 bytes; `size` is its em in
// pixels. A size, width or rectangle that is empty or not a number draws nothing.
//
//   Scale()              pixels per 1/96 inch
//   Clear                fills the whole surface, the clip apart
//   Line, Polyline       stroked; fewer than two points draw nothing
//   FillPolygon          closed, even-odd
//   OutlineRectangle     the line lies within the rectangle
//   FillRoundedRectangle the radius is limited to half the shorter side
//   Text                 from, around or up to `baseline`
//   Bitmap               stretched over `destination`, smoothly unless at its own size
//   PushClip, PopClip    clips nest, each within the one before
template <typename T>
concept IsDrawTarget = requires(T& target, PointF point, const PointF* points, int count,
                                const RectF& rectangle, Ink ink, const Stroke& stroke, std::string_view text,
                                float number, const DrawingBitmap& bitmap) {
    { target.Scale() } -> std::convertible_to<float>;
    target.Clear(ink.colour);
    target.Line(point, point, stroke);
    target.Polyline(points, count, stroke);
    target.FillPolygon(points, count, ink);
    target.FillRectangle(rectangle, ink);
    target.OutlineRectangle(rectangle, stroke);
    target.FillRoundedRectangle(rectangle, number, ink);
    { target.MeasureText(text, number) } -> std::convertible_to<TextMetrics>;
    target.Text(text, point, TextAlign::Left, number, ink);
    target.Bitmap(bitmap, rectangle, ink.opacity);
    target.PushClip(rectangle);
    target.PopClip();
};

}  // namespace Corvo
