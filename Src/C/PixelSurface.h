#pragma once

#include "C/Calls.h"
#include "C/dspdrawing.h"

#if defined(_WIN32)
#include <algorithm>

#include "Drawing/Backends/DrawingGdiPlus.h"
// GdiPlusHeader.h is not for hosts, and gdiplus.h needs these names.
#include "Platform/WindowsHeader.h"

#include <objidl.h>

namespace Gdiplus {
using std::max;
using std::min;
}  // namespace Gdiplus

#include <gdiplus.h>
#else
#include <cairo.h>

#include "Drawing/Backends/DrawingCairo.h"
#endif

namespace Corvo::C {

// The caller's pixels as something to draw on.
#if defined(_WIN32)
class PixelSurface {
public:
    using Drawing = DrawingGdiPlus;

    PixelSurface(Drawing& drawing, const dsp_picture& p)
        : m_image(p.width, p.height, p.stride, PixelFormat32bppRGB, reinterpret_cast<BYTE*>(p.pixels)),
          m_graphics(&m_image),
          target(drawing, &m_graphics, p.dpi) {
        Require(m_graphics.GetLastStatus() == Gdiplus::Ok, "the picture cannot be drawn on", DSP_FAILED);
    }

private:
    Gdiplus::Bitmap m_image;
    Gdiplus::Graphics m_graphics;

public:
    Drawing::DrawTarget target;
};
#else
class PixelSurface {
    struct Context {
        explicit Context(const dsp_picture& p)
            : image(cairo_image_surface_create_for_data(reinterpret_cast<unsigned char*>(p.pixels),
                                                        CAIRO_FORMAT_RGB24, p.width, p.height, p.stride)),
              cairo(cairo_create(image)) {}
        ~Context() {
            cairo_destroy(cairo);
            cairo_surface_destroy(image);  // what was drawn is in the pixels then
        }
        Context(const Context&) = delete;
        Context& operator=(const Context&) = delete;

        cairo_surface_t* image;
        cairo_t* cairo;
    } m_context;

public:
    using Drawing = DrawingCairo;

    PixelSurface(Drawing& drawing, const dsp_picture& p)
        : m_context(p), target(drawing, m_context.cairo, p.dpi) {
        Require(cairo_status(m_context.cairo) == CAIRO_STATUS_SUCCESS, "the picture cannot be drawn on",
                DSP_FAILED);
    }

    Drawing::DrawTarget target;
};
#endif

}  // namespace Corvo::C
