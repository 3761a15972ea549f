#pragma once

#include <array>

#include "Picture/DrawingBitmap.h"
#include "Spectrum/Tuner/ImageSize.h"
#include "Spectrum/Tuner/TunerPanelBitmaps.h"

namespace Corvo {

// The images of the tuner panel, drawn at the size needed when they are first drawn. Bars stand in order,
// nearest the centre first; what is not lit is called base. They belong to the thread that draws.
struct TunerPanelImages {
    using Bars = std::array<DrawingBitmap, kTunerBars>;

    DrawingBitmap circle, circleBase;
    Bars left, right, baseLeft, baseRight;                                      // ripples beside the circle
    Bars leftMinimized, rightMinimized, baseLeftMinimized, baseRightMinimized;  // upright, for small panels
    DrawingBitmap errorFlat, errorSharp;  // arrows that point to where the note has to go

    // Draw the images anew when larger ones are needed, when they have been more than twice too large for a
    // while, or after Forget. Sizes in pixels, limited to 1..1024. Without memory they throw std::bad_alloc,
    // and the next call tries again.
    void SetUpCircle(int radius);
    void SetUpMinimized(int height);
    void SetUpErrors(int side);
    void Forget();

private:
    ImageSize m_circleSize, m_minimizedSize, m_errorSize;
};

}  // namespace Corvo
