#include <functional>
#include <limits>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "Support/DrawingSurface.h"
#include "Support/VirtualSlot.h"

using namespace Corvo;
using TestSupport::DrawingSurface;

namespace {

constexpr ColourReference kWhite = 0xFFFFFF;
constexpr float kNaN = std::numeric_limits<float>::quiet_NaN();
constexpr float kInfinity = std::numeric_limits<float>::infinity();
constexpr int kWidth = 10, kHeight = 8;

template <typename Drawing>
struct Figure {
    const char* fault;
    std::function<void(typename Drawing::DrawTarget&)> draw;
    std::vector<std::string> picture;  // # white, . black, ? at an edge that is smoothed
};

void ExpectChannelsNear(std::uint32_t pixel, std::uint32_t expected, int tolerance) {
    for (const int shift : {0, 8, 16})
        EXPECT_NEAR(static_cast<int>(pixel >> shift & 0xFF), static_cast<int>(expected >> shift & 0xFF),
                    tolerance)
            << std::hex << pixel << " instead of " << expected;
}

}  // namespace

template <typename Drawing>
class Primitives : public testing::Test {
protected:
    std::string PictureOf(const Figure<Drawing>& figure) {
        m_surface.Paint(96.0f, [&](auto& target) {
            target.Clear(0);
            figure.draw(target);
        });
        std::string picture;
        for (int y = 0; y < kHeight; ++y, picture += '\n')
            for (int x = 0; x < kWidth; ++x) {
                const std::uint32_t pixel = m_surface.Pixel(x, y);
                const bool any =
                    figure.picture[static_cast<std::size_t>(y)][static_cast<std::size_t>(x)] == '?';
                picture += any ? '?' : pixel == 0xFFFFFF ? '#' : pixel == 0 ? '.' : '+';
            }
        return picture;
    }

    DrawingSurface<Drawing> m_surface{kWidth, kHeight};
};
TYPED_TEST_SUITE(Primitives, TestSupport::DrawingBackends);

// Catches primitives that are half a pixel or a whole one off, outlines that spill, holes that are filled,
// corners that are not cut, clips that do not nest.
TYPED_TEST(Primitives, LightExactlyTheirPixels) {
    constexpr Stroke kThick{{kWhite}, 2.0f};
    const std::vector<std::string> kRound = {".???##???.", "??######??", "?########?", "?########?",
                                             "?########?", "?########?", "??######??", ".???##???."};
    const Figure<TypeParam> figures[] = {
        {"rectangle off the grid",
         [](auto& t) {
             t.FillRectangle({2, 1, 4, 3}, {kWhite});
         },
         {"..........", "..####....", "..####....", "..####....", "..........", "..........", "..........",
          ".........."}},
        {"line off its middle",
         [&](auto& t) {
             t.Line({2, 3}, {8, 3}, kThick);
         },
         {"..........", "..........", ".?######?.", ".?######?.", "..........", "..........", "..........",
          ".........."}},
        {"thin line over two rows",
         [](auto& t) {
             t.Line({2, 3.5f}, {8, 3.5f}, {{kWhite}, 1.0f});
         },
         {"..........", "..........", "..........", ".?######?.", "..........", "..........", "..........",
          ".........."}},
        {"thin line over two columns",
         [](auto& t) {
             t.Line({4.5f, 7}, {4.5f, 2}, {{kWhite}, 1.0f});
         },
         {"..........", "....?.....", "....#.....", "....#.....", "....#.....", "....#.....", "....#.....",
          "....?....."}},
        {"polyline without its joint",
         [&](auto& t) {
             const PointF points[] = {{2, 1}, {2, 6}, {9, 6}};
             t.Polyline(points, 3, kThick);
         },
         {".??.......", ".##.......", ".##.......", ".##.......", ".##.......", ".########?", ".?#######?",
          ".........."}},
        {"outline outside the rectangle",
         [&](auto& t) {
             t.OutlineRectangle({1, 1, 8, 6}, kThick);
         },
         {"..........", ".########.", ".########.", ".##....##.", ".##....##.", ".########.", ".########.",
          ".........."}},
        {"outline thicker than the rectangle",
         [](auto& t) {
             t.OutlineRectangle({1, 1, 8, 6}, {{kWhite}, 50.0f});
         },
         {"..........", ".########.", ".########.", ".########.", ".########.", ".########.", ".########.",
          ".........."}},
        {"hole filled",
         [](auto& t) {
             const PointF points[] = {{0, 0}, {10, 0}, {10, 8}, {0, 8}, {0, 0},
                                      {3, 2}, {7, 2},  {7, 6},  {3, 6}, {3, 2}};
             t.FillPolygon(points, 10, {kWhite});
         },
         {"???#######", "???#######", "###....###", "###....###", "###....###", "###....###", "##########",
          "##########"}},
        {"corners not cut",
         [](auto& t) {
             t.FillRoundedRectangle({0, 0, 10, 8}, 4, {kWhite});
         },
         kRound},
        {"radius beyond the side",
         [](auto& t) {
             t.FillRoundedRectangle({0, 0, 10, 8}, 99, {kWhite});
         },
         kRound},
        {"clips that do not nest",
         [](auto& t) {
             t.PushClip({1, 1, 6, 6});
             t.PushClip({4, 0, 6, 4});
             t.FillRectangle({0, 0, 10, 8}, {kWhite});
             t.PopClip();
             t.FillRectangle({0, 5, 10, 1}, {kWhite});
             t.PopClip();
             t.FillRectangle({9, 7, 1, 1}, {kWhite});
             t.PopClip();  // one too many
         },
         {"..........", "....###...", "....###...", "....###...", "..........", ".######...", "..........",
          ".........#"}},
        {"empty clip lets through",
         [](auto& t) {
             t.PushClip({1, 1, 0, 6});
             t.FillRectangle({0, 0, 10, 8}, {kWhite});
             t.PopClip();
             t.PushClip({1, 1, 6, kNaN});
             t.Clear(kWhite);
         },
         {"..........", "..........", "..........", "..........", "..........", "..........", "..........",
          ".........."}},
        {"Clear beyond the clip",
         [](auto& t) {
             t.PushClip({2, 2, 3, 3});
             t.Clear(kWhite);
         },
         {"..........", "..........", "..###.....", "..###.....", "..###.....", "..........", "..........",
          ".........."}},
    };
    for (const auto& figure : figures) {
        std::string expected;
        for (const std::string& row : figure.picture) expected += row + '\n';
        EXPECT_EQ(this->PictureOf(figure), expected) << figure.fault;
    }
}

