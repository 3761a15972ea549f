#include "Drawing/Backends/DrawingD2D.h"

#include <algorithm>
#include <vector>

#include "Drawing/Backends/ResourceKeys.h"
#include "Drawing/Backends/SlotCache.h"
#include "Drawing/Backends/TypefaceDirectWrite.h"
#include "Drawing/Backends/UsablePoints.h"
#include "Drawing/Backends/WideText.h"
#include "Drawing/PrimitiveArguments.h"

#include <d2d1.h>

using Microsoft::WRL::ComPtr;

namespace Corvo {
namespace {

// What a pen's handle stands for.
struct D2DPen {
    ComPtr<ID2D1SolidColorBrush> brush;
    ComPtr<ID2D1StrokeStyle> style;
    float width;
};

struct D2DText {
    ComPtr<IDWriteTextLayout> layout;
    float baseline;  // below the layout's top
    TextMetrics metrics{};
};

// A picture as the render target has it.
struct D2DBitmap {
    ComPtr<ID2D1Bitmap> bitmap;
    int width = 0, height = 0;
    bool opaque = false;
    std::uint32_t version = 0;
};

D2D1_POINT_2F Convert(PointF point) { return {point.x, point.y}; }
D2D1_RECT_F Convert(const RectF& r) { return {r.x, r.y, r.x + r.width, r.y + r.height}; }

D2D1_COLOR_F ColourOf(Ink ink) {
    const auto share = [](std::uint8_t part) { return static_cast<float>(part) / 255.0f; };
    return {share(RedOf(ink.colour)), share(GreenOf(ink.colour)), share(BlueOf(ink.colour)),
            share(ink.opacity)};
}

ComPtr<ID2D1StrokeStyle> MakeRoundStyle(ID2D1Factory* factory) {
    D2D1_STROKE_STYLE_PROPERTIES properties{};
    properties.startCap = properties.endCap = properties.dashCap = D2D1_CAP_STYLE_ROUND;
    properties.lineJoin = D2D1_LINE_JOIN_ROUND;
    properties.miterLimit = 1.0f;
    ComPtr<ID2D1StrokeStyle> style;
    factory->CreateStrokeStyle(&properties, nullptr, 0, &style);
    return style;
}

UINT32 RowBytes(const DrawingBitmap& bitmap) {
    return static_cast<UINT32>(bitmap.width) * static_cast<UINT32>(sizeof(std::uint32_t));
}

ComPtr<ID2D1Bitmap> Upload(ID2D1RenderTarget* target, const DrawingBitmap& bitmap) {
    D2D1_BITMAP_PROPERTIES properties{};
    properties.pixelFormat = {DXGI_FORMAT_B8G8R8A8_UNORM,
                              bitmap.opaque ? D2D1_ALPHA_MODE_IGNORE : D2D1_ALPHA_MODE_PREMULTIPLIED};
    properties.dpiX = properties.dpiY = kDotsPerInch;
    ComPtr<ID2D1Bitmap> uploaded;
    target->CreateBitmap({static_cast<UINT32>(bitmap.width), static_cast<UINT32>(bitmap.height)},
                         bitmap.pixels.data(), RowBytes(bitmap), &properties, &uploaded);
    return uploaded;
}

// By more than a right angle.
bool TurnsBack(D2D1_POINT_2F before, D2D1_POINT_2F at, D2D1_POINT_2F after) {
    return (at.x - before.x) * (after.x - at.x) + (at.y - before.y) * (after.y - at.y) < 0.0f;
}

void AddFigure(ID2D1GeometrySink& sink, const D2D1_POINT_2F* begin, const D2D1_POINT_2F* end,
               D2D1_FIGURE_BEGIN kind, D2D1_FIGURE_END closing) {
    sink.BeginFigure(*begin, kind);
    sink.AddLines(begin + 1, static_cast<UINT32>(end - begin - 1));
    sink.EndFigure(closing);
}

}  // namespace

struct DrawingD2D::Resources {
    explicit Resources(ID2D1RenderTarget* renderTarget) : target(renderTarget) {
        target->GetFactory(&factory);
        roundStyle = MakeRoundStyle(factory.Get());
        factory->CreateDrawingStateBlock(nullptr, nullptr, &stateFound);
    }

