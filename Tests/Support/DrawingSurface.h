#pragma once

#include <gtest/gtest.h>

namespace TestSupport {

// A picture in memory, black at first, and one back-end that draws on it.
//   Paint(dpi, draw)  hands the back-end's target to `draw`
//   PaintWith(brush)  fills the picture with a brush that the caller made
//   Pixel(x, y)       0xRRGGBB
//   Drawing()         the back-end
//   Smooths()         whether the system under the back-end smooths edges
template <typename Drawing>
class DrawingSurface;

}  // namespace TestSupport

// DrawingBackends: every back-end of this system, what a typed suite about drawing runs over.
#if defined(_WIN32)
#include "Support/DrawingSurfaceD2D.h"
#include "Support/DrawingSurfaceGdiPlus.h"
namespace TestSupport {
using DrawingBackends = testing::Types<Corvo::DrawingGdiPlus, Corvo::DrawingD2D>;
}
#else
#include "Support/DrawingSurfaceCairo.h"
namespace TestSupport {
using DrawingBackends = testing::Types<Corvo::DrawingCairo>;
}
#endif
