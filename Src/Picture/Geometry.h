#pragma once

namespace Corvo {

// In pixels, y downwards.
struct PointF {
    float x, y;  // whole numbers are edges of pixels
};
struct RectF {
    float x, y, width, height;  // x and y of the upper left corner
};

// The left and upper edges belong to a rectangle.
inline bool Contains(const RectF& r, PointF p) {
    return p.x >= r.x && p.x < r.x + r.width && p.y >= r.y && p.y < r.y + r.height;
}

}  // namespace Corvo
