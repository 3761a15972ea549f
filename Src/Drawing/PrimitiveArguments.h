#pragma once

#include <cmath>
#include <cstddef>

#include "Drawing/DrawTarget.h"

namespace Corvo {

// What every back-end asks of the arguments of a primitive, and a view of its rectangle. What is not a number
// cannot be drawn.

constexpr float kDotsPerInch = 96.0f;
// Far beyond any surface, and within what the fixed-point numbers of drawing systems hold.
constexpr float kLargest = 32767.0f;

inline bool IsUsable(float number) { return std::abs(number) <= kLargest; }
inline bool IsUsable(PointF point) { return IsUsable(point.x) && IsUsable(point.y); }
inline bool IsUsable(const RectF& r) {
    return IsUsable(PointF{r.x, r.y}) && r.width > 0.0f && r.height > 0.0f && IsUsable(r.width) &&
           IsUsable(r.height);
}
// Of a line's width and a text's size.
inline bool IsUsableSize(float size) { return size > 0.0f && IsUsable(size); }

// The caller may have changed its fields.
inline bool IsUsable(const DrawingBitmap& bitmap) {
    return bitmap.width > 0 && bitmap.height > 0 &&
           bitmap.pixels.size() / static_cast<std::size_t>(bitmap.width) >=
               static_cast<std::size_t>(bitmap.height);
}

// The share of a text's width that lies left of its point.
inline float ShareBefore(TextAlign align) {
    return align == TextAlign::Left ? 0.0f : align == TextAlign::Centre ? 0.5f : 1.0f;
}

}  // namespace Corvo
