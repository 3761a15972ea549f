#pragma once

#include <cairo.h>

#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

#include "Drawing/DrawTarget.h"

namespace Corvo {

// Draws bitmaps on Cairo contexts. One that is drawn again and again at another size than its own is
// stretched once, and the copy kept.
class CairoBitmaps {
public:
    // `onPixels`: the context's coordinates are pixels of a surface, so that a copy may be used.
    void Draw(cairo_t* context, const DrawingBitmap& bitmap, const RectF& r, std::uint8_t opacity,
              bool onPixels);

private:
    struct SurfaceDestroyer {
        void operator()(cairo_surface_t* surface) const { cairo_surface_destroy(surface); }
    };
    // A state of a bitmap and a size that it is drawn in. The numbers of states are a module's own: two
    // bitmaps
    // of different modules may have the same.
    struct Stretched {
        const std::uint32_t* pixels;
        std::uint32_t version;
        int width, height;
        std::unique_ptr<cairo_surface_t, SurfaceDestroyer> copy{};  // stretched; null until it is made

        bool IsSame(const Stretched& other) const {
            return pixels == other.pixels && version == other.version && width == other.width &&
                   height == other.height;
        }
        std::size_t Bytes() const {
            return copy ? sizeof(std::uint32_t) * static_cast<std::size_t>(width * height) : 0;
        }
    };

    cairo_surface_t* Copy(const DrawingBitmap& bitmap, const RectF& r);
    void Keep(Stretched added);

    std::vector<Stretched> m_stretched;  // the one used last is the last
};

}  // namespace Corvo
