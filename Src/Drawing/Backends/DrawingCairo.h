#pragma once

#include <cstdint>
#include <memory>
#include <string_view>

#include "Drawing/DrawTarget.h"
#include "Drawing/DrawingApi.h"
#include "Drawing/Views/Views.h"
#include "Platform/Export.h"

// As cairo.h has it, so that this header needs none.
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
class DSP_API DrawingCairo::DrawTarget final : public Corvo::DrawTarget {
public:
    // `dpi`: dots per inch, 96 is 100 %.
    DrawTarget(DrawingCairo& drawing, cairo_t* context, float dpi);
    ~DrawTarget() override;

    void Clear(ColourReference colour) override;
    void Polyline(const PointF* points, int count, const Stroke& stroke) override;
    void FillPolygon(const PointF* points, int count, Ink ink) override;
    void FillRectangle(const RectF& rectangle, Ink ink) override;
    void OutlineRectangle(const RectF& rectangle, const Stroke& stroke) override;
    void FillRoundedRectangle(const RectF& rectangle, float radius, Ink ink) override;
    TextMetrics MeasureText(std::string_view text, float size) override;
    void Text(std::string_view text, PointF baseline, TextAlign align, float size, Ink ink) override;
    void Bitmap(const DrawingBitmap& bitmap, const RectF& destination, std::uint8_t opacity) override;
    void PushClip(const RectF& rectangle) override;
    void PopClip() override;

private:
    void Use(Ink ink);
    bool Use(const Stroke& stroke);
    bool DrawCurve(const PointF* points, int count, float width);

    DrawingCairo& m_drawing;
    cairo_t* m_context;
    int m_clips = 0;
};

}  // namespace Corvo
