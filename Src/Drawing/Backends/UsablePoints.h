#pragma once

#include <vector>

#include "Drawing/PrimitiveArguments.h"

namespace Corvo {

// Points as a drawing system takes them, those left out that cannot be drawn. Keeps its memory from one use
// to the next.
template <typename Point>
class UsablePoints {
public:
    const std::vector<Point>& Of(const PointF* points, int count) {
        m_points.clear();
        for (int i = 0; i < count; ++i)
            if (IsUsable(points[i])) m_points.push_back({points[i].x, points[i].y});
        return m_points;
    }

private:
    std::vector<Point> m_points;
};

}  // namespace Corvo
