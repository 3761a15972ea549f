#pragma once

#include <cstdint>

#include "Drawing/Backends/DrawingCairo.h"

#include <cairo.h>

namespace TestSupport {

template <>
class DrawingSurface<Corvo::DrawingCairo> {
public:
    DrawingSurface(int width, int height)
        : m_surface(cairo_image_surface_create(CAIRO_FORMAT_RGB24, width, height)) {}
    ~DrawingSurface() { cairo_surface_destroy(m_surface); }
    DrawingSurface(const DrawingSurface&) = delete;
    DrawingSurface& operator=(const DrawingSurface&) = delete;

    template <typename Draw>
    void Paint(float dpi, Draw draw) {
        cairo_t* const context = cairo_create(m_surface);
        {
            Corvo::DrawingCairo::DrawTarget target(m_drawing, context, dpi);
            draw(target);
        }
        cairo_destroy(context);
        cairo_surface_flush(m_surface);
    }

    void PaintWith(Corvo::DrawingBrush brush) {
        cairo_t* const context = cairo_create(m_surface);
        cairo_set_source(context, static_cast<cairo_pattern_t*>(brush.object));
        cairo_paint(context);
        cairo_destroy(context);
    }

    std::uint32_t Pixel(int x, int y) const {
        const unsigned char* const row =
            cairo_image_surface_get_data(m_surface) + y * cairo_image_surface_get_stride(m_surface);
        return reinterpret_cast<const std::uint32_t*>(row)[x] & 0xFFFFFFu;
    }
    Corvo::DrawingCairo& Drawing() { return m_drawing; }
    static bool Smooths() { return true; }

private:
    cairo_surface_t* m_surface;
    Corvo::DrawingCairo m_drawing;
};

}  // namespace TestSupport
