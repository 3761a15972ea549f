#include <gtest/gtest.h>

#include <new>
#include <vector>

#include "Drawing/Views/ShownAnalyser.h"
#include "Spectrum/Tuner/ImageSize.h"
#include "Spectrum/Tuner/TunerPanelBitmaps.h"

using namespace Corvo;

namespace {

class PanelImages : public ViewTest {};

// Catches images that stay as they are after command 1350 or at a new resolution, whichever is drawn first,
// ones that are made for every picture, and a size that is not the one asked for.
TEST_F(PanelImages, AreMadeAnewWhenAsked) {
    const struct {
        void (*setUp)(int);
        const DrawingBitmap& image;
        int pixelsPerUnit;
    } kinds[] = {{kivspectrum::SetupTunerBitmaps, kivspectrum::mainWitheCirleBitmap, 2},
                 {kivspectrum::SetupMinimizedTunerBitmaps, kivspectrum::tunerBarItem_Minimized_00_L, 1},
                 {kivspectrum::SetupErrorBitmaps, kivspectrum::tunerErrorSharpBitmap, 1}};
    kivspectrum analyser;
    for (int round = 0; round < 6; ++round) {
        for (const auto& kind : kinds) kind.setUp(40);
        if (round % 2 == 0)
            EXPECT_TRUE(analyser.popupmenu_process(1350));
        else
            kivspectrum::SetDpi(120 + round);
        for (int n = 0; n < 3; ++n) {
            const auto& kind = kinds[(round / 2 + n) % 3];
            const std::uint32_t before = kind.image.version;
            kind.setUp(37);
            const std::uint32_t made = kind.image.version;
            kind.setUp(37);
            EXPECT_NE(made, before) << "round " << round << ", kind " << n;
            EXPECT_EQ(kind.image.version, made);
            EXPECT_EQ(kind.image.height, kind.pixelsPerUnit * 37);
        }
    }
}

TEST(ImageSize, ChangesWhenThatPays) {
    constexpr int kFew = ImageSize::kPatience - 1, kMany = ImageSize::kPatience;
    const struct {
        const char* what;
        std::vector<std::pair<int, int>> needed;  // and how often
        int size, made;
    } cases[] = {{"grows", {{40, 99}, {41, 1}}, 41, 2},
                 {"half is enough", {{40, 1}, {20, kMany}}, 40, 1},
                 {"shrinks", {{40, 1}, {19, kMany}}, 19, 2},
                 {"not at once", {{40, 1}, {19, kFew}, {40, 1}, {9, kFew}}, 40, 1},
                 {"limited", {{5000, 9}}, ImageSize::kLargest, 1},
                 {"never empty", {{-3, 9}}, 1, 1}};
    for (const auto& c : cases) {
        ImageSize images;
        int size = 0, made = 0;
        EXPECT_THROW(images.Provide(9999, [](int) { throw std::bad_alloc(); }), std::bad_alloc);  // is none
        for (const auto& [needed, times] : c.needed)
            for (int i = 0; i < times; ++i) images.Provide(needed, [&](int s) { size = s, ++made; });
        EXPECT_EQ(size, c.size) << c.what;
        EXPECT_EQ(made, c.made) << c.what;
    }
}

// Catches arcs cut by their image's edge, mirrored wrongly or lying beside the pixels that they are for: all
// coverage lies within the arc's shape and adds up to its area.
TEST(PanelArc, LiesOnItsPixels) {
    for (const int radius : {11, 97})
        for (int bar = 0; bar < kTunerBars; ++bar) {
            DrawingBitmap left, right;
            DrawPanelArc(left, radius, bar, true, 0xFFFFFF);
            DrawPanelArc(right, radius, bar, false, 0xFFFFFF);
            const TunerBarPixels l = TunerBarPixelsOf(bar, true, radius);
            EXPECT_EQ(l.left + l.width, -TunerBarPixelsOf(bar, false, radius).left) << "not mirrored";
            ASSERT_EQ(left.width, right.width);
            double area = 0.0;
            for (int y = 0; y < left.height; ++y)
                for (int x = 0; x < left.width; ++x) {
                    EXPECT_EQ(left.Row(y)[x], right.Row(y)[left.width - 1 - x]);
                    area += static_cast<double>(left.Row(y)[x] >> 24) / 255.0;
                }
            const TunerBarShape shape = TunerBarOf(bar, true);
            const double thickness = shape.thickness * static_cast<double>(radius);
            const double whole = thickness * (2.0 * kArcHalfAngle * shape.radius * radius +
                                              std::numbers::pi * thickness / 4.0);
            EXPECT_NEAR(area, whole, 0.02 * whole) << radius << ", " << bar;
        }
}

}  // namespace