// Catches edges in steps, shapes half a pixel off, and a thin line spread over two rows or drawn too strong.
TYPED_TEST(Primitives, CoverPartsOfPixels) {
    if (!DrawingSurface<TypeParam>::Smooths()) GTEST_SKIP() << "this system fills whole pixels only";
    auto& surface = this->m_surface;
    surface.Paint(96.0f, [](auto& t) {
        t.FillRectangle({0.5f, 0, 2.25f, 2}, {kWhite});
        t.Line({2, 3.5f}, {8, 3.5f}, {{kWhite}, 1.0f});
        t.Line({2, 6.5f}, {8, 6.5f}, {{kWhite}, 0.5f});
    });
    const struct {
        int x, y;
        std::uint32_t expected;
    } pixels[] = {{0, 1, 0x808080}, {1, 1, 0xFFFFFF}, {2, 1, 0xBFBFBF}, {3, 1, 0}, {5, 2, 0},
                  {5, 3, 0xFFFFFF}, {5, 4, 0},        {5, 5, 0},        {5, 7, 0}, {5, 6, 0x808080}};
    for (const auto& [x, y, expected] : pixels) {
        SCOPED_TRACE(std::to_string(x) + ", " + std::to_string(y));
        ExpectChannelsNear(surface.Pixel(x, y), expected, 16);
    }
}

// Catches red and blue exchanged, or the opacity lost, on the way from a colour reference to the surface: by
// a real brush, and by the primitives.
TYPED_TEST(Primitives, TakeRedFromTheLowByteOfAColour) {
    auto& surface = this->m_surface;
    const DrawingBrush brush = surface.Drawing().CreateSolidBrush(0x00302010, 255);
    surface.PaintWith(brush);
    surface.Drawing().ReleaseBrush(brush);
    EXPECT_EQ(surface.Pixel(3, 3), 0x102030u);

    const DrawingBrush half = surface.Drawing().CreateSolidBrush(0x00FF8000, 128);
    surface.Paint(96.0f, [](auto& target) { target.Clear(0); });
    surface.PaintWith(half);
    surface.Drawing().ReleaseBrush(half);
    ExpectChannelsNear(surface.Pixel(1, 1), 0x004080, 1);

    surface.Paint(96.0f, [](auto& target) {
        target.Clear(0x000000FF);
        target.FillRectangle({1, 1, 2, 2}, {0x00FFFF00, 64});
    });
    EXPECT_EQ(surface.Pixel(0, 0), 0xFF0000u);
    ExpectChannelsNear(surface.Pixel(1, 1), 0xBF4040, 1);
}

