#include <algorithm>
#include <string>

#include <gtest/gtest.h>

#include "Drawing/DrawingFont.h"
#include "Support/DrawingSurface.h"

using namespace Corvo;
using TestSupport::DrawingSurface;

namespace {

constexpr int kWidth = 320, kHeight = 100;
constexpr PointF kBaseline{160.0f, 60.0f};

}  // namespace

template <typename Drawing>
class TextPrimitive : public testing::Test {
protected:
    float WidthOf(const std::string& text, float size) {
        float width = 0.0f;
        m_surface.Paint(96.0f, [&](DrawTarget& target) { width = target.MeasureText(text, size).width; });
        return width;
    }

    DrawingSurface<Drawing> m_surface{kWidth, kHeight};
};
TYPED_TEST_SUITE(TextPrimitive, TestSupport::DrawingBackends);

// Catches text that hangs from its top or stands on its box instead of the baseline, and a box that is not
// the one around what is drawn.
TYPED_TEST(TextPrimitive, StandsOnItsBaselineInItsMeasuredBox) {
    for (const float size : {12.0f, 48.0f})
        for (const TextAlign align : {TextAlign::Left, TextAlign::Centre, TextAlign::Right}) {
            SCOPED_TRACE(std::to_string(size) + ", " + std::to_string(static_cast<int>(align)));
            TextMetrics metrics{};
            this->m_surface.Paint(96.0f, [&](DrawTarget& target) {
                target.Clear(0);
                metrics = target.MeasureText("HIH", size);
                target.Text("HIH", kBaseline, align, size, {0xFFFFFF});
            });
            float inkLeft = kWidth, inkTop = kHeight, inkRight = 0.0f, inkBottom = 0.0f;
            for (int y = 0; y < kHeight; ++y)
                for (int x = 0; x < kWidth; ++x) {
                    if ((this->m_surface.Pixel(x, y) & 0xFF) <= 0x60) continue;
                    inkLeft = std::min(inkLeft, static_cast<float>(x));
                    inkTop = std::min(inkTop, static_cast<float>(y));
                    inkRight = std::max(inkRight, static_cast<float>(x + 1));
                    inkBottom = std::max(inkBottom, static_cast<float>(y + 1));
                }
            const float slack = 1.0f + 0.03f * size;  // a smoothed edge, one typeface and another
            const float left = kBaseline.x - metrics.width * static_cast<float>(align) / 2.0f;
            const float right = left + metrics.width, bearing = 0.06f * size;
            EXPECT_NEAR(inkBottom, kBaseline.y, 1.0f);
            EXPECT_NEAR(inkBottom - inkTop, kCapHeight * size, slack);
            EXPECT_NEAR(inkLeft, left + bearing, bearing + slack);
            EXPECT_NEAR(inkRight, right - bearing, bearing + slack);
            EXPECT_GT(metrics.ascent, kCapHeight * size);
            EXPECT_GT(metrics.descent, 0.1f * size);
        }
}

// Catches margins in the measure, blanks left out of it, bytes taken for letters, a cut inside one, and a
// typeface's file that stops the text when it is gone.
TYPED_TEST(TextPrimitive, IsMeasuredByItsAdvance) {
    const float one = this->WidthOf("H", 48.0f);
    EXPECT_GT(one, 24.0f);
    EXPECT_NEAR(this->WidthOf("HHHH", 48.0f), 4.0f * one, 2.0f);
    EXPECT_NEAR(this->WidthOf("H H", 48.0f), one + this->WidthOf("H ", 48.0f), 1.0f);
    EXPECT_NEAR(this->WidthOf("H", 24.0f), one / 2.0f, 1.0f);
    EXPECT_NEAR(this->WidthOf("\xC3\xA9\xC3\xA9", 48.0f), this->WidthOf("ee", 48.0f), 1.0f);
    EXPECT_EQ(this->WidthOf("", 48.0f), 0.0f);

    std::string letters;
    for (int i = 0; i < 47; ++i) letters += "\xC3\xA9";
    const float whole = this->WidthOf(letters, 12.0f);  // 94 bytes of the 95 that are drawn
    EXPECT_NEAR(whole, 47.0f * this->WidthOf("\xC3\xA9", 12.0f), 24.0f);
    EXPECT_EQ(this->WidthOf(letters + "\xC3\xA9 and more", 12.0f), whole);

    DrawingFont::SetFile("no/such/file.ttf");
    DrawingSurface<TypeParam> surface(4, 4);
    DrawingFont::SetFile("");
    surface.Paint(96.0f, [&](DrawTarget& t) { EXPECT_EQ(t.MeasureText("H", 48.0f).width, one); });
}
