#include <gtest/gtest.h>

#include "Support/DrawingSurface.h"

using namespace Corvo;
using TestSupport::DrawingSurface;

template <typename Drawing>
class Primitives : public testing::Test {};
using Backends = testing::Types<DrawingCairo>;
TYPED_TEST_SUITE(Primitives, Backends);

// Catches red and blue exchanged on the way from a colour reference to the surface.
TYPED_TEST(Primitives, RedIsTheLowByteOfAColour) {
    DrawingSurface<TypeParam> surface(4, 4);
    surface.Paint(96.0f, [](auto& target) { target.FillRectangle({0, 0, 4, 4}, {0x000000FFu}); });
    EXPECT_EQ(surface.Pixel(1, 1), 0xFF0000u);
}