    const ComPtr<ID2D1RenderTarget> target;
    ComPtr<ID2D1Factory> factory;
    ComPtr<ID2D1StrokeStyle> roundStyle;
    ComPtr<ID2D1DrawingStateBlock> stateFound;
    const TypefaceDirectWrite typeface;
    SlotCache<InkKey, DrawingBrush, kKeptInks> brushes;
    SlotCache<StrokeKey, DrawingPen*, kKeptStrokes> pens;
    SlotCache<TextKey, D2DText, kKeptTexts> texts;
    SlotCache<const DrawingBitmap*, D2DBitmap, 48> bitmaps;
    UsablePoints<D2D1_POINT_2F> points;

    const D2DText& LaidOut(std::string_view text, float size) {
        const TextKey key(text, size);
        return texts.Find(
            key, [&] { return LayOut(key); }, [](D2DText&) {});
    }

    D2DText LayOut(const TextKey& key) {
        D2DText text{typeface.LayOut(WideText(key), key.size),
                     0.0f,
                     {0.0f, typeface.Ascent() * key.size, typeface.Descent() * key.size}};
        DWRITE_TEXT_METRICS metrics;
        if (text.layout && SUCCEEDED(text.layout->GetMetrics(&metrics)))
            text.metrics.width = metrics.widthIncludingTrailingWhitespace;
        DWRITE_LINE_METRICS line;
        UINT32 lines = 0;
        if (text.layout && SUCCEEDED(text.layout->GetLineMetrics(&line, 1, &lines)) && lines == 1)
            text.baseline = line.baseline;
        return text;
    }

    // Null when there is none.
    ID2D1Bitmap* Uploaded(const DrawingBitmap& bitmap) {
        D2DBitmap& known = bitmaps.Find(
            &bitmap, [] { return D2DBitmap{}; }, [](D2DBitmap&) {});
        const bool fits = known.bitmap && known.width == bitmap.width && known.height == bitmap.height &&
                          known.opaque == bitmap.opaque;
        if (!fits)
            known = {Upload(target.Get(), bitmap), bitmap.width, bitmap.height, bitmap.opaque,
                     bitmap.version};
        else if (known.version != bitmap.version)
            known.bitmap->CopyFromMemory(nullptr, bitmap.pixels.data(), RowBytes(bitmap));
        known.version = bitmap.version;
        return known.bitmap.Get();
    }

    ComPtr<ID2D1PathGeometry> Polygon(const PointF* from, int count) {
        return Path(from, count, [](ID2D1GeometrySink& sink, const std::vector<D2D1_POINT_2F>& all) {
            AddFigure(sink, all.data(), all.data() + all.size(), D2D1_FIGURE_BEGIN_FILLED,
                      D2D1_FIGURE_END_CLOSED);
        });
    }

    // Where the line turns back it ends and begins anew: round ends are a round joint, and some systems that
    // stand in for Windows would draw a long spike there.
    ComPtr<ID2D1PathGeometry> Polyline(const PointF* from, int count) {
        return Path(from, count, [](ID2D1GeometrySink& sink, const std::vector<D2D1_POINT_2F>& all) {
            const D2D1_POINT_2F *begin = all.data(), *const end = begin + all.size();
            for (const D2D1_POINT_2F* p = begin + 1; p + 1 < end; ++p)
                if (TurnsBack(p[-1], p[0], p[1])) {
                    AddFigure(sink, begin, p + 1, D2D1_FIGURE_BEGIN_HOLLOW, D2D1_FIGURE_END_OPEN);
                    begin = p;
                }
            AddFigure(sink, begin, end, D2D1_FIGURE_BEGIN_HOLLOW, D2D1_FIGURE_END_OPEN);
        });
    }

