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

struct Box {
    int left = kWidth, top = kHeight, right = 0, bottom = 0;  // past the last
};

template <typename Surface>
Box InkOf(Surface& surface) {
    Box box;
    for (int y = 0; y < kHeight; ++y)
        for (int x = 0; x < kWidth; ++x)
            if ((surface.Pixel(x, y) & 0xFF) > 0x60)
                box = {std::min(box.left, x), std::min(box.top, y), std::max(box.right, x + 1),
                       std::max(box.bottom, y + 1)};
    return box;
}

}  // namespace

template <typename Drawing>
class TextPrimitive : public testing::Test {
protected:
    float WidthOf(const char* text, float size) {
        float width = 0.0f;
        m_surface.Paint(96.0f, [&](auto& target) { width = target.MeasureText(text, size).width; });
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
            const float slack = 1.0f + 0.03f * size;  // a smoothed edge, one typeface and another
            TextMetrics metrics{};
            this->m_surface.Paint(96.0f, [&](auto& target) {
                target.Clear(0);
                metrics = target.MeasureText("HIH", size);
                target.Text("HIH", kBaseline, align, size, {0xFFFFFF});
            });
            const Box ink = InkOf(this->m_surface);
            EXPECT_NEAR(static_cast<float>(ink.bottom), kBaseline.y, 1.0f);
            EXPECT_NEAR(static_cast<float>(ink.bottom - ink.top), kCapHeight * size, slack);
            EXPECT_GT(metrics.ascent, kCapHeight * size);
            EXPECT_GT(metrics.descent, 0.1f * size);

            const float share = align == TextAlign::Left ? 0.0f : align == TextAlign::Centre ? 0.5f : 1.0f;
            const float left = kBaseline.x - metrics.width * share, bearing = 0.12f * size;
            EXPECT_GE(static_cast<float>(ink.left), left - 1.0f);
            EXPECT_LE(static_cast<float>(ink.left), left + bearing + slack);
            EXPECT_LE(static_cast<float>(ink.right), left + metrics.width + 1.0f);
            EXPECT_GE(static_cast<float>(ink.right), left + metrics.width - bearing - slack);
        }
}

// Catches margins in the measure, blanks left out of it, bytes taken for letters and a cut inside one.
TYPED_TEST(TextPrimitive, IsMeasuredByItsAdvance) {
    const float one = this->WidthOf("H", 48.0f);
    EXPECT_GT(one, 24.0f);
    EXPECT_NEAR(this->WidthOf("HHHH", 48.0f), 4.0f * one, 2.0f);
    EXPECT_NEAR(this->WidthOf("H H", 48.0f), one + this->WidthOf("H ", 48.0f), 1.0f);
    EXPECT_NEAR(this->WidthOf("H", 24.0f), one / 2.0f, 1.0f);
    EXPECT_NEAR(this->WidthOf("\xC3\xA9\xC3\xA9", 48.0f), this->WidthOf("ee", 48.0f), 1.0f);
    EXPECT_EQ(this->WidthOf("", 48.0f), 0.0f);

    const auto letters = [](int count) {
        std::string text;
        for (int i = 0; i < count; ++i) text += "\xC3\xA9";
        return text;
    };
    const float whole = this->WidthOf(letters(47).c_str(), 12.0f);  // 94 bytes of the 95 that are drawn
    EXPECT_NEAR(whole, 47.0f * this->WidthOf("\xC3\xA9", 12.0f), 24.0f);
    EXPECT_EQ(this->WidthOf(letters(48).c_str(), 12.0f), whole);
    EXPECT_EQ(this->WidthOf(letters(100).c_str(), 12.0f), whole);
}

// Catches a typeface's file that stops the text when it is gone.
TYPED_TEST(TextPrimitive, DoesWithoutTheTypefacesFile) {
    DrawingFont::SetFile("no/such/file.ttf");
    DrawingSurface<TypeParam> surface(4, 4);
    DrawingFont::SetFile("");
    surface.Paint(96.0f, [&](auto& target) {
        EXPECT_EQ(target.MeasureText("Montserrat", 48.0f).width, this->WidthOf("Montserrat", 48.0f));
    });
}
