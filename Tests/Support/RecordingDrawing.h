#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "Drawing/DrawTarget.h"
#include "Drawing/Views/Look.h"

namespace TestSupport {

// A back-end that draws through another one and remembers what it drew, kind by kind and in order.
template <typename Inner>
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

    class DrawTarget : public Drawn {
    public:
        explicit DrawTarget(typename Inner::DrawTarget& inner) : m_inner(inner) {}

        float Scale() const { return m_inner.Scale(); }
        void Clear(Corvo::ColourReference colour) { m_inner.Clear(colour); }
        void Line(Corvo::PointF from, Corvo::PointF to, const Corvo::Stroke& s) {
            this->lines.push_back({{from, to}, s.ink.colour});
            m_inner.Line(from, to, s);
        }
        void Polyline(const Corvo::PointF* p, int n, const Corvo::Stroke& s) {
            this->lines.push_back({{p, p + n}, s.ink.colour});
            m_inner.Polyline(p, n, s);
        }
        void FillPolygon(const Corvo::PointF* p, int n, Corvo::Ink ink) {
            this->polygons.push_back({{p, p + n}, ink.colour});
            m_inner.FillPolygon(p, n, ink);
        }
        void FillRectangle(const Corvo::RectF& r, Corvo::Ink ink) {
            this->rectangles.push_back({r, ink.colour});
            m_inner.FillRectangle(r, ink);
        }
        void OutlineRectangle(const Corvo::RectF& r, const Corvo::Stroke& s) {
            m_inner.OutlineRectangle(r, s);
        }
        void FillRoundedRectangle(const Corvo::RectF& r, float radius, Corvo::Ink ink) {
            this->rectangles.push_back({r, ink.colour});
            m_inner.FillRoundedRectangle(r, radius, ink);
        }
        Corvo::TextMetrics MeasureText(std::string_view text, float size) {
            return m_inner.MeasureText(text, size);
        }
        void Text(std::string_view text, Corvo::PointF baseline, Corvo::TextAlign align, float size,
                  Corvo::Ink ink) {
            const Corvo::TextMetrics metrics = MeasureText(text, size);
            const float share = align == Corvo::TextAlign::Left     ? 0.0f
                                : align == Corvo::TextAlign::Centre ? 0.5f
                                                                    : 1.0f;
            const float height = Corvo::kCapHeight * size, left = baseline.x - share * metrics.width;
            if (!text.empty())
                this->texts.push_back({std::string(text),
                                       {left, baseline.y - height, metrics.width, height + metrics.descent},
                                       {left + metrics.width / 2.0f, baseline.y - height / 2.0f}});
            m_inner.Text(text, baseline, align, size, ink);
        }
        void Bitmap(const Corvo::DrawingBitmap& b, const Corvo::RectF& r, std::uint8_t opacity) {
            this->images.push_back({&b, r});
            m_inner.Bitmap(b, r, opacity);
        }
        void PushClip(const Corvo::RectF& r) { m_inner.PushClip(r); }
        void PopClip() { m_inner.PopClip(); }

    private:
        typename Inner::DrawTarget& m_inner;
    };
};

}  // namespace TestSupport
