#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "Drawing/DrawTarget.h"
#include "Drawing/Look.h"

namespace TestSupport {

// A back-end that draws through another one and remembers where texts came to stand.
template <typename Inner>
struct RecordingDrawing {
    struct Text {
        std::string text;
        Corvo::RectF box;  // from the top of the capitals to the descent
    };

    class DrawTarget {
    public:
        explicit DrawTarget(typename Inner::DrawTarget& inner) : m_inner(inner) {}

        float Scale() const { return m_inner.Scale(); }
        void Clear(Corvo::ColourReference colour) { m_inner.Clear(colour); }
        void Line(Corvo::PointF from, Corvo::PointF to, const Corvo::Stroke& s) { m_inner.Line(from, to, s); }
        void Polyline(const Corvo::PointF* p, int n, const Corvo::Stroke& s) { m_inner.Polyline(p, n, s); }
        void FillPolygon(const Corvo::PointF* p, int n, Corvo::Ink ink) { m_inner.FillPolygon(p, n, ink); }
        void FillRectangle(const Corvo::RectF& r, Corvo::Ink ink) { m_inner.FillRectangle(r, ink); }
        void OutlineRectangle(const Corvo::RectF& r, const Corvo::Stroke& s) {
            m_inner.OutlineRectangle(r, s);
        }
        void FillRoundedRectangle(const Corvo::RectF& r, float radius, Corvo::Ink ink) {
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
            const float height = Corvo::kCapHeight * size;
            if (!text.empty())
                texts.push_back({std::string(text),
                                 {baseline.x - share * metrics.width, baseline.y - height, metrics.width,
                                  height + metrics.descent}});
            m_inner.Text(text, baseline, align, size, ink);
        }
        void Bitmap(const Corvo::DrawingBitmap& b, const Corvo::RectF& r, std::uint8_t opacity) {
            m_inner.Bitmap(b, r, opacity);
        }
        void PushClip(const Corvo::RectF& r) { m_inner.PushClip(r); }
        void PopClip() { m_inner.PopClip(); }

        std::vector<typename RecordingDrawing::Text> texts;

    private:
        typename Inner::DrawTarget& m_inner;
    };
};

}  // namespace TestSupport
