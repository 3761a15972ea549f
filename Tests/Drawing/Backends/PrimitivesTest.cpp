#include <cstdlib>
#include <functional>
#include <limits>
#include <string>
#include <string_view>
#include <type_traits>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "Support/DrawingSurface.h"

using namespace Corvo;
using TestSupport::DrawingSurface;

namespace {

constexpr ColourReference kWhite = 0xFFFFFF;
constexpr float kNaN = std::numeric_limits<float>::quiet_NaN();
constexpr float kInfinity = std::numeric_limits<float>::infinity();
constexpr int kWidth = 10, kHeight = 8;
constexpr RectF kAll{0, 0, kWidth, kHeight};
constexpr Stroke kThick{{kWhite}, 2.0f};

struct Figure {
    const char* fault;
    std::function<void(DrawTarget&)> draw;
    // Rows with # white, 8 half and B three quarters of it, . black, ? any at an edge; the rest is black.
    // With an 8 it is drawn only where edges are smoothed.
    std::string_view picture;
};

// clang-format off
const Figure kFigures[] = {
    {"rectangle off the grid", [](DrawTarget& t) { t.FillRectangle({2, 1, 4, 3}, {kWhite}); },
     ".......... ..####.... ..####.... ..####.... "},
    {"line off its middle", [](DrawTarget& t) { t.Line({2, 3}, {8, 3}, kThick); },
     ".......... .......... .?######?. .?######?. "},
    {"polyline without its joint",
     [](DrawTarget& t) {
         const PointF points[] = {{2, 1}, {2, 6}, {9, 6}};
         t.Polyline(points, 3, kThick);
     },
     ".??....... .##....... .##....... .##....... .##....... .########? .?#######? "},
    {"outline outside the rectangle", [](DrawTarget& t) { t.OutlineRectangle({1, 1, 8, 6}, kThick); },
     ".......... .########. .########. .##....##. .##....##. .########. .########. "},
    {"hole filled",
     [](DrawTarget& t) {
         const PointF points[] = {{0, 0}, {10, 0}, {10, 8}, {0, 8}, {0, 0},
                                  {3, 2}, {7, 2},  {7, 6},  {3, 6}, {3, 2}};
         t.FillPolygon(points, 10, {kWhite});
     },
     "???####### ???####### ###....### ###....### ###....### ###....### ########## ########## "},
    {"corners not cut", [](DrawTarget& t) { t.FillRoundedRectangle(kAll, 99, {kWhite}); },
     ".???##???. ??######?? ?########? ?########? ?########? ?########? ??######?? .???##???. "},
    {"clips that do not nest",
     [](DrawTarget& t) {
         t.PushClip({1, 1, 6, 6});
         t.PushClip({4, 0, 6, 4});
         t.FillRectangle(kAll, {kWhite});
         t.PopClip();
         t.FillRectangle({0, 5, 10, 1}, {kWhite});
         t.PopClip();
         t.FillRectangle({9, 7, 1, 1}, {kWhite});
         t.PopClip();  // one too many
     },
     ".......... ....###... ....###... ....###... .......... .######... .......... .........# "},
    {"empty clip lets through",
     [](DrawTarget& t) {
         t.PushClip({1, 1, 0, 6});
         t.FillRectangle(kAll, {kWhite});
         t.PopClip();
         t.PushClip({1, 1, 6, kNaN});
         t.Clear(kWhite);
     },
     ""},
    {"bitmap in steps, or mixed with what is beside it",
     [](DrawTarget& t) { t.Bitmap({2, 1, {0xFF000000, 0xFFFFFFFF}}, {0, 0, 10, 3}, 255); },
     ".???++???# .???++???# .???++???# "},
    {"edge in steps", [](DrawTarget& t) { t.FillRectangle({0.5f, 0, 2.25f, 2}, {kWhite}); },
     "8#B....... 8#B....... "},
    {"stroke painted piece by piece",  // shows as beads along a translucent curve
     [](DrawTarget& t) {
         const PointF points[] = {{1, 4}, {9, 4}, {3, 4}, {6, 4}};
         t.PushClip({2, 3, 6, 2});
         t.Polyline(points, 4, {{kWhite, 128}, 4.0f});
     },
     ".......... .......... .......... ..888888.. ..888888.. "},
};
// clang-format on

int ChannelOf(std::uint32_t pixel, int shift) { return static_cast<int>(pixel >> shift & 0xFF); }

void ExpectColour(std::uint32_t pixel, std::uint32_t expected) {
    for (const int shift : {0, 8, 16})
        EXPECT_NEAR(ChannelOf(pixel, shift), ChannelOf(expected, shift), 1) << shift;
}

// Other greys are '+'.
char SignOf(std::uint32_t pixel) {
    for (const auto& [sign, grey] : {std::pair{'.', 0}, {'8', 0x80}, {'B', 0xBF}, {'#', 0xFF}})
        if (std::abs(ChannelOf(pixel, 8) - grey) <= 16) return sign;
    return '+';
}

}  // namespace

