#pragma once

#include <cstdint>
#include <string_view>

#include "Drawing/DrawTarget.h"

namespace TestSupport {

// A back-end that only measures, so that what a graphics library allocates does not count.
struct NoDrawing {
    struct DrawTarget {
        float Scale() const { return 1.0f; }
        void Clear(Corvo::ColourReference) {}
        void Line(Corvo::PointF, Corvo::PointF, const Corvo::Stroke&) {}
        void Polyline(const Corvo::PointF*, int, const Corvo::Stroke&) {}
        void FillPolygon(const Corvo::PointF*, int, Corvo::Ink) {}
        void FillRectangle(const Corvo::RectF&, Corvo::Ink) {}
        void OutlineRectangle(const Corvo::RectF&, const Corvo::Stroke&) {}
        void FillRoundedRectangle(const Corvo::RectF&, float, Corvo::Ink) {}
        Corvo::TextMetrics MeasureText(std::string_view text, float size) {
            return {0.6f * size * static_cast<float>(text.size()), size, 0.25f * size};
        }
        void Text(std::string_view, Corvo::PointF, Corvo::TextAlign, float, Corvo::Ink) {}
        void Bitmap(const Corvo::DrawingBitmap&, const Corvo::RectF&, std::uint8_t) {}
        void PushClip(const Corvo::RectF&) {}
        void PopClip() {}
    };
};
static_assert(Corvo::IsDrawTarget<NoDrawing::DrawTarget>);

}  // namespace TestSupport
