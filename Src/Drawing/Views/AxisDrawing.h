#pragma once

#include <string_view>

#include "Drawing/DrawTarget.h"
#include "Drawing/Views/Axis.h"

// Grid lines and labels of scales whose ticks have their places.
namespace Corvo {

// The ground around a plot that is going to be covered, so that no pixel is filled twice.
void DrawGround(DrawTarget& target, const RectF& rectangle, const RectF& plot);
void DrawGrid(DrawTarget& target, const RectF& plot, const AxisTicks& ticks, bool upright);
// Labels under a plot, centred on their places, their baseline at y; all within left..right.
void DrawLabelRow(DrawTarget& target, const AxisTicks& ticks, float left, float right, float y);
// Labels beside a plot, from or up to x, centred on their places; all within top..bottom.
void DrawLabelColumn(DrawTarget& target, const AxisTicks& ticks, float top, float bottom, float x,
                     TextAlign align);

// Around a plot with labels to its left and below it: what those take, and half of the outermost ones.
struct LabelMargins {
    float left, top, right, bottom;
};
LabelMargins MarginsFor(DrawTarget& target, bool notes);
// Where a row of labels under a plot has its baseline.
float RowBaseline(DrawTarget& target, float plotBottom);

AxisRoom RoomAlong(DrawTarget& target, float length);
AxisRoom RoomBeside(const DrawTarget& target, float length);
// Levels are read off less closely than frequencies.
AxisRoom RoomForLevels(const DrawTarget& target, float length);

// A line of text in a box of its own, moved to stay within `bounds`; left out where it does not fit.
void DrawInfoBox(DrawTarget& target, const RectF& bounds, PointF corner, std::string_view text, Ink ink);
RectF InfoBoxOf(DrawTarget& target, std::string_view text);
// Beside the pointer, on the side where there is more room; `difference`, unless it is empty, below the text.
void DrawPointerBox(DrawTarget& target, const RectF& plot, PointF pointer, std::string_view text,
                    std::string_view difference);
// A pinned place: a line across the plot, and a diamond where `at` lies within it.
void DrawMarker(DrawTarget& target, const RectF& plot, PointF at, bool upright);

}  // namespace Corvo
