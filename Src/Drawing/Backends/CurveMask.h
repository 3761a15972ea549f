#pragma once

#include <cstdint>
#include <vector>

#include "Drawing/DrawTarget.h"

namespace Corvo {

// How much of each pixel a line with round joins and ends covers, or the area under it, for a line that runs
// to the right all the way, as a curve over frequencies does: then every column's part of it is one stretch.
// Much faster than the drawing system's own outlines for lines with a point in every pixel.
class CurveMask {
public:
    // As high as what is drawn is there: rows of `stride` bytes, 255 where a pixel is covered. Below them all
    // pixels of `solid` rows are.
    struct Strip {
        int left, top, width, height, stride, solid;
        std::uint8_t* pixels;
    };

    // Whether the points run to the right, or straight up and down at the ends of a step.
    static bool IsCurve(const PointF* points, int count);

    // Take the part within whole pixels of a line or of the area from it down to `ground`.
    void Line(const PointF* points, int count, float width, const RectF& within);
    void Area(const PointF* points, int count, float ground, const RectF& within);
    // The next strip of it, from the left; valid until the next call. False when there is none left.
    bool Next(Strip& strip);

private:
    struct Range {
        int first, end;
    };

    bool Reach(float left, float right, const RectF& within);
    Range CutsBetween(float from, float to) const;
    void AddDisc(PointF centre, float radius);
    void AddSegment(PointF from, PointF to, float radius);
    void AddColumn(int column, int top, int height, std::uint8_t* pixel) const;

    int m_left = 0, m_top = 0, m_width = 0, m_height = 0;
    int m_next = 0;  // the first column that no strip had
    // Where the line begins and ends on each of the lines that a pixel's column is cut into.
    std::vector<float> m_tops, m_bottoms;
    std::vector<float> m_halves;  // of a disc, on the cuts that it reaches
    float m_halvesFrom = 0.0f;    // the first of these, from its centre
    std::vector<std::uint8_t> m_pixels;
};

}  // namespace Corvo
