// A host that draws: it needs the library beside the other, and neither Cairo's headers nor its package.
#include "Drawing/Backends/DrawingCairo.h"
#include "Spectrum/kivspectrum.h"

int main() {
    Corvo::DrawingCairo drawing;
    const auto brush = drawing.CreateSolidBrush(Corvo::ColourFromRgb(0x4CC2FF), 255);
    drawing.ReleaseBrush(brush);
    void (kivspectrum::*const routine)(Corvo::DrawingCairo::DrawTarget&, const Corvo::RectF&) =
        &kivspectrum::DoDrawSpectrum<Corvo::DrawingCairo>;
    return brush.object && routine ? 0 : 1;
}
