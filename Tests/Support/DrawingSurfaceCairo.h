#pragma once

#include <cstdint>

#include "Drawing/Backends/DrawingCairo.h"

#include <cairo.h>

namespace TestSupport {

template <>
class DrawingSurface<Corvo::DrawingCairo> {
public:
    // In pixels; a unit of the surface, and of its contexts, may be several.
    DrawingSurface(int width, int height, double deviceScale = 1.0, double contextScale = 1.0)
        : m_surface(cairo_image_surface_create(CAIRO_FORMAT_RGB24, width, height)), m_scale(contextScale) {
        cairo_surface_set_device_scale(m_surface, deviceScale, deviceScale);
    }
    ~DrawingSurface() { cairo_surface_destroy(m_surface); }
    DrawingSurface(const DrawingSurface&) = delete;
    DrawingSurface& operator=(const DrawingSurface&) = delete;

    template <typename Draw>
    void Paint(float dpi, Draw draw) {
        PaintPlainly([&](cairo_t* context) {
            Corvo::DrawingCairo::DrawTarget target(m_drawing, context, dpi);
            draw(target);
        });
    }
    // Without the back-end.
    template <typename Draw>
    void PaintPlainly(Draw draw) {
        cairo_t* const context = cairo_create(m_surface);
        cairo_scale(context, m_scale, m_scale);
        draw(context);
        cairo_destroy(context);
        cairo_surface_flush(m_surface);
    }
    void PaintWith(Corvo::DrawingBrush brush) {
        PaintPlainly([&](cairo_t* context) {
            cairo_set_source(context, static_cast<cairo_pattern_t*>(brush.object));
            cairo_paint(context);
        });
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
    double m_scale;
    Corvo::DrawingCairo m_drawing;
};

}  // namespace TestSupport