template <typename Drawing>
class Primitives : public testing::Test {
protected:
    DrawingSurface<Drawing> m_surface{kWidth, kHeight};
};
TYPED_TEST_SUITE(Primitives, TestSupport::DrawingBackends);

// Catches primitives that are half a pixel or a whole one off, outlines that spill, holes that are filled,
// corners that are not cut, clips that do not nest. Every back-end draws the same pictures.
TYPED_TEST(Primitives, LightTheirPixels) {
    for (const Figure& figure : kFigures) {
        std::string expected(figure.picture), picture;
        if (expected.find('8') != std::string::npos && !DrawingSurface<TypeParam>::Smooths()) continue;
#if defined(_WIN32)
        // GDI+ mixes from the pixels' left edges instead of their middles.
        if (std::is_same_v<TypeParam, DrawingGdiPlus> && expected.find('+') != std::string::npos) continue;
#endif
        while (expected.size() < kHeight * (kWidth + 1)) expected += ".......... ";
        this->m_surface.Paint(96.0f, [&](DrawTarget& target) {
            target.Clear(0);
            figure.draw(target);
        });
        for (int y = 0; y < kHeight; ++y, picture += ' ')
            for (int x = 0; x < kWidth; ++x)
                picture += expected[picture.size()] == '?' ? '?' : SignOf(this->m_surface.Pixel(x, y));
        EXPECT_EQ(picture, expected) << figure.fault;
    }
}

// Catches red and blue exchanged, or the opacity lost, on the way from a colour reference to the surface, by
// a real brush and by the primitives.
TYPED_TEST(Primitives, TakeRedFromTheLowByteOfAColour) {
    auto& surface = this->m_surface;
    DrawingApi& drawing = surface.Drawing();
    const DrawingBrush brush = drawing.CreateSolidBrush(0x00FF8000, 128);
    surface.Paint(96.0f, [](DrawTarget& target) { target.Clear(0); });
    surface.PaintWith(brush);
    drawing.ReleaseBrush(brush);
    ExpectColour(surface.Pixel(3, 3), 0x004080);
    surface.Paint(96.0f, [](DrawTarget& target) {
        target.Clear(0x000000FF);
        target.FillRectangle({1, 1, 2, 2}, {0x00FFFF00, 64});
    });
    EXPECT_EQ(surface.Pixel(0, 0), 0xFF0000u);
    ExpectColour(surface.Pixel(1, 1), 0xBF4040);
}

