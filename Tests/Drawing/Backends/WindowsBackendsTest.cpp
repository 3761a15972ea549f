#include <filesystem>

#include <gtest/gtest.h>

#include "Drawing/Backends/WindowDpi.h"
#include "Drawing/DrawingFont.h"
#include "Support/DrawingSurface.h"

using namespace Corvo;
using namespace TestSupport;

// Catches modes, clips and resolutions that stay behind in the host's own surface.
TEST(WindowsBackends, LeaveTheSurfaceAsItWas) {
    const auto disturb = [](DrawTarget& target) {
        target.PushClip({0, 0, 1, 1});
        target.Text("x", {0, 3}, TextAlign::Left, 4, {0xFFFFFF});
        target.PushClip({0, 0, 0, 0});
    };
    DrawingSurface<DrawingGdiPlus> first(4, 4);
    Gdiplus::Bitmap image(4, 4, PixelFormat32bppRGB);
    Gdiplus::Graphics graphics(&image);
    graphics.SetPageUnit(Gdiplus::UnitMillimeter);
    const auto smoothing = graphics.GetSmoothingMode();
    const auto offset = graphics.GetPixelOffsetMode();
    const auto hint = graphics.GetTextRenderingHint();
    {
        DrawingGdiPlus::DrawTarget target(first.Drawing(), &graphics, 96.0f);
        disturb(target);
    }
    EXPECT_EQ(graphics.GetPageUnit(), Gdiplus::UnitMillimeter);
    EXPECT_EQ(graphics.GetSmoothingMode(), smoothing);
    EXPECT_EQ(graphics.GetPixelOffsetMode(), offset);
    EXPECT_EQ(graphics.GetTextRenderingHint(), hint);
    EXPECT_TRUE(graphics.IsVisible(0.5f, 0.5f));

    DrawingSurface<DrawingD2D> second(4, 4);
    ID2D1RenderTarget* const d2d = second.Target();
    float x = 0.0f, y = 0.0f;
    d2d->SetAntialiasMode(D2D1_ANTIALIAS_MODE_ALIASED);
    d2d->SetDpi(120.0f, 144.0f);
    second.Paint(96.0f, disturb);
    d2d->GetDpi(&x, &y);
    EXPECT_EQ(x, 120.0f);
    EXPECT_EQ(y, 144.0f);
    EXPECT_EQ(d2d->GetAntialiasMode(), D2D1_ANTIALIAS_MODE_ALIASED);
    EXPECT_EQ(second.Pixel(2, 2), 0u) << "EndDraw failed, or the clip let through";
}

// Catches GDI+ used after its end: what the headers keep of it must not outlive it.
TEST(WindowsBackends, StartGdiPlusAgain) {
    for (int i = 0; i < 3; ++i) {
        DrawingSurface<DrawingGdiPlus> surface(4, 4);
        surface.Paint(96.0f,
                      [](DrawTarget& target) { EXPECT_GT(target.MeasureText("H", 12.0f).width, 0.0f); });
    }
}

// Catches a typeface's file that is not used. In a typewriter's face all letters are equally wide.
TEST(WindowsBackends, WriteWithTheTypefacesFile) {
    const char* file = "C:/Windows/Fonts/consola.ttf";
    if (!std::filesystem::exists(file)) file = "Z:/usr/share/fonts/truetype/dejavu/DejaVuSansMono.ttf";
    if (!std::filesystem::exists(file)) GTEST_SKIP() << "no typewriter's face is installed";
    DrawingFont::SetFile(file);
    DrawingSurface<DrawingGdiPlus> gdiPlus(4, 4);
    DrawingSurface<DrawingD2D> d2d(4, 4);
    DrawingFont::SetFile("");
    const auto compare = [](DrawTarget& target) {
        const float narrow = target.MeasureText("iiiiiiii", 48.0f).width;
        EXPECT_NEAR(target.MeasureText("WWWWWWWW", 48.0f).width, narrow, 1.0f);
        EXPECT_GT(narrow, 8.0f * 0.5f * 48.0f);
    };
    gdiPlus.Paint(96.0f, compare);
    d2d.Paint(96.0f, compare);
}

// Catches a library that is not there or a call that fails without an answer. This program has not declared
// itself aware of other resolutions.
TEST(WindowsBackends, KnowTheResolutionOfAWindow) {
    EXPECT_EQ(DpiOfWindow(nullptr), 96);
    EXPECT_EQ(DpiOfWindow(reinterpret_cast<HWND>(0x1234567)), 96);
    const HWND window =
        CreateWindowW(L"STATIC", L"", WS_POPUP, 0, 0, 10, 10, nullptr, nullptr, nullptr, nullptr);
    ASSERT_NE(window, nullptr);
    EXPECT_EQ(DpiOfWindow(window), 96);
    DestroyWindow(window);
}
