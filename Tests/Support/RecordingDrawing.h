#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "Drawing/PrimitiveArguments.h"
#include "Support/NoDrawing.h"

namespace TestSupport {

// A back-end that remembers what it was told to draw, kind by kind and in order.
struct RecordingDrawing {
    struct Text {
        std::string text;
        Corvo::RectF box;      // from the top of the capitals to the descent
        Corvo::PointF middle;  // of the capitals
    };
    // Rounded or not.
    struct Rectangle {
        Corvo::RectF box;
        Corvo::ColourReference colour;
    };
    struct Path {
        std::vector<Corvo::PointF> points;
        Corvo::ColourReference colour;
    };
    struct Image {
        const Corvo::DrawingBitmap* bitmap;
        Corvo::RectF box;
    };
    struct Drawn {
        std::vector<Text> texts;
        std::vector<Rectangle> rectangles;
        std::vector<Path> lines, polygons;
        std::vector<Image> images;
    };

    class DrawTarget : public NoDrawing::DrawTarget, public Drawn {
    public:
        using NoDrawing::DrawTarget::DrawTarget;

        void Polyline(const Corvo::PointF* p, int n, const Corvo::Stroke& s) override {
            lines.push_back({{p, p + n}, s.ink.colour});
        }
        void FillPolygon(const Corvo::PointF* p, int n, Corvo::Ink ink) override {
            polygons.push_back({{p, p + n}, ink.colour});
        }
        void FillRectangle(const Corvo::RectF& r, Corvo::Ink ink) override {
            rectangles.push_back({r, ink.colour});
        }
        void FillRoundedRectangle(const Corvo::RectF& r, float, Corvo::Ink ink) override {
            rectangles.push_back({r, ink.colour});
        }
        void Text(std::string_view text, Corvo::PointF baseline, Corvo::TextAlign align, float size,
                  Corvo::Ink) override {
            if (text.empty()) return;
            const Corvo::TextMetrics metrics = MeasureText(text, size);
            const float height = Corvo::kCapHeight * size;
            const float left = baseline.x - Corvo::ShareBefore(align) * metrics.width;
            texts.push_back({std::string(text),
                             {left, baseline.y - height, metrics.width, height + metrics.descent},
                             {left + metrics.width / 2.0f, baseline.y - height / 2.0f}});
        }
        void Bitmap(const Corvo::DrawingBitmap& b, const Corvo::RectF& r, std::uint8_t) override {
            images.push_back({&b, r});
        }
    };
};

}  // namespace TestSupport