// Catches a stroke that is painted piece by piece, which shows as beads along a translucent curve.
TYPED_TEST(Primitives, BlendAStrokeOnce) {
    if (!DrawingSurface<TypeParam>::Smooths()) GTEST_SKIP() << "this system strokes piece by piece itself";
    auto& surface = this->m_surface;
    surface.Paint(96.0f, [](auto& target) {
        const PointF points[] = {{2, 4}, {8, 4}, {3, 4}, {6, 4}};
        target.Polyline(points, 4, {{kWhite, 128}, 4.0f});
    });
    for (int x = 2; x < 8; ++x) ExpectChannelsNear(surface.Pixel(x, 4), 0x808080, 1);
}

// Catches a slot inserted or exchanged. The destructor takes two places in this ABI.
TEST(DrawingApi, KeepsItsSlots) {
    EXPECT_EQ(TestSupport::Slot(&DrawingApi::CreateSolidBrush), 2);
    EXPECT_EQ(TestSupport::Slot(&DrawingApi::ReleaseBrush), 3);
    EXPECT_EQ(TestSupport::Slot(&DrawingApi::ReleasePen), 4);
}

TYPED_TEST(Primitives, ReleaseWhatTheyCreate) {
    auto& surface = this->m_surface;
    DrawingApi& drawing = surface.Drawing();
    DrawingPen* pen = surface.Drawing().CreatePen({{kWhite}, 2.0f});
    ASSERT_NE(pen, nullptr);
    EXPECT_NE(pen->object, nullptr);
    drawing.ReleasePen(pen);
    EXPECT_EQ(pen, nullptr);
    drawing.ReleasePen(pen);
    drawing.ReleaseBrush({});
}

// Catches arguments that reach the system unchecked; what is not a number, empty or beyond any surface draws
// nothing.
TYPED_TEST(Primitives, DrawNothingWithoutUsableArguments) {
    auto& surface = this->m_surface;
    DrawingBitmap bitmap, broken;
    bitmap.Size(2, 2);
    bitmap.pixels.assign(4, 0xFFFFFFFF);
    broken.width = broken.height = 1 << 20;
    for (const float bad : {0.0f, -3.0f, kNaN, kInfinity, -kInfinity, 1e30f})
        surface.Paint(bad, [&](auto& t) {
            const Stroke stroke{{kWhite}, bad};
            const PointF points[] = {{bad, bad}, {5, bad}, {bad, 5}};
            t.Line({1, 1}, {8, 6}, stroke);
            t.Polyline(nullptr, 0, {{kWhite}, 2.0f});
            t.Polyline(points, 1, {{kWhite}, 2.0f});
            t.Polyline(points, -1, {{kWhite}, 2.0f});
            t.FillPolygon(points, 1, {kWhite});
            if (!(std::abs(bad) < 10.0f)) {
                t.Polyline(points, 3, {{kWhite}, 2.0f});
                t.FillPolygon(points, 3, {kWhite});
                t.Text("H", {bad, 5}, TextAlign::Left, 8, {kWhite});
            }
            for (const RectF& r : {RectF{1, 1, bad, 4}, RectF{1, 1, 4, bad}}) {
                t.FillRectangle(r, {kWhite});
                t.OutlineRectangle(r, {{kWhite}, 1.0f});
                t.FillRoundedRectangle(r, 2, {kWhite});
                t.Bitmap(bitmap, r, 255);
            }
            t.OutlineRectangle({1, 1, 8, 6}, stroke);
            t.Text("H", {1, 7}, TextAlign::Left, bad, {kWhite});
            EXPECT_EQ(t.MeasureText("H", bad).width, 0.0f);
            t.Bitmap({}, {0, 0, 4, 4}, 255);
            t.Bitmap(broken, {0, 0, 4, 4}, 255);
            t.Bitmap(bitmap, {0, 0, 2, 2}, 0);
        });
    for (int y = 0; y < kHeight; ++y)
        for (int x = 0; x < kWidth; ++x) ASSERT_EQ(surface.Pixel(x, y), 0u) << x << ", " << y;
}
