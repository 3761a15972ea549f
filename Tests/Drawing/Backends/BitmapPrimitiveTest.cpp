#include <gtest/gtest.h>

#include "Support/DrawingSurface.h"

using namespace Corvo;
using TestSupport::DrawingSurface;

namespace {

int ChannelOf(std::uint32_t pixel, int shift) { return static_cast<int>(pixel >> shift & 0xFF); }

}  // namespace

template <typename Drawing>
class BitmapPrimitive : public testing::Test {};
TYPED_TEST_SUITE(BitmapPrimitive, TestSupport::DrawingBackends);

// Catches rows or colours exchanged, an alpha that is multiplied twice or not at all, and a blend with the
// wrong share of the ground: each pixel is source + ground * (1 - alpha), all of it times the opacity.
TYPED_TEST(BitmapPrimitive, IsBlendedByItsAlpha) {
    constexpr std::uint32_t kGround = 0x4080C0;  // as Pixel() gives it
    const DrawingBitmap bitmap{3, 2, {0xFF102030, 0, 0x80800000, 0x80004000, 0x40000040, 0xFFFFFFFF}};
    DrawingSurface<TypeParam> surface(6, 5);
    for (const int opacity : {255, 128, 0}) {
        surface.Paint(96.0f, [&](DrawTarget& target) {
            target.Clear(ColourFromRgb(kGround));
            target.Bitmap(bitmap, {2, 1, 3, 2}, static_cast<std::uint8_t>(opacity));
        });
        for (int i = 0; i < 30; ++i) {
            const int x = i % 6, y = i / 6;
            const bool inside = x >= 2 && x < 5 && y >= 1 && y < 3;
            const std::uint32_t source = inside ? bitmap.Row(y - 1)[x - 2] : 0;
            for (const int shift : {0, 8, 16}) {
                const double alpha = ChannelOf(source, 24) / 255.0, share = opacity / 255.0;
                const double expected =
                    ChannelOf(source, shift) * share + ChannelOf(kGround, shift) * (1.0 - alpha * share);
                EXPECT_NEAR(ChannelOf(surface.Pixel(x, y), shift), expected, inside ? 2.0 : 0.0)
                    << x << ", " << y << ", channel " << shift << ", opacity " << opacity;
            }
        }
    }
}

// Catches a copy that is kept after the bitmap has changed (its pixels, its kind, its size), the unused top
// byte taken for an alpha, and rounding of what should be copied.
TYPED_TEST(BitmapPrimitive, CopiesEveryVersion) {
    DrawingSurface<TypeParam> surface(4, 4);
    DrawingBitmap bitmap;
    for (const DrawingBitmap& next : {DrawingBitmap{1, 1, {0xFF112233}},
                                      {1, 1, {0x00445566}, true},
                                      {1, 1, {0x00778899}, true},
                                      {2, 2, {0x00FF0102, 0x80030405, 0xFF060708, 0x01FFFFFF}, true}}) {
        bitmap = next;
        bitmap.Changed();
        const auto side = static_cast<float>(bitmap.width);
        surface.Paint(96.0f, [&](DrawTarget& target) {
            target.Clear(0x808080);
            target.Bitmap(bitmap, {1, 1, side, side}, 255);
        });
        for (int y = 0; y < bitmap.height; ++y)
            for (int x = 0; x < bitmap.width; ++x)
                EXPECT_EQ(surface.Pixel(1 + x, 1 + y), bitmap.Row(y)[x] & 0xFFFFFF) << x << ", " << y;
    }
}

// Catches an edge that is mixed with nothing or with the opposite edge, and a step where a ramp belongs.
TYPED_TEST(BitmapPrimitive, IsStretchedSmoothlyUpToItsEdges) {
    DrawingSurface<TypeParam> surface(16, 8);
    surface.Paint(96.0f, [&](DrawTarget& target) {
        target.Clear(0x0000FF);
        target.Bitmap({2, 1, {0xFF000000, 0xFF00FF00}}, {0, 0, 16, 6}, 255);
    });
    EXPECT_EQ(surface.Pixel(3, 6), 0xFF0000u);
    for (const int y : {0, 5}) {
        const auto green = [&](int x) { return ChannelOf(surface.Pixel(x, y), 8); };
        EXPECT_LE(surface.Pixel(0, y), 0x001000u);
        EXPECT_GE(surface.Pixel(15, y), 0x00F000u);
        int between = 0;
        for (int x = 1; x < 16; ++x) {
            EXPECT_LE(green(x - 1), green(x)) << x << ", " << y;
            between += green(x) > 0x20 && green(x) < 0xE0 ? 1 : 0;
        }
        EXPECT_GE(between, 4) << y;
    }
}
