#include <gtest/gtest.h>

#include "Support/DrawingSurface.h"

using namespace Corvo;
using TestSupport::DrawingSurface;

namespace {

DrawingBitmap MakeBitmap(int width, int height, std::vector<std::uint32_t> pixels) {
    DrawingBitmap bitmap;
    bitmap.Size(width, height);
    bitmap.pixels = std::move(pixels);
    return bitmap;
}

int ChannelOf(std::uint32_t pixel, int shift) { return static_cast<int>(pixel >> shift & 0xFF); }

}  // namespace

template <typename Drawing>
class BitmapPrimitive : public testing::Test {};
TYPED_TEST_SUITE(BitmapPrimitive, TestSupport::DrawingBackends);

// Catches rows or colours exchanged, an alpha that is multiplied twice or not at all, and a blend with the
// wrong share of the ground: each pixel is source + ground * (1 - alpha), all of it times the opacity.
TYPED_TEST(BitmapPrimitive, IsBlendedByItsAlpha) {
    constexpr std::uint32_t kGround = 0x4080C0;  // as Pixel() gives it
    const DrawingBitmap bitmap =
        MakeBitmap(3, 2, {0xFF102030, 0x00000000, 0x80800000, 0x80004000, 0x40000040, 0xFFFFFFFF});
    DrawingSurface<TypeParam> surface(6, 5);
    for (const int opacity : {255, 128, 0}) {
        surface.Paint(96.0f, [&](auto& target) {
            target.Clear(ColourFromRgb(kGround));
            target.Bitmap(bitmap, {2, 1, 3, 2}, static_cast<std::uint8_t>(opacity));
        });
        EXPECT_EQ(surface.Pixel(1, 1), kGround);
        EXPECT_EQ(surface.Pixel(5, 2), kGround);
        EXPECT_EQ(surface.Pixel(2, 3), kGround);
        for (int i = 0; i < 6; ++i)
            for (const int shift : {0, 8, 16}) {
                const std::uint32_t source = bitmap.pixels[static_cast<std::size_t>(i)];
                const double alpha = ChannelOf(source, 24) / 255.0, share = opacity / 255.0;
                const double expected =
                    ChannelOf(source, shift) * share + ChannelOf(kGround, shift) * (1.0 - alpha * share);
                EXPECT_NEAR(ChannelOf(surface.Pixel(2 + i % 3, 1 + i / 3), shift), expected, 2.0)
                    << "pixel " << i << ", channel " << shift << ", opacity " << opacity;
            }
    }
}

// Catches the unused top byte taken for an alpha, and rounding of what should be copied.
TYPED_TEST(BitmapPrimitive, IsCopiedWhenOpaque) {
    DrawingBitmap bitmap = MakeBitmap(2, 2, {0x00FF0102, 0x80030405, 0xFF060708, 0x01FFFFFF});
    bitmap.opaque = true;
    DrawingSurface<TypeParam> surface(4, 4);
    surface.Paint(96.0f, [&](auto& target) {
        target.Clear(0x808080);
        target.Bitmap(bitmap, {1, 1, 2, 2}, 255);
    });
    EXPECT_EQ(surface.Pixel(1, 1), 0xFF0102u);
    EXPECT_EQ(surface.Pixel(2, 1), 0x030405u);
    EXPECT_EQ(surface.Pixel(1, 2), 0x060708u);
    EXPECT_EQ(surface.Pixel(2, 2), 0xFFFFFFu);
}

// Catches a copy that is kept after the bitmap has changed: its pixels, its kind, its size.
TYPED_TEST(BitmapPrimitive, ShowsEveryVersion) {
    DrawingSurface<TypeParam> surface(4, 4);
    DrawingBitmap bitmap = MakeBitmap(1, 1, {0xFF112233});
    const auto draw = [&](int width) {
        surface.Paint(96.0f, [&](auto& target) {
            target.Clear(0);
            target.Bitmap(bitmap, {0, 0, static_cast<float>(width), 1}, 255);
        });
    };
    draw(1);
    EXPECT_EQ(surface.Pixel(0, 0), 0x112233u);
    bitmap.pixels[0] = 0x00445566;
    bitmap.opaque = true;
    bitmap.Changed();
    draw(1);
    EXPECT_EQ(surface.Pixel(0, 0), 0x445566u);
    bitmap.pixels[0] = 0x00778899;
    bitmap.Changed();
    draw(1);
    EXPECT_EQ(surface.Pixel(0, 0), 0x778899u);
    bitmap.Size(2, 1);
    bitmap.pixels = {0, 0x00AABBCC};
    draw(2);
    EXPECT_EQ(surface.Pixel(1, 0), 0xAABBCCu);
}

// Catches an edge that is mixed with nothing or with the opposite edge, and a step where a ramp belongs.
TYPED_TEST(BitmapPrimitive, IsStretchedSmoothlyUpToItsEdges) {
    const DrawingBitmap bitmap = MakeBitmap(2, 1, {0xFF000000, 0xFF00FF00});
    DrawingSurface<TypeParam> surface(16, 8);
    surface.Paint(96.0f, [&](auto& target) {
        target.Clear(0x0000FF);
        target.Bitmap(bitmap, {0, 0, 16, 6}, 255);
    });
    EXPECT_EQ(surface.Pixel(3, 6), 0xFF0000u);
    for (const int y : {0, 5}) {
        EXPECT_LE(surface.Pixel(0, y), 0x001000u);
        EXPECT_GE(surface.Pixel(15, y), 0x00F000u);
        int between = 0;
        for (int x = 1; x < 16; ++x) {
            const int before = ChannelOf(surface.Pixel(x - 1, y), 8), now = ChannelOf(surface.Pixel(x, y), 8);
            EXPECT_LE(before, now) << x << ", " << y;
            if (now > 0x20 && now < 0xE0) ++between;
        }
        EXPECT_GE(between, 4) << y;
    }
}
