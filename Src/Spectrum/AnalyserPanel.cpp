#include "Spectrum/Tuner/TunerPanelImages.h"
#include "Spectrum/kivspectrum.h"

// The tuner panel's images, one set for all analysers, under the names that hosts know.

using Corvo::DrawingBitmap;

namespace {

Corvo::TunerPanelImages g_panel;

Corvo::TunerPanelImages& Panel() {
    if (kivspectrum::needPrepareBitmap.exchange(false)) g_panel.Forget();
    return g_panel;
}

constexpr kivspectrum::BarItems Items(Corvo::TunerPanelImages::Bars& bars) {
    return {&bars[0], &bars[1], &bars[2], &bars[3]};
}

}  // namespace

std::atomic<bool> kivspectrum::needPrepareBitmap{false};

// clang-format off
DrawingBitmap &kivspectrum::mainWitheCirleBitmap = g_panel.circle;
DrawingBitmap &kivspectrum::mainWitheCirleBitmapBase = g_panel.circleBase;
DrawingBitmap &kivspectrum::tunerErrorFlatBitmap = g_panel.errorFlat;
DrawingBitmap &kivspectrum::tunerErrorSharpBitmap = g_panel.errorSharp;
#define DSP_FOUR_BARS(kind, side, bars)                                                                     \
    DrawingBitmap &kivspectrum::kind##00##side = bars[0], &kivspectrum::kind##01##side = bars[1],           \
                  &kivspectrum::kind##02##side = bars[2], &kivspectrum::kind##03##side = bars[3];
DSP_FOUR_BARS(tunerBarItem_, _L, g_panel.left)
DSP_FOUR_BARS(tunerBarItem_, _R, g_panel.right)
DSP_FOUR_BARS(tunerBarItem_Base_, _L, g_panel.baseLeft)
DSP_FOUR_BARS(tunerBarItem_Base_, _R, g_panel.baseRight)
DSP_FOUR_BARS(tunerBarItem_Minimized_, _L, g_panel.leftMinimized)
DSP_FOUR_BARS(tunerBarItem_Minimized_, _R, g_panel.rightMinimized)
DSP_FOUR_BARS(tunerBarItem_Minimized_Base_, _L, g_panel.baseLeftMinimized)
DSP_FOUR_BARS(tunerBarItem_Minimized_Base_, _R, g_panel.baseRightMinimized)
#undef DSP_FOUR_BARS
const kivspectrum::BarItems kivspectrum::leftItems = Items(g_panel.left);
const kivspectrum::BarItems kivspectrum::rightItems = Items(g_panel.right);
const kivspectrum::BarItems kivspectrum::baseItems_L = Items(g_panel.baseLeft);
const kivspectrum::BarItems kivspectrum::baseItems_R = Items(g_panel.baseRight);
const kivspectrum::BarItems kivspectrum::leftItemsMinimized = Items(g_panel.leftMinimized);
const kivspectrum::BarItems kivspectrum::rightItemsMinimized = Items(g_panel.rightMinimized);
const kivspectrum::BarItems kivspectrum::baseItemsMinimized_L = Items(g_panel.baseLeftMinimized);
const kivspectrum::BarItems kivspectrum::baseItemsMinimized_R = Items(g_panel.baseRightMinimized);
// clang-format on

void kivspectrum::SetupTunerBitmaps(int circleRadius) { Panel().SetUpCircle(circleRadius); }
void kivspectrum::SetupMinimizedTunerBitmaps(int height) { Panel().SetUpMinimized(height); }
void kivspectrum::SetupErrorBitmaps(int side) { Panel().SetUpErrors(side); }
void kivspectrum::SetDpi(int dpi) {
    static std::atomic<int> current{0};
    if (current.exchange(dpi) != dpi) needPrepareBitmap = true;
}
