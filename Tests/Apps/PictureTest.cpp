#include <cairo.h>
#include <gtest/gtest.h>

#include "Apps/Program.h"
#include "Picture.h"

using dsphost::Picture;

class PictureFile : public AppTest::Program {};

// Catches red and blue exchanged, an alpha that lets the viewer's ground through, and a Paint that starts
// over instead of going on.
TEST_F(PictureFile, IsSavedAsItWasDrawn) {
    Picture picture(5, 3, 192.0f);
    picture.Paint([](auto& target) {
        EXPECT_EQ(target.Scale(), 2.0f);
        target.FillRectangle({1, 0, 1, 3}, {0x000000FFu});
    });
    picture.Paint([](auto& target) { target.FillRectangle({4, 2, 1, 1}, {0x00FF8000u, 128}); });

    const auto png = picture.Png();
    AppTest::SaveBytes("picture.png", {png.begin(), png.end()});
    cairo_surface_t* const image = cairo_image_surface_create_from_png("picture.png");
    ASSERT_EQ(cairo_surface_status(image), CAIRO_STATUS_SUCCESS);
    EXPECT_EQ(cairo_image_surface_get_format(image), CAIRO_FORMAT_RGB24);
    ASSERT_EQ(cairo_image_surface_get_width(image), 5);
    ASSERT_EQ(cairo_image_surface_get_height(image), 3);
    const auto pixel = [&](int x, int y) {
        const unsigned char* const row =
            cairo_image_surface_get_data(image) + y * cairo_image_surface_get_stride(image);
        return reinterpret_cast<const std::uint32_t*>(row)[x] & 0xFFFFFFu;
    };
    EXPECT_EQ(pixel(0, 0), 0x000000u);
    EXPECT_EQ(pixel(1, 2), 0xFF0000u);
    EXPECT_EQ(pixel(4, 2), 0x004080u);
    cairo_surface_destroy(image);
}
