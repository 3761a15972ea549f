#include <gtest/gtest.h>

#include <string>

#include "Drawing/Views/ShownAnalyser.h"
#include "Drawing/Views/Views.h"
#include "Support/RecordingDrawing.h"

using namespace Corvo;
using TestSupport::DrawingSurface;
using TestSupport::RecordingDrawing;

namespace {

bool Overlap(const RectF& a, const RectF& b) {
    constexpr float kTouch = 0.51f;  // boxes may touch
    return a.x + a.width > b.x + kTouch && b.x + b.width > a.x + kTouch && a.y + a.height > b.y + kTouch &&
           b.y + b.height > a.y + kTouch;
}

template <typename Texts>
void ExpectApartAndInside(const Texts& texts, const RectF& whole) {
    for (std::size_t i = 0; i < texts.size(); ++i) {
        const auto& [text, box, middle] = texts[i];
        EXPECT_GE(box.x, whole.x - 0.5f) << text;
        EXPECT_GE(box.y, whole.y - 0.5f) << text;
        EXPECT_LE(box.x + box.width, whole.x + whole.width + 0.5f) << text;
        EXPECT_LE(box.y + box.height, whole.y + whole.height + 0.5f) << text;
        for (std::size_t j = 0; j < i; ++j)
            EXPECT_FALSE(Overlap(box, texts[j].box)) << "\"" << text << "\" and \"" << texts[j].text << "\"";
    }
}

}  // namespace

template <typename Drawing>
class TextLayout : public ViewTest {};
TYPED_TEST_SUITE(TextLayout, TestSupport::DrawingBackends);

// Catches labels cut at an edge or over each other, at any size, resolution and scale.
TYPED_TEST(TextLayout, TextsStayApartAndInside) {
    using Recording = RecordingDrawing<TypeParam>;
    constexpr RectF kSizes[] = {{0, 0, 1280, 720}, {0, 0, 420, 260}, {7, 11, 160, 120}};
    ShownAnalyser shown;
    kivspectrum& analyser = shown.analyser;
    analyser.SetTunerOn(true);
    analyser.ObserverUpdate();
    analyser.ShowSonogram(true);
    Tuner::SetTemperament(10);
    shown.Hear(466.16, 0.5, 0.6);
    ASSERT_TRUE(analyser.GetTuner()->IsTuned());
    std::size_t texts = 0;
    DrawingSurface<TypeParam> surface(16, 16);
    for (const RectF& size : kSizes)
        for (const float dpi : {96.0f, 144.0f, 192.0f})
            for (int scale = -1; scale <= 5; ++scale)
                for (const bool notes : {false, true}) {
                    SCOPED_TRACE(testing::Message() << size.width << "x" << size.height << " at " << dpi
                                                    << " dpi, scale " << scale << (notes ? ", notes" : ""));
                    kivspectrum::settings.view_option_a = scale;
                    kivspectrum::settings.view_flag_d = notes;
                    shown.Hear(466.16, 0.5, 0.04);
                    surface.Paint(dpi, [&](auto& inner) {
                        const auto check = [&](auto draw) {
                            typename Recording::DrawTarget target(inner);
                            draw(target);
                            texts += target.texts.size();
                            ExpectApartAndInside(target.texts, size);
                        };
                        check([&](auto& t) {
                            analyser.template DoDrawSonogramAndSpectrum<Recording>(t, size);
                        });
                        check([&](auto& t) { analyser.template DrawTuner<Recording>(t, size); });
                    });
                }
    EXPECT_GT(texts, 1000u);
}

// Catches axes that lose all their labels where there is room for them.
TYPED_TEST(TextLayout, RoomIsUsed) {
    using Recording = RecordingDrawing<TypeParam>;
    ShownAnalyser shown;
    DrawingSurface<TypeParam> surface(16, 16);
    surface.Paint(96.0f, [&](auto& inner) {
        typename Recording::DrawTarget target(inner);
        shown.analyser.template DoDrawSpectrum<Recording>(target, {0, 0, 1280, 720});
        const auto has = [&](const std::string& text) {
            return std::ranges::any_of(target.texts, [&](const auto& t) { return t.text == text; });
        };
        for (const char* label :
             {"20 Hz", "50", "100", "1k", "2k", "10k", "20k", "0 dB", "\u221260", "\u221290"})
            EXPECT_TRUE(has(label)) << label;
    });
}
