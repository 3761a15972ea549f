#pragma once

#include <cstdint>
#include <memory>
#include <string_view>

#include "Drawing/DrawTarget.h"
#include "Drawing/DrawingApi.h"
#include "Platform/Export.h"

using cairo_t = struct _cairo;

namespace Corvo {

// Draws through Cairo and Pango. One object serves any number of surfaces, one thread at a time, and keeps
// what drawing needs again: brushes, laid-out texts, the typeface.
class DSP_API DrawingCairo final : public DrawingApi {
public:
    DrawingCairo();
    ~DrawingCairo() override;
    DrawingCairo(const DrawingCairo&) = delete;
    DrawingCairo& operator=(const DrawingCairo&) = delete;

    DrawingBrush CreateSolidBrush(ColourReference colour, std::uint8_t opacity) override;
    void ReleaseBrush(DrawingBrush brush) override;
    void ReleasePen(DrawingPen*& pen) override;
    // A pen for lines of `width` pixels; the caller releases it.
    DrawingPen* CreatePen(const Stroke& stroke);

    class DrawTarget;

private:
    friend class DrawTarget;
    struct Resources;
    std::unique_ptr<Resources> m_resources;
};

// The primitives (DrawTarget.h) on a Cairo context. Both arguments stay the caller's and must outlive it. The
// context keeps its state; its transformation applies.
class DSP_API DrawingCairo::DrawTarget {
public:
    DrawTarget(DrawingCairo& drawing, cairo_t* context, float dpi);
    ~DrawTarget();
    DrawTarget(const DrawTarget&) = delete;
    DrawTarget& operator=(const DrawTarget&) = delete;

    float Scale() const { return m_scale; }
    void Clear(ColourReference colour);
    void Line(PointF from, PointF to, const Stroke& stroke);
    void Polyline(const PointF* points, int count, const Stroke& stroke);
    void FillPolygon(const PointF* points, int count, Ink ink);
    void FillRectangle(const RectF& rectangle, Ink ink);
    void OutlineRectangle(const RectF& rectangle, const Stroke& stroke);
    void FillRoundedRectangle(const RectF& rectangle, float radius, Ink ink);
    TextMetrics MeasureText(std::string_view text, float size);
    void Text(std::string_view text, PointF baseline, TextAlign align, float size, Ink ink);
    void Bitmap(const DrawingBitmap& bitmap, const RectF& destination, std::uint8_t opacity);
    void PushClip(const RectF& rectangle);
    void PopClip();

private:
    void Use(Ink ink);
    bool Use(const Stroke& stroke);

    DrawingCairo& m_drawing;
    cairo_t* m_context;
    float m_scale;
    int m_clips = 0;
};

static_assert(IsDrawTarget<DrawingCairo::DrawTarget>);

}  // namespace Corvo
