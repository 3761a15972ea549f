#pragma once

namespace Corvo {

// In pixels, y downwards.
struct PointF {
    float x, y;
};
struct RectF {
    float x, y, width, height;
};

}  // namespace Corvo
