#pragma once

#include <cstdint>
#include <string_view>

#include "Picture/DrawingBitmap.h"
#include "Picture/DrawingColour.h"
#include "Picture/Geometry.h"
#include "Platform/Export.h"

namespace Corvo {

// What something is drawn with.
struct Ink {
    ColourReference colour;      // red in the low byte
    std::uint8_t opacity = 255;  // 0 clear to 255
};

// A line of `width` pixels along a path; joins and ends are round.
struct Stroke {
    Ink ink;      // of the line
    float width;  // pixels, above 0
};

// Which part of a text stands at its place.
enum class TextAlign { Left, Centre, Right };

// Of one line of text, in pixels. Ascent and descent are the font's, above and below the baseline.
struct TextMetrics {
    float width, ascent, descent;  // each 0 or above
};

// Height of capitals and digits as a share of the text's size; close enough for every plain sans-serif.
constexpr float kCapHeight = 0.7f;

// One surface while one picture is drawn: the primitives that every back-end has. The drawing routines use
// nothing else, so a host may also write a target of its own.
//
// Coordinates are device pixels, x to the right, y down; whole numbers are pixel edges. Edges are smoothed,
// and what lies outside the clip is left alone. Text is UTF-8 without line breaks, cut after the last whole
// character of 95 bytes; `size` is its em in pixels. A size, width or rectangle that is empty, not a number
// or beyond 32767 draws nothing. Used on the thread that draws, where drawing may allocate and throw
// std::bad_alloc; nothing is kept of the arguments.
//
// Cost: a primitive takes what its back-end needs for the pixels that it covers. A whole frame of 1280 x 720
// pixels, analyser and scales, takes 0.5 to 2 ms with Cairo.
class DSP_API DrawTarget {
public:
    // `dpi` is the surface's dots per inch; what is not above 0 counts as 96.
    explicit DrawTarget(float dpi);
    virtual ~DrawTarget();
    DrawTarget(const DrawTarget&) = delete;
    DrawTarget& operator=(const DrawTarget&) = delete;

    // Pixels per 1/96 inch.
    float Scale() const { return m_scale; }

    // Fills the whole surface, except for what the clip protects.
    virtual void Clear(ColourReference colour) = 0;
    // Stroked. As a polyline of two points, unless the back-end knows better.
    virtual void Line(PointF from, PointF to, const Stroke& stroke);
    // Stroked; fewer than two points draw nothing.
    virtual void Polyline(const PointF* points, int count, const Stroke& stroke) = 0;
    // Closed, filled by the even-odd rule.
    virtual void FillPolygon(const PointF* points, int count, Ink ink) = 0;
    // Filled, in pixels.
    virtual void FillRectangle(const RectF& rectangle, Ink ink) = 0;
    // The line lies within the rectangle.
    virtual void OutlineRectangle(const RectF& rectangle, const Stroke& stroke) = 0;
    // The radius is limited to half the shorter side.
    virtual void FillRoundedRectangle(const RectF& rectangle, float radius, Ink ink) = 0;
    // What Text would take; 0 for an empty text.
    virtual TextMetrics MeasureText(std::string_view text, float size) = 0;
    // From, around or up to `baseline`.
    virtual void Text(std::string_view text, PointF baseline, TextAlign align, float size, Ink ink) = 0;
    // Stretched over `destination`, smoothly unless at its own size.
    virtual void Bitmap(const DrawingBitmap& bitmap, const RectF& destination, std::uint8_t opacity) = 0;
    // Clips nest, each within the one before.
    virtual void PushClip(const RectF& rectangle) = 0;
    virtual void PopClip() = 0;

private:
    float m_scale;
};

}  // namespace Corvo
