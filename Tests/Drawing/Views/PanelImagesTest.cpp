#include <gtest/gtest.h>

#include <vector>

#include "Drawing/Views/ShownAnalyser.h"
#include "Spectrum/Tuner/ImageSize.h"
#include "Spectrum/Tuner/TunerPanelBitmaps.h"

using namespace Corvo;

namespace {

class PanelImages : public ViewTest {};

// Catches images that stay as they are after command 1350, and ones that are made for every picture.
TEST_F(PanelImages, AreMadeAnewWhenAsked) {
    kivspectrum analyser;
    const auto version = [] {
        kivspectrum::SetupTunerBitmaps(37);
        return kivspectrum::mainWitheCirleBitmap.version;
    };
    const std::uint32_t before = version();
    EXPECT_EQ(version(), before);
    EXPECT_TRUE(analyser.popupmenu_process(1350));
    EXPECT_NE(version(), before);
    EXPECT_EQ(kivspectrum::mainWitheCirleBitmap.height, 2 * 37);
}

TEST(ImageSize, ChangesWhenThatPays) {
    constexpr int kFew = ImageSize::kPatience - 1, kMany = ImageSize::kPatience;
    const struct {
        const char* what;
        std::vector<std::pair<int, int>> needed;  // and how often
        int size, made;
    } cases[] = {{"grows", {{40, 99}, {41, 1}}, 41, 2},
                 {"shrinks", {{40, 1}, {19, kMany}}, 19, 2},
                 {"not at once", {{40, 1}, {19, kFew}, {40, 1}, {9, kFew}}, 40, 1},
                 {"limited", {{5000, 9}}, ImageSize::kLargest, 1},
                 {"never empty", {{-3, 9}}, 1, 1}};
    for (const auto& c : cases) {
        ImageSize images;
        int size = 0, made = 0;
        for (const auto& [needed, times] : c.needed)
            for (int i = 0; i < times; ++i) images.Provide(needed, [&](int s) { size = s, ++made; });
        EXPECT_EQ(size, c.size) << c.what;
        EXPECT_EQ(made, c.made) << c.what;
    }
}

// Catches arcs cut by their image's edge or mirrored wrongly: all coverage adds up to the shape's area.
TEST(PanelArc, LiesOnItsPixels) {
    for (int bar = 0; bar < kTunerBars; ++bar) {
        DrawingBitmap left, right;
        DrawPanelArc(left, 97, bar, true, 0xFFFFFF);
        DrawPanelArc(right, 97, bar, false, 0xFFFFFF);
        ASSERT_EQ(left.width, right.width);
        double area = 0.0;
        for (int y = 0; y < left.height; ++y)
            for (int x = 0; x < left.width; ++x) {
                EXPECT_EQ(left.Row(y)[x], right.Row(y)[left.width - 1 - x]);
                area += static_cast<double>(left.Row(y)[x] >> 24) / 255.0;
            }
        const TunerBarShape shape = TunerBarOf(bar, true);
        const double thickness = shape.thickness * 97.0;
        const double whole =
            thickness * (2.0 * kArcHalfAngle * shape.radius * 97.0 + std::numbers::pi * thickness / 4.0);
        EXPECT_NEAR(area, whole, 0.02 * whole) << bar;
    }
}

}  // namespace
