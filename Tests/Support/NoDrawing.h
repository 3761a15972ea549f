#pragma once

#include <algorithm>
#include <cstdint>
#include <string_view>

#include "Drawing/DrawTarget.h"
#include "Drawing/Views/Views.h"

namespace TestSupport {

// A back-end that only measures, so that no graphics library has a say. Every character is 0.6 sizes wide.
struct NoDrawing {
    class DrawTarget : public Corvo::DrawTarget {
    public:
        explicit DrawTarget(float dpi = 96.0f) : Corvo::DrawTarget(dpi) {}

        void Clear(Corvo::ColourReference) override {}
        void Polyline(const Corvo::PointF*, int, const Corvo::Stroke&) override {}
        void FillPolygon(const Corvo::PointF*, int, Corvo::Ink) override {}
        void FillRectangle(const Corvo::RectF&, Corvo::Ink) override {}
        void OutlineRectangle(const Corvo::RectF&, const Corvo::Stroke&) override {}
        void FillRoundedRectangle(const Corvo::RectF&, float, Corvo::Ink) override {}
        Corvo::TextMetrics MeasureText(std::string_view text, float size) override {
            const auto characters = std::ranges::count_if(text, [](char c) { return (c & 0xC0) != 0x80; });
            return {0.6f * size * static_cast<float>(characters), size, 0.25f * size};
        }
        void Text(std::string_view, Corvo::PointF, Corvo::TextAlign, float, Corvo::Ink) override {}
        void Bitmap(const Corvo::DrawingBitmap&, const Corvo::RectF&, std::uint8_t) override {}
        void PushClip(const Corvo::RectF&) override {}
        void PopClip() override {}
    };
};

}  // namespace TestSupport