// Catches rows or colours exchanged, an alpha that is multiplied twice or not at all, and a blend with the
// wrong share of the ground: each pixel is source + ground * (1 - alpha), all of it times the opacity.
TYPED_TEST(Primitives, BlendBitmapsByTheirAlpha) {
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

// Catches a copy that is kept after the bitmap has changed (its pixels, its kind, its size), one that is
// drawn for another bitmap, whose module has counted as far, or differs from what it was made of; the unused
// top byte taken for an alpha, and rounding of what should be copied.
TYPED_TEST(Primitives, CopyEveryVersionOfABitmap) {
    constexpr int kSide = 12;
    DrawingSurface<TypeParam> surface(kSide, 4);
    const auto row = [](auto& painted, const DrawingBitmap& drawn, int width, std::uint8_t opacity) {
        std::vector<std::uint32_t> pixels;
        painted.Paint(96.0f, [&](DrawTarget& target) {
            target.Clear(0x304050);
            target.Bitmap(drawn, {1, 1, static_cast<float>(width), 1}, opacity);
        });
        for (int x = 0; x < width; ++x) pixels.push_back(painted.Pixel(1 + x, 1));
        return pixels;
    };
    DrawingBitmap bitmap, other;
    for (const DrawingBitmap& next : {DrawingBitmap{1, 1, {0xFF112233}},
                                      {1, 1, {0x00445566}, true},
                                      {2, 1, {0x00FF0102, 0x80030405}, true},
                                      {4, 1, {0xFF102030, 0, 0x80800000, 0x80004000}},
                                      {4, 1, {0xFF102030, 0, 0x80800000, 0xFFFFFFFF}}}) {
        bitmap = next;
        bitmap.Changed();
        other = bitmap;
        other.pixels[0] = 0xFFFF0000;
        for (int time = 0; time < 6; ++time) {
            const DrawingBitmap& drawn = time % 2 ? other : bitmap;
            const auto copied = row(surface, drawn, drawn.width, 255);
            for (std::size_t x = 0; x < copied.size(); ++x)
                if (drawn.opaque || drawn.pixels[x] >> 24 == 0xFF) {
                    EXPECT_EQ(copied[x], drawn.pixels[x] & 0xFFFFFF) << x;
                }
            DrawingSurface<TypeParam> fresh(kSide, 4);
            const auto stretched = row(fresh, drawn, kSide - 1, 200);
            EXPECT_EQ(row(surface, drawn, kSide - 1, 200), stretched) << time;
        }
    }
}

// Catches arguments that reach the system unchecked; what is not a number, empty or beyond any surface draws
// nothing.
TYPED_TEST(Primitives, DrawNothingWithoutUsableArguments) {
    auto& surface = this->m_surface;
    const DrawingBitmap bitmap{1, 1, {0xFFFFFFFF}};
    for (const float bad : {0.0f, -3.0f, kNaN, kInfinity, -kInfinity, 1e30f})
        surface.Paint(bad, [&](DrawTarget& t) {
            const Stroke stroke{{kWhite}, bad};
            const PointF points[] = {{bad, bad}, {5, bad}, {bad, 5}};
            t.Line({1, 1}, {8, 6}, stroke);
            if (!(std::abs(bad) < 10.0f)) {
                t.Polyline(points, 3, kThick);
                t.FillPolygon(points, 3, {kWhite});
                t.Text("H", {bad, 5}, TextAlign::Left, 8, {kWhite});
            }
            for (const RectF& r : {RectF{1, 1, bad, 4}, RectF{1, 1, 4, bad}}) {
                t.FillRectangle(r, {kWhite});
                t.OutlineRectangle(r, kThick);
                t.FillRoundedRectangle(r, 2, {kWhite});
                t.Bitmap(bitmap, r, 255);
            }
            t.Text("H", {1, 7}, TextAlign::Left, bad, {kWhite});
            EXPECT_EQ(t.MeasureText("H", bad).width, 0.0f);
        });
    for (int y = 0; y < kHeight; ++y)
        for (int x = 0; x < kWidth; ++x) ASSERT_EQ(surface.Pixel(x, y), 0u) << x << ", " << y;
}
