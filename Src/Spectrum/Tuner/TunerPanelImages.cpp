#include "Spectrum/Tuner/TunerPanelImages.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>

namespace Corvo {
namespace {

constexpr std::uint32_t kCircle = 0xF5F7FA, kUnlit = 0x262E39;
constexpr std::uint32_t kLit[kTunerBars] = {0xB8E05B, 0xF2D15A, 0xF2A65A, 0xFF7A6B};
constexpr std::uint32_t kError = 0xFF7A6B;

}  // namespace

void TunerPanelImages::SetUpCircle(int needed) {
    m_circleSize.Provide(needed, [this](int radius) {
        DrawPanelCircle(circle, 2 * radius, kCircle);
        DrawPanelCircle(circleBase, 2 * radius, kUnlit);
        for (std::size_t i = 0; i < kTunerBars; ++i) {
            const int bar = static_cast<int>(i);
            DrawPanelArc(left[i], radius, bar, true, kLit[i]);
            DrawPanelArc(right[i], radius, bar, false, kLit[i]);
            DrawPanelArc(baseLeft[i], radius, bar, true, kUnlit);
            DrawPanelArc(baseRight[i], radius, bar, false, kUnlit);
        }
    });
}

void TunerPanelImages::SetUpMinimized(int needed) {
    m_minimizedSize.Provide(needed, [this](int height) {
        const int width = std::max(height / 4, 1);
        for (std::size_t i = 0; i < kTunerBars; ++i) {
            DrawPanelBar(leftMinimized[i], width, height, kLit[i]);
            DrawPanelBar(rightMinimized[i], width, height, kLit[i]);
            DrawPanelBar(baseLeftMinimized[i], width, height, kUnlit);
            DrawPanelBar(baseRightMinimized[i], width, height, kUnlit);
        }
    });
}

void TunerPanelImages::SetUpErrors(int needed) {
    m_errorSize.Provide(needed, [this](int side) {
        DrawPanelArrow(errorFlat, side, true, kError);
        DrawPanelArrow(errorSharp, side, false, kError);
    });
}

void TunerPanelImages::Forget() {
    for (ImageSize* const size : {&m_circleSize, &m_minimizedSize, &m_errorSize}) size->Forget();
}

}  // namespace Corvo
