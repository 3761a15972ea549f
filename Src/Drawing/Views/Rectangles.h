#pragma once

#include <algorithm>
#include <cmath>

#include "Drawing/PrimitiveArguments.h"
#include "Picture/Geometry.h"

namespace Corvo {

inline float Right(const RectF& r) { return r.x + r.width; }
inline float Bottom(const RectF& r) { return r.y + r.height; }
inline PointF Centre(const RectF& r) { return {r.x + r.width / 2.0f, r.y + r.height / 2.0f}; }

// Without what `left`, `top`, `right` and `bottom` take from the sides; never less than nothing.
inline RectF Shrunk(const RectF& r, float left, float top, float right, float bottom) {
    return {r.x + left, r.y + top, std::max(r.width - left - right, 0.0f),
            std::max(r.height - top - bottom, 0.0f)};
}

// To whole pixels, so that edges are crisp.
inline RectF Snapped(const RectF& r) {
    const float x = std::round(r.x), y = std::round(r.y);
    return {x, y, std::round(Right(r)) - x, std::round(Bottom(r)) - y};
}

inline bool IsSnapped(const RectF& r) {
    const RectF snapped = Snapped(r);
    return r.x == snapped.x && r.y == snapped.y && r.width == snapped.width && r.height == snapped.height;
}

// False for what a view draws nothing on: less than a pixel, not a number, or beyond any surface.
inline bool IsDrawable(const RectF& r) { return IsUsable(r) && r.width >= 1.0f && r.height >= 1.0f; }

}  // namespace Corvo
