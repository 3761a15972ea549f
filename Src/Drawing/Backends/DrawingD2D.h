#pragma once

#include <cstdint>
#include <memory>
#include <string_view>

#include "Drawing/DrawTarget.h"
#include "Drawing/DrawingApi.h"
#include "Drawing/Views/Views.h"
#include "Platform/Export.h"

struct ID2D1RenderTarget;
struct ID2D1SolidColorBrush;

namespace Corvo {

// Draws through Direct2D and DirectWrite on one render target, to which its brushes and bitmaps belong. A
// host whose target is lost makes a new object for the new one. One thread at a time, the target's.
//
// Keeps what drawing needs again: brushes, pens, laid-out texts, and the bitmaps drawn last as the target has
// them. Those are known by the address of the DrawingBitmap; what is drawn from the same address later is
// taken for the same picture as long as size and version are.
class DSP_API DrawingD2D final : public DrawingApi {
public:
    // Keeps a reference of its own to the target.
    explicit DrawingD2D(ID2D1RenderTarget* target);
    ~DrawingD2D() override;
    DrawingD2D(const DrawingD2D&) = delete;
    DrawingD2D& operator=(const DrawingD2D&) = delete;

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

// The primitives (DrawTarget.h) on the back-end's render target, one DrawTarget at a time, between the host's
// BeginDraw and EndDraw. Coordinates are the target's pixels whatever its own resolution is; its
// transformation applies. The target keeps its state.
class DSP_API DrawingD2D::DrawTarget final : public Corvo::DrawTarget {
public:
    DrawTarget(DrawingD2D& drawing, float dpi);
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
    ID2D1SolidColorBrush* Use(Ink ink);

    DrawingD2D& m_drawing;
    ID2D1RenderTarget* m_target;
    float m_xDpi = 0.0f, m_yDpi = 0.0f;  // the target's own
    int m_clips = 0;
};

}  // namespace Corvo
