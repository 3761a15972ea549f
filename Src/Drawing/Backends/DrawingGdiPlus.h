#pragma once

#include <cstdint>
#include <memory>
#include <string_view>
#include <vector>

#include "Drawing/DrawTarget.h"
#include "Drawing/DrawingApi.h"
#include "Drawing/Views/Views.h"
#include "Platform/Export.h"

namespace Gdiplus {
class Graphics;
class Pen;
class SolidBrush;
}  // namespace Gdiplus

namespace Corvo {

// Draws through GDI+, which runs as long as the object does; brushes and pens made by it are released before
// it goes. One object serves any number of surfaces, one thread at a time, and keeps what drawing needs
// again: brushes, pens, fonts, texts. Not to be made or destroyed while a DLL is being loaded or unloaded.
class DSP_API DrawingGdiPlus final : public DrawingApi {
public:
    DrawingGdiPlus();
    ~DrawingGdiPlus() override;
    DrawingGdiPlus(const DrawingGdiPlus&) = delete;
    DrawingGdiPlus& operator=(const DrawingGdiPlus&) = delete;

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

// The primitives (DrawTarget.h) on a GDI+ graphics object; a host with a device context makes one of it. Both
// arguments stay the caller's and must outlive it. The graphics object keeps its state; its transformation
// applies. Clips end at whole pixels.
class DSP_API DrawingGdiPlus::DrawTarget final : public Corvo::DrawTarget {
public:
    DrawTarget(DrawingGdiPlus& drawing, Gdiplus::Graphics* graphics, float dpi);
    ~DrawTarget() override;

    void Clear(ColourReference colour) override;
    void Line(PointF from, PointF to, const Stroke& stroke) override;
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
    const Gdiplus::SolidBrush* Use(Ink ink);
    const Gdiplus::Pen* Use(const Stroke& stroke);

    DrawingGdiPlus& m_drawing;
    Gdiplus::Graphics* m_graphics;
    std::vector<unsigned> m_states;  // of the graphics object: as found, then before each clip
};

}  // namespace Corvo
