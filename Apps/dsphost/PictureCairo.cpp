#include <exception>
#include <string>

#include <cairo.h>

#include "Errors.h"
#include "Picture.h"

namespace dsphost {
namespace {

// Called from C, which no exception must cross.
cairo_status_t Append(void* png, const unsigned char* bytes, unsigned count) noexcept try {
    auto& all = *static_cast<std::vector<std::uint8_t>*>(png);
    all.insert(all.end(), bytes, bytes + count);
    return CAIRO_STATUS_SUCCESS;
} catch (const std::exception&) {
    return CAIRO_STATUS_NO_MEMORY;
}

}  // namespace

struct Picture::Surface {
    Surface(int width, int height)
        : image(cairo_image_surface_create(CAIRO_FORMAT_RGB24, width, height)),
          context(cairo_create(image)) {}
    ~Surface() {
        cairo_destroy(context);
        cairo_surface_destroy(image);
    }
    Surface(const Surface&) = delete;
    Surface& operator=(const Surface&) = delete;

    cairo_surface_t* image;
    cairo_t* context;
};

Picture::Picture(int width, int height, float dpi)
    : m_surface(std::make_unique<Surface>(width, height)),
      m_whole{0.0f, 0.0f, static_cast<float>(width), static_cast<float>(height)},
      m_dpi(dpi) {
    if (width < 1 || height < 1 || cairo_status(m_surface->context) != CAIRO_STATUS_SUCCESS)
        throw UserError("no picture of " + std::to_string(width) + "x" + std::to_string(height) +
                        " pixels can be made");
}

Picture::~Picture() = default;

PictureDrawing::DrawTarget Picture::Target() { return {m_drawing, m_surface->context, m_dpi}; }

std::vector<std::uint8_t> Picture::Png() {
    std::vector<std::uint8_t> png;
    const cairo_status_t status = cairo_surface_write_to_png_stream(m_surface->image, Append, &png);
    if (status != CAIRO_STATUS_SUCCESS)
        throw IoError(std::string("cannot make the PNG file: ") + cairo_status_to_string(status));
    return png;
}

}  // namespace dsphost
