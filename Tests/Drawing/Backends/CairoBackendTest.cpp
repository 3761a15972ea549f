#include <gtest/gtest.h>

#include <cmath>
#include <vector>

#include <dlfcn.h>

#include <cairo.h>
#include <fontconfig/fontconfig.h>

#include "Drawing/DrawingFont.h"
#include "Drawing/Views/ShownAnalyser.h"
#include "Support/DrawingSurface.h"
#include "Support/Signals.h"

using namespace Corvo;
using TestSupport::DrawingSurface;

namespace {

int g_layouts = 0;

}  // namespace

// In front of Pango's own: every text that is laid out comes through here.
extern "C" struct _PangoLayout* pango_layout_new(struct _PangoContext* context) {
    using Function = _PangoLayout*(_PangoContext*);
    static const auto next = reinterpret_cast<Function*>(dlsym(RTLD_NEXT, "pango_layout_new"));
    ++g_layouts;
    return next(context);
}

namespace {

class CairoBackend : public ViewTest {};

// Catches curves that are drawn column by column otherwise than as outlines: elsewhere, thicker or torn.
TEST_F(CairoBackend, CurvesAreAsOutlined) {
    constexpr int kSide = 200;
    for (const float width : {0.0f, 1.0f, 1.5f, 3.0f, 8.0f}) {  // 0: the area under it
        std::vector<PointF> points;
        const auto noise = TestSupport::Noise<float>(kSide);
        for (int i = 0; i < kSide - 20; ++i) {
            const auto x = static_cast<float>(i);
            const float y = 100.0f + 60.0f * std::sin(x / 9.0f) +
                            (i > 90 ? 30.0f * noise[static_cast<std::size_t>(i)] : 0.0f);
            points.push_back({x + 10.25f, y});
        }
        if (width == 0.0f)
            for (const float x : {points.back().x, points.front().x}) points.push_back({x, 210.0f});
        const auto count = static_cast<int>(points.size());
        DrawingSurface<DrawingCairo> fast(kSide, kSide), plain(kSide, kSide);
        plain.PaintPlainly([&](cairo_t* context) {
            cairo_set_source_rgb(context, 1.0, 1.0, 1.0);
            cairo_set_line_width(context, width);
            cairo_set_line_join(context, CAIRO_LINE_JOIN_ROUND);
            cairo_set_line_cap(context, CAIRO_LINE_CAP_ROUND);
            for (const PointF& p : points) cairo_line_to(context, p.x, p.y);
            width > 0.0f ? cairo_stroke(context) : cairo_fill(context);
        });
        fast.Paint(96.0f, [&](DrawTarget& target) {
            if (width > 0.0f)
                target.Polyline(points.data(), count, {{0xFFFFFF}, width});
            else
                target.FillPolygon(points.data(), count, {0xFFFFFF});
        });
        double off = 0.0, covered = 0.0;
        for (int i = 0; i < kSide * kSide; ++i) {
            const double level = fast.Pixel(i % kSide, i / kSide) & 0xFF;
            const double expected = plain.Pixel(i % kSide, i / kSide) & 0xFF;
            EXPECT_NEAR(level, expected, 32.0) << width << " at " << i;
            off += std::abs(level - expected);
            covered += expected;
        }
        EXPECT_LT(off, 0.03 * covered) << width;
    }
}

// Catches a back-end that keeps fewer texts than a picture has, and so lays all of them out for every one.
TEST_F(CairoBackend, LaysOutNothingTwice) {
    ShownAnalyser shown;
    shown.analyser.SetTunerOn(true);
    shown.analyser.ObserverUpdate();
    shown.analyser.ShowSonogram(true);
    shown.Hear(440.0, 0.5);
    for (const int scale : {0, 1, 4}) {
        DrawingSurface<DrawingCairo> surface(16, 16);
        kivspectrum::settings.view_option_a = scale;
        kivspectrum::settings.view_flag_d = scale == 1;
        const auto draw = [&] {
            g_layouts = 0;
            surface.Paint(96.0f, [&](auto& target) {
                shown.analyser.DoDraw<DrawingCairo>(target, {0, 0, 3840, 2160});
            });
            return g_layouts;
        };
        EXPECT_GT(draw(), 50);
        EXPECT_EQ(draw(), 0) << "scale " << scale;
    }
}

// Catches a typeface's file that joins the program's once more with every back-end.
TEST_F(CairoBackend, AddsATypefacesFileOnce) {
    const FcFontSet* const system = FcConfigGetFonts(nullptr, FcSetSystem);
    FcChar8* file = nullptr;
    ASSERT_TRUE(system && system->nfont > 0);
    ASSERT_EQ(FcPatternGetString(system->fonts[0], FC_FILE, 0, &file), FcResultMatch);
    DrawingFont::SetFile(reinterpret_cast<const char*>(file));
    const auto fonts = [] {
        const DrawingCairo drawing;
        const FcFontSet* const added = FcConfigGetFonts(nullptr, FcSetApplication);
        return added ? added->nfont : 0;
    };
    const int once = fonts();
    EXPECT_GE(once, 1);
    EXPECT_EQ(fonts(), once);
    DrawingFont::SetFile("");
}

// Catches "own size" taken in the context's units: two black and two white pixels, drawn off the grid by less
// than half a pixel, are copied where they cover as many pixels of the surface, and else run together.
TEST_F(CairoBackend, CopiesBitmapsPixelByPixel) {
    DrawingBitmap bitmap;
    bitmap.Size(4, 4);
    for (int y = 0; y < 4; ++y)
        for (int x = 0; x < 4; ++x) bitmap.Row(y)[x] = x < 2 ? 0xFF000000u : 0xFFFFFFFFu;
    const struct {
        double deviceScale, contextScale;
        float width;
        bool copied;
    } cases[] = {{1.0, 1.0, 4.0f, true},  {1.0, 1.0, 8.0f, false}, {2.0, 1.0, 2.0f, true},
                 {2.0, 1.0, 4.0f, false}, {1.0, 2.0, 2.0f, true},  {1.0, 2.0, 4.0f, false},
                 {2.0, 0.5, 4.0f, true}};
    for (const auto& c : cases) {
        DrawingSurface<DrawingCairo> surface(16, 16, c.deviceScale, c.contextScale);
        const auto at = static_cast<float>(2.3 / (c.deviceScale * c.contextScale));
        surface.Paint(96.0f, [&](DrawTarget& t) { t.Bitmap(bitmap, {at, at, c.width, c.width}, 255); });
        int between = 0;
        for (int x = 3; x < (c.copied ? 6 : 9); ++x)
            between += (surface.Pixel(x, 4) & 0xFF) > 0x08 && (surface.Pixel(x, 4) & 0xFF) < 0xF8 ? 1 : 0;
        EXPECT_EQ(between == 0, c.copied) << c.deviceScale << ", " << c.contextScale << ", " << c.width;
    }
}

}  // namespace