    // Of the points that can be drawn, handed to add(sink, points); null without a line among them.
    template <typename Add>
    ComPtr<ID2D1PathGeometry> Path(const PointF* from, int count, Add add) {
        const auto& usable = points.Of(from, count);
        ComPtr<ID2D1PathGeometry> path;
        ComPtr<ID2D1GeometrySink> sink;
        if (usable.size() < 2 || FAILED(factory->CreatePathGeometry(&path)) || FAILED(path->Open(&sink)))
            return nullptr;
        sink->SetFillMode(D2D1_FILL_MODE_ALTERNATE);
        add(*sink.Get(), usable);
        return SUCCEEDED(sink->Close()) ? path : nullptr;
    }
};

DrawingD2D::DrawingD2D(ID2D1RenderTarget* target) : m_resources(std::make_unique<Resources>(target)) {}

DrawingD2D::~DrawingD2D() {
    m_resources->brushes.Clear([this](DrawingBrush brush) { ReleaseBrush(brush); });
    m_resources->pens.Clear([this](DrawingPen* pen) { ReleasePen(pen); });
}

DrawingBrush DrawingD2D::CreateSolidBrush(ColourReference colour, std::uint8_t opacity) {
    const D2D1_COLOR_F wanted = ColourOf({colour, opacity});
    ID2D1SolidColorBrush* brush = nullptr;
    m_resources->target->CreateSolidColorBrush(&wanted, nullptr, &brush);
    return {brush};
}

void DrawingD2D::ReleaseBrush(DrawingBrush brush) {
    if (brush.object) static_cast<ID2D1SolidColorBrush*>(brush.object)->Release();
}

DrawingPen* DrawingD2D::CreatePen(const Stroke& stroke) {
    auto* const pen = new D2DPen{nullptr, m_resources->roundStyle, stroke.width};
    const DrawingBrush brush = CreateSolidBrush(stroke.ink.colour, stroke.ink.opacity);
    pen->brush.Attach(static_cast<ID2D1SolidColorBrush*>(brush.object));
    return new DrawingPen{pen};
}

void DrawingD2D::ReleasePen(DrawingPen*& pen) {
    if (!pen) return;
    delete static_cast<D2DPen*>(pen->object);
    delete pen;
    pen = nullptr;
}

DrawingD2D::DrawTarget::DrawTarget(DrawingD2D& drawing, float dpi)
    : Corvo::DrawTarget(dpi), m_drawing(drawing), m_target(drawing.m_resources->target.Get()) {
    m_target->SaveDrawingState(m_drawing.m_resources->stateFound.Get());
    m_target->GetDpi(&m_xDpi, &m_yDpi);
    m_target->SetDpi(kDotsPerInch, kDotsPerInch);
    m_target->SetAntialiasMode(D2D1_ANTIALIAS_MODE_PER_PRIMITIVE);
    m_target->SetTextAntialiasMode(D2D1_TEXT_ANTIALIAS_MODE_GRAYSCALE);
    m_target->SetTextRenderingParams(m_drawing.m_resources->typeface.Rendering());
}

DrawingD2D::DrawTarget::~DrawTarget() {
    while (m_clips > 0) PopClip();
    m_target->SetDpi(m_xDpi, m_yDpi);
    m_target->RestoreDrawingState(m_drawing.m_resources->stateFound.Get());
}

// Null when there is none.
ID2D1SolidColorBrush* DrawingD2D::DrawTarget::Use(Ink ink) {
    const DrawingBrush brush = m_drawing.m_resources->brushes.Find(
        {ink}, [&] { return m_drawing.CreateSolidBrush(ink.colour, ink.opacity); },
        [&](DrawingBrush old) { m_drawing.ReleaseBrush(old); });
    return static_cast<ID2D1SolidColorBrush*>(brush.object);
}

void DrawingD2D::DrawTarget::Clear(ColourReference colour) {
    const D2D1_COLOR_F opaque = ColourOf({colour});
    m_target->Clear(&opaque);
}

void DrawingD2D::DrawTarget::Polyline(const PointF* points, int count, const Stroke& stroke) {
    if (!IsUsableSize(stroke.width)) return;
    const DrawingPen* const pen = m_drawing.m_resources->pens.Find(
        {{stroke.ink}, stroke.width}, [&] { return m_drawing.CreatePen(stroke); },
        [&](DrawingPen* old) { m_drawing.ReleasePen(old); });
    const auto& [brush, style, width] = *static_cast<const D2DPen*>(pen->object);
    const auto path = m_drawing.m_resources->Polyline(points, count);
    if (path && brush) m_target->DrawGeometry(path.Get(), brush.Get(), width, style.Get());
}

void DrawingD2D::DrawTarget::FillPolygon(const PointF* points, int count, Ink ink) {
    ID2D1SolidColorBrush* const brush = Use(ink);
    const auto path = m_drawing.m_resources->Polygon(points, count);
    if (path && brush) m_target->FillGeometry(path.Get(), brush);
}

void DrawingD2D::DrawTarget::FillRectangle(const RectF& r, Ink ink) {
    if (!IsUsable(r)) return;
    const D2D1_RECT_F rectangle = Convert(r);
    if (ID2D1SolidColorBrush* const brush = Use(ink)) m_target->FillRectangle(&rectangle, brush);
}

void DrawingD2D::DrawTarget::OutlineRectangle(const RectF& r, const Stroke& stroke) {
    if (!IsUsable(r) || !IsUsableSize(stroke.width)) return;
    const float width = std::min({stroke.width, r.width / 2.0f, r.height / 2.0f});
    const D2D1_RECT_F middle =
        Convert(RectF{r.x + width / 2.0f, r.y + width / 2.0f, r.width - width, r.height - width});
    if (ID2D1SolidColorBrush* const brush = Use(stroke.ink)) m_target->DrawRectangle(&middle, brush, width);
}

void DrawingD2D::DrawTarget::FillRoundedRectangle(const RectF& r, float radius, Ink ink) {
    if (!IsUsable(r)) return;
    const float corner = std::min({radius > 0.0f ? radius : 0.0f, r.width / 2.0f, r.height / 2.0f});
    const D2D1_ROUNDED_RECT rectangle{Convert(r), corner, corner};
    if (ID2D1SolidColorBrush* const brush = Use(ink)) m_target->FillRoundedRectangle(&rectangle, brush);
}

TextMetrics DrawingD2D::DrawTarget::MeasureText(std::string_view text, float size) {
    if (!IsUsableSize(size)) return {0.0f, 0.0f, 0.0f};
    return m_drawing.m_resources->LaidOut(text, size).metrics;
}

void DrawingD2D::DrawTarget::Text(std::string_view text, PointF baseline, TextAlign align, float size,
                                  Ink ink) {
    if (!IsUsableSize(size) || !IsUsable(baseline)) return;
    const D2DText& laidOut = m_drawing.m_resources->LaidOut(text, size);
    const PointF corner{baseline.x - laidOut.metrics.width * ShareBefore(align),
                        baseline.y - laidOut.baseline};
    ID2D1SolidColorBrush* const brush = Use(ink);
    if (laidOut.layout && brush)
        m_target->DrawTextLayout(Convert(corner), laidOut.layout.Get(), brush,
                                 D2D1_DRAW_TEXT_OPTIONS_NO_SNAP);
}

void DrawingD2D::DrawTarget::Bitmap(const DrawingBitmap& bitmap, const RectF& r, std::uint8_t opacity) {
    if (!IsUsable(bitmap) || !IsUsable(r)) return;
    const bool ownSize =
        r.width == static_cast<float>(bitmap.width) && r.height == static_cast<float>(bitmap.height);
    const D2D1_RECT_F destination = Convert(r);
    if (ID2D1Bitmap* const uploaded = m_drawing.m_resources->Uploaded(bitmap))
        m_target->DrawBitmap(uploaded, &destination, static_cast<float>(opacity) / 255.0f,
                             ownSize ? D2D1_BITMAP_INTERPOLATION_MODE_NEAREST_NEIGHBOR
                                     : D2D1_BITMAP_INTERPOLATION_MODE_LINEAR);
}

void DrawingD2D::DrawTarget::PushClip(const RectF& r) {
    const D2D1_RECT_F clip = IsUsable(r) ? Convert(r) : D2D1_RECT_F{};
    m_target->PushAxisAlignedClip(&clip, D2D1_ANTIALIAS_MODE_PER_PRIMITIVE);
    ++m_clips;
}

void DrawingD2D::DrawTarget::PopClip() {
    if (m_clips == 0) return;
    --m_clips;
    m_target->PopAxisAlignedClip();
}

}  // namespace Corvo
