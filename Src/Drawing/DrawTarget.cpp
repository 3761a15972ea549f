#include "Drawing/DrawTarget.h"

#include "Drawing/PrimitiveArguments.h"

namespace Corvo {

DrawTarget::DrawTarget(float dpi) : m_scale(IsUsableSize(dpi) ? dpi / kDotsPerInch : 1.0f) {}
DrawTarget::~DrawTarget() = default;

void DrawTarget::Line(PointF from, PointF to, const Stroke& stroke) {
    const PointF points[] = {from, to};
    Polyline(points, 2, stroke);
}

}  // namespace Corvo
