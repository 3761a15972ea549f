#pragma once

#include <cstdint>

#include "Drawing/Backends/DrawingGdiPlus.h"
#include "Drawing/Backends/GdiPlusHeader.h"

namespace TestSupport {

template <>
class DrawingSurface<Corvo::DrawingGdiPlus> {
public:
    DrawingSurface(int width, int height) : m_image(width, height, PixelFormat32bppRGB) {
        Gdiplus::Graphics(&m_image).Clear(Gdiplus::Color(255, 0, 0, 0));
    }

    template <typename Draw>
    void Paint(float dpi, Draw draw) {
        Gdiplus::Graphics graphics(&m_image);
        Corvo::DrawingGdiPlus::DrawTarget target(m_drawing, &graphics, dpi);
        draw(target);
    }

    void PaintWith(Corvo::DrawingBrush brush) {
        Gdiplus::Graphics(&m_image).FillRectangle(static_cast<const Gdiplus::Brush*>(brush.object), 0, 0,
                                                  static_cast<int>(m_image.GetWidth()),
                                                  static_cast<int>(m_image.GetHeight()));
    }

    std::uint32_t Pixel(int x, int y) {
        Gdiplus::Color colour;
        m_image.GetPixel(x, y, &colour);
        return colour.GetValue() & 0xFFFFFFu;
    }
    Corvo::DrawingGdiPlus& Drawing() { return m_drawing; }

    // Some systems that stand in for Windows fill whole pixels only; theirs is not ours to repair.
    static bool Smooths() {
        DrawingSurface surface(4, 4);
        const Gdiplus::SolidBrush white(Gdiplus::Color(255, 255, 255, 255));
        Gdiplus::Graphics graphics(&surface.m_image);
        graphics.SetSmoothingMode(Gdiplus::SmoothingModeAntiAlias);
        graphics.FillEllipse(&white, 0, 0, 3, 3);
        for (int i = 0; i < 16; ++i)
            if (const std::uint32_t pixel = surface.Pixel(i % 4, i / 4); pixel != 0 && pixel != 0xFFFFFF)
                return true;
        return false;
    }

private:
    Corvo::DrawingGdiPlus m_drawing;  // first: GDI+ has to run before the image can be
    Gdiplus::Bitmap m_image;
};

}  // namespace TestSupport
