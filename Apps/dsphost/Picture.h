#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#if defined(_WIN32)
#include "Drawing/Backends/DrawingGdiPlus.h"
#else
#include "Drawing/Backends/DrawingCairo.h"
#endif

namespace dsphost {

#if defined(_WIN32)
using PictureDrawing = Corvo::DrawingGdiPlus;
#else
using PictureDrawing = Corvo::DrawingCairo;
#endif

// A picture in memory, opaque and black at first, drawn on with the library's primitives and saved as PNG.
class Picture {
public:
    // Sides in pixels, at least 1. Throws UserError for a size that the drawing system does not take.
    Picture(int width, int height, float dpi);
    ~Picture();
    Picture(const Picture&) = delete;
    Picture& operator=(const Picture&) = delete;

    // draw(PictureDrawing::DrawTarget&); each call goes on with what is there.
    template <typename Draw>
    void Paint(Draw draw) {
        PictureDrawing::DrawTarget target = Target();
        draw(target);
    }

    Corvo::RectF Whole() const { return m_whole; }

    // The bytes of a PNG file. Throws IoError when it cannot be made.
    std::vector<std::uint8_t> Png();

private:
    PictureDrawing::DrawTarget Target();

    struct Surface;
    PictureDrawing m_drawing;  // first: it starts the drawing system where that has to be
    std::unique_ptr<Surface> m_surface;
    Corvo::RectF m_whole;
    float m_dpi;
};

}  // namespace dsphost
