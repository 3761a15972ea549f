#include <algorithm>

#include "Spectrum/Tuner/ImageSize.h"
#include "Spectrum/Tuner/TunerPanelBitmaps.h"
#include "Spectrum/kivspectrum.h"

// The images of the tuner panel, shared by all analysers.

using Corvo::DrawingBitmap;

namespace {

constexpr std::uint32_t kCircle = 0xF5F7FA, kUnlit = 0x262E39;
constexpr std::uint32_t kLit[Corvo::kTunerBars] = {0xB8E05B, 0xF2D15A, 0xF2A65A, 0xFF7A6B};
constexpr std::uint32_t kError = 0xFF7A6B;

Corvo::ImageSize g_circles, g_minimized, g_errors;

void ForgetIfAsked() {
    if (!kivspectrum::needPrepareBitmap.exchange(false)) return;
    for (Corvo::ImageSize* const size : {&g_circles, &g_minimized, &g_errors}) size->Forget();
}

}  // namespace

// clang-format off
DrawingBitmap kivspectrum::mainWitheCirleBitmap, kivspectrum::mainWitheCirleBitmapBase;
DrawingBitmap kivspectrum::tunerBarItem_00_L, kivspectrum::tunerBarItem_01_L,
              kivspectrum::tunerBarItem_02_L, kivspectrum::tunerBarItem_03_L;
DrawingBitmap kivspectrum::tunerBarItem_00_R, kivspectrum::tunerBarItem_01_R,
              kivspectrum::tunerBarItem_02_R, kivspectrum::tunerBarItem_03_R;
DrawingBitmap kivspectrum::tunerBarItem_Base_00_L, kivspectrum::tunerBarItem_Base_01_L,
              kivspectrum::tunerBarItem_Base_02_L, kivspectrum::tunerBarItem_Base_03_L;
DrawingBitmap kivspectrum::tunerBarItem_Base_00_R, kivspectrum::tunerBarItem_Base_01_R,
              kivspectrum::tunerBarItem_Base_02_R, kivspectrum::tunerBarItem_Base_03_R;
DrawingBitmap kivspectrum::tunerBarItem_Minimized_00_L, kivspectrum::tunerBarItem_Minimized_01_L,
              kivspectrum::tunerBarItem_Minimized_02_L, kivspectrum::tunerBarItem_Minimized_03_L;
DrawingBitmap kivspectrum::tunerBarItem_Minimized_00_R, kivspectrum::tunerBarItem_Minimized_01_R,
              kivspectrum::tunerBarItem_Minimized_02_R, kivspectrum::tunerBarItem_Minimized_03_R;
DrawingBitmap kivspectrum::tunerBarItem_Minimized_Base_00_L, kivspectrum::tunerBarItem_Minimized_Base_01_L,
              kivspectrum::tunerBarItem_Minimized_Base_02_L, kivspectrum::tunerBarItem_Minimized_Base_03_L;
DrawingBitmap kivspectrum::tunerBarItem_Minimized_Base_00_R, kivspectrum::tunerBarItem_Minimized_Base_01_R,
              kivspectrum::tunerBarItem_Minimized_Base_02_R, kivspectrum::tunerBarItem_Minimized_Base_03_R;
DrawingBitmap kivspectrum::tunerErrorFlatBitmap, kivspectrum::tunerErrorSharpBitmap;

const kivspectrum::BarItems kivspectrum::leftItems{
    &tunerBarItem_00_L, &tunerBarItem_01_L, &tunerBarItem_02_L, &tunerBarItem_03_L};
const kivspectrum::BarItems kivspectrum::rightItems{
    &tunerBarItem_00_R, &tunerBarItem_01_R, &tunerBarItem_02_R, &tunerBarItem_03_R};
const kivspectrum::BarItems kivspectrum::baseItems_L{
    &tunerBarItem_Base_00_L, &tunerBarItem_Base_01_L, &tunerBarItem_Base_02_L, &tunerBarItem_Base_03_L};
const kivspectrum::BarItems kivspectrum::baseItems_R{
    &tunerBarItem_Base_00_R, &tunerBarItem_Base_01_R, &tunerBarItem_Base_02_R, &tunerBarItem_Base_03_R};
const kivspectrum::BarItems kivspectrum::leftItemsMinimized{
    &tunerBarItem_Minimized_00_L, &tunerBarItem_Minimized_01_L,
    &tunerBarItem_Minimized_02_L, &tunerBarItem_Minimized_03_L};
const kivspectrum::BarItems kivspectrum::rightItemsMinimized{
    &tunerBarItem_Minimized_00_R, &tunerBarItem_Minimized_01_R,
    &tunerBarItem_Minimized_02_R, &tunerBarItem_Minimized_03_R};
const kivspectrum::BarItems kivspectrum::baseItemsMinimized_L{
    &tunerBarItem_Minimized_Base_00_L, &tunerBarItem_Minimized_Base_01_L,
    &tunerBarItem_Minimized_Base_02_L, &tunerBarItem_Minimized_Base_03_L};
const kivspectrum::BarItems kivspectrum::baseItemsMinimized_R{
    &tunerBarItem_Minimized_Base_00_R, &tunerBarItem_Minimized_Base_01_R,
    &tunerBarItem_Minimized_Base_02_R, &tunerBarItem_Minimized_Base_03_R};
// clang-format on

void kivspectrum::SetupTunerBitmaps(int circleRadius) {
    ForgetIfAsked();
    g_circles.Provide(circleRadius, [](int radius) {
        Corvo::DrawPanelCircle(mainWitheCirleBitmap, 2 * radius, kCircle);
        Corvo::DrawPanelCircle(mainWitheCirleBitmapBase, 2 * radius, kUnlit);
        for (std::size_t i = 0; i < Corvo::kTunerBars; ++i) {
            const int bar = static_cast<int>(i);
            Corvo::DrawPanelArc(*leftItems[i], radius, bar, true, kLit[i]);
            Corvo::DrawPanelArc(*rightItems[i], radius, bar, false, kLit[i]);
            Corvo::DrawPanelArc(*baseItems_L[i], radius, bar, true, kUnlit);
            Corvo::DrawPanelArc(*baseItems_R[i], radius, bar, false, kUnlit);
        }
    });
}

void kivspectrum::SetupMinimizedTunerBitmaps(int barHeight) {
    ForgetIfAsked();
    g_minimized.Provide(barHeight, [](int height) {
        const int width = std::max(height / 4, 1);
        for (std::size_t i = 0; i < Corvo::kTunerBars; ++i) {
            Corvo::DrawPanelBar(*leftItemsMinimized[i], width, height, kLit[i]);
            Corvo::DrawPanelBar(*rightItemsMinimized[i], width, height, kLit[i]);
            Corvo::DrawPanelBar(*baseItemsMinimized_L[i], width, height, kUnlit);
            Corvo::DrawPanelBar(*baseItemsMinimized_R[i], width, height, kUnlit);
        }
    });
}

void kivspectrum::SetupErrorBitmaps(int arrowSide) {
    ForgetIfAsked();
    g_errors.Provide(arrowSide, [](int side) {
        Corvo::DrawPanelArrow(tunerErrorFlatBitmap, side, true, kError);
        Corvo::DrawPanelArrow(tunerErrorSharpBitmap, side, false, kError);
    });
}
