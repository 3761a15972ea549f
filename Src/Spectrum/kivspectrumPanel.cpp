#include <algorithm>

#include "Spectrum/TunerPanelBitmaps.h"
#include "Spectrum/kivspectrum.h"

// The images of the tuner panel, shared by all analysers.

using Corvo::DrawingBitmap;

namespace {

constexpr std::uint32_t kCircle = 0xF5F7FA, kUnlit = 0x262E39;
constexpr std::uint32_t kLit[Corvo::kTunerBars] = {0xB8E05B, 0xF2D15A, 0xF2A65A, 0xFF7A6B};
constexpr std::uint32_t kError = 0xFF7A6B;
// No panel is larger; more would only cost memory.
constexpr int kLargestRadius = 1024;

int g_circleRadius = 0, g_minimizedHeight = 0, g_errorSide = 0;

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
    const bool remake = needPrepareBitmap.exchange(false);
    if (!remake && circleRadius <= g_circleRadius) return;
    g_circleRadius = std::clamp(circleRadius, 1, kLargestRadius);
    Corvo::DrawPanelCircle(mainWitheCirleBitmap, 2 * g_circleRadius, kCircle);
    Corvo::DrawPanelCircle(mainWitheCirleBitmapBase, 2 * g_circleRadius, kUnlit);
    for (std::size_t i = 0; i < Corvo::kTunerBars; ++i) {
        const int bar = static_cast<int>(i);
        Corvo::DrawPanelArc(*leftItems[i], g_circleRadius, bar, true, kLit[i]);
        Corvo::DrawPanelArc(*rightItems[i], g_circleRadius, bar, false, kLit[i]);
        Corvo::DrawPanelArc(*baseItems_L[i], g_circleRadius, bar, true, kUnlit);
        Corvo::DrawPanelArc(*baseItems_R[i], g_circleRadius, bar, false, kUnlit);
    }
    // The others follow when they are next needed.
    if (remake) g_minimizedHeight = g_errorSide = 0;
}

void kivspectrum::SetupMinimizedTunerBitmaps(int height) {
    if (height <= g_minimizedHeight) return;
    g_minimizedHeight = std::clamp(height, 1, kLargestRadius);
    const int width = std::max(g_minimizedHeight / 4, 1);
    for (std::size_t i = 0; i < Corvo::kTunerBars; ++i) {
        Corvo::DrawPanelBar(*leftItemsMinimized[i], width, g_minimizedHeight, kLit[i]);
        Corvo::DrawPanelBar(*rightItemsMinimized[i], width, g_minimizedHeight, kLit[i]);
        Corvo::DrawPanelBar(*baseItemsMinimized_L[i], width, g_minimizedHeight, kUnlit);
        Corvo::DrawPanelBar(*baseItemsMinimized_R[i], width, g_minimizedHeight, kUnlit);
    }
}

void kivspectrum::SetupErrorBitmaps(int side) {
    if (side <= g_errorSide) return;
    g_errorSide = std::clamp(side, 1, kLargestRadius);
    Corvo::DrawPanelArrow(tunerErrorFlatBitmap, g_errorSide, true, kError);
    Corvo::DrawPanelArrow(tunerErrorSharpBitmap, g_errorSide, false, kError);
}
