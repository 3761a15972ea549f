#pragma once

#include <cstdint>
#include <vector>

#include "Drawing/DrawTarget.h"

namespace Corvo {

// How much of each pixel a line with round joins and ends covers, for a line that runs to the right all the
// way, as a curve over frequencies does: then every column's part of it is one stretch. Much faster than the
// drawing system's own outlines for lines with a point in every pixel.
class CurveMask {
public:
    // Whether the points run to the right, or straight up and down at the ends of a step.
    static bool IsCurve(const PointF* points, int count);

    // Draws what lies within left, top, right, bottom (whole pixels). False when nothing does.
    bool Draw(const PointF* points, int count, float width, const RectF& within);

    // The part that was drawn: rows of `stride` bytes, 255 where a pixel is covered.
    int Left() const { return m_left; }
    int Top() const { return m_top; }
    int Width() const { return m_width; }
    int Height() const { return m_height; }
    int Stride() const { return m_stride; }
    std::uint8_t* Pixels() { return m_pixels.data(); }

private:
    // Of one of the lines that a pixel's column is cut into.
    struct Stretch {
        float top, bottom;
    };

    void AddDisc(PointF centre, float radius);
    void AddSegment(PointF from, PointF to, float radius);
    void FillColumn(int column);

    int m_left = 0, m_top = 0, m_width = 0, m_height = 0, m_stride = 0;
    std::vector<Stretch> m_stretches;
    std::vector<std::uint8_t> m_pixels;
};

}  // namespace Corvo
