#include <gtest/gtest.h>

#include <array>
#include <new>
#include <utility>
#include <vector>

#include "Drawing/Views/ShownAnalyser.h"
#include "Spectrum/Tuner/ImageSize.h"
#include "Spectrum/Tuner/TunerPanelBitmaps.h"

using namespace Corvo;

namespace {

class PanelImages : public ViewTest {
protected:
    struct Kind {
        void (*setUp)(int);
        const DrawingBitmap& image;
        int pixelsPerUnit;
    };
    static inline const std::array kKinds{
        Kind{kivspectrum::SetupTunerBitmaps, kivspectrum::mainWitheCirleBitmap, 2},
        Kind{kivspectrum::SetupMinimizedTunerBitmaps, kivspectrum::tunerBarItem_Minimized_00_L, 1},
        Kind{kivspectrum::SetupErrorBitmaps, kivspectrum::tunerErrorSharpBitmap, 1}};
};

// Catches images that stay as they are after command 1350 or at a new resolution, whichever is drawn first,
// and ones that are made for every picture.
TEST_F(PanelImages, AreAllMadeAnewWhenAsked) {
    kivspectrum analyser;
    int dpi = 120;
    for (std::size_t first = 0; first < kKinds.size(); ++first)
        for (const bool byCommand : {true, false}) {
            std::array<std::uint32_t, 3> before{};
            for (std::size_t i = 0; i < kKinds.size(); ++i) {
                kKinds[i].setUp(40);
                before[i] = kKinds[i].image.version;
            }
            if (byCommand)
                EXPECT_TRUE(analyser.popupmenu_process(1350));
            else
                kivspectrum::SetDpi(++dpi);
            for (std::size_t n = 0; n < kKinds.size(); ++n) {
                const std::size_t i = (first + n) % kKinds.size();
                kKinds[i].setUp(40);
                const std::uint32_t made = kKinds[i].image.version;
                EXPECT_NE(made, before[i]) << "kind " << i << " after " << first;
                kKinds[i].setUp(40);
                EXPECT_EQ(kKinds[i].image.version, made) << "kind " << i;
            }
        }
}

// Catches a small panel that is drawn from huge images for good, and a size that is not the one asked for.
TEST_F(PanelImages, AreOfTheSizeNeeded) {
    for (const Kind& kind : kKinds)
        for (const int size : {400, 20, 37}) {
            for (int picture = 0; picture < 2 * ImageSize::kPatience; ++picture) kind.setUp(size);
            EXPECT_EQ(kind.image.height, kind.pixelsPerUnit * size);
        }
}

TEST(ImageSize, ChangesWhenThatPays) {
    struct Case {
        const char* what;
        std::vector<std::pair<int, int>> needed;  // and how often
        int size, made;
    };
    constexpr int kFew = ImageSize::kPatience - 1, kMany = ImageSize::kPatience;
    for (const Case& c : std::vector<Case>{{"kept", {{40, 99}}, 40, 1},
                                           {"grows", {{40, 1}, {41, 1}}, 41, 2},
                                           {"half is enough", {{40, 1}, {20, kMany}}, 40, 1},
                                           {"shrinks", {{40, 1}, {19, kMany}}, 19, 2},
                                           {"not at once", {{40, 1}, {19, kFew}}, 40, 1},
                                           {"in turn", {{40, 1}, {9, kFew}, {40, 1}, {9, kFew}}, 40, 1},
                                           {"limited", {{5000, 9}}, ImageSize::kLargest, 1},
                                           {"never empty", {{-3, 9}}, 1, 1}}) {
        ImageSize images;
        int size = 0, made = 0;
        for (const auto& [needed, times] : c.needed)
            for (int i = 0; i < times; ++i) images.Provide(needed, [&](int s) { size = s, ++made; });
        EXPECT_EQ(size, c.size) << c.what;
        EXPECT_EQ(made, c.made) << c.what;
    }
}

// Catches a size that counts as made though memory ran out half way.
TEST(ImageSize, TriesAgainAfterAFailure) {
    ImageSize images;
    images.Provide(40, [](int) {});
    EXPECT_THROW(images.Provide(60, [](int) { throw std::bad_alloc(); }), std::bad_alloc);
    for (const int needed : {60, 40}) {
        int made = 0;
        images.Provide(needed, [&](int size) { made = size; });
        EXPECT_EQ(made, needed == 60 ? 60 : 0);
    }
}

// Catches arcs cut by their image's edge, mirrored wrongly or lying beside the pixels that they are for: seen
// from the circle's centre, all coverage lies within the arc's shape and adds up to its area.
TEST(PanelArc, LiesOnItsPixels) {
    for (const int radius : {11, 40, 97})
        for (int bar = 0; bar < kTunerBars; ++bar) {
            DrawingBitmap left, right;
            DrawPanelArc(left, radius, bar, true, 0xFFFFFF);
            DrawPanelArc(right, radius, bar, false, 0xFFFFFF);
            const TunerBarPixels l = TunerBarPixelsOf(bar, true, radius),
                                 r = TunerBarPixelsOf(bar, false, radius);
            ASSERT_EQ(left.width, l.width);
            ASSERT_EQ(right.height, r.height);
            EXPECT_EQ(l.left + l.width, -r.left) << "not mirrored";
            double area = 0.0;
            for (int y = 0; y < left.height; ++y)
                for (int x = 0; x < left.width; ++x) {
                    EXPECT_EQ(left.Row(y)[x], right.Row(y)[left.width - 1 - x]);
                    area += static_cast<double>(left.Row(y)[x] >> 24) / 255.0;
                }
            const TunerBarShape shape = TunerBarOf(bar, true);
            const double unit = radius, thickness = shape.thickness * unit,
                         round = std::numbers::pi * thickness / 4.0;
            const double whole = thickness * (2.0 * kArcHalfAngle * shape.radius * unit + round);
            EXPECT_NEAR(area, whole, 0.02 * whole) << radius << ", " << bar;
        }
}

}  // namespace
