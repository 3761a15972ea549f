#include "Drawing/Backends/DrawingGdiPlus.h"

#include <algorithm>

#include "Drawing/Backends/GdiPlusHeader.h"
#include "Drawing/Backends/ResourceKeys.h"
#include "Drawing/Backends/SlotCache.h"
#include "Drawing/Backends/TypefaceGdiPlus.h"
#include "Drawing/Backends/UsablePoints.h"
#include "Drawing/Backends/WideText.h"
#include "Drawing/PrimitiveArguments.h"

namespace Corvo {
namespace {

// GDI+ counts who wants it: it starts with the first and ends with the last.
class Session {
public:
    Session() {
        const Gdiplus::GdiplusStartupInput input;
        if (Gdiplus::GdiplusStartup(&m_token, &input, nullptr) != Gdiplus::Ok) m_token = 0;
    }
    ~Session() {
        if (m_token != 0) Gdiplus::GdiplusShutdown(m_token);
    }
    Session(const Session&) = delete;
    Session& operator=(const Session&) = delete;

private:
    ULONG_PTR m_token = 0;
};

struct GdiPlusText {
    WideText wide;
    TextMetrics metrics{};
};

Gdiplus::RectF Convert(const RectF& r) { return {r.x, r.y, r.width, r.height}; }

Gdiplus::Color ColourOf(Ink ink) {
    return {ink.opacity, RedOf(ink.colour), GreenOf(ink.colour), BlueOf(ink.colour)};
}

}  // namespace

struct DrawingGdiPlus::Resources {
    const Session session;  // first, so that it ends last
    const TypefaceGdiPlus typeface;
    Gdiplus::GraphicsPath path{Gdiplus::FillModeAlternate};
    Gdiplus::ImageAttributes imageAttributes;
    SlotCache<InkKey, DrawingBrush, kKeptInks> brushes;
    SlotCache<StrokeKey, DrawingPen*, kKeptStrokes> pens;
    SlotCache<float, Gdiplus::Font*, 16> fonts;
    SlotCache<TextKey, GdiPlusText, kKeptTexts> texts;
    UsablePoints<Gdiplus::PointF> points;
    std::vector<unsigned> states;  // memory that one target leaves to the next

    const Gdiplus::Font& FontOf(float size) {
        return *fonts.Find(
            size,
            [&] {
                return new Gdiplus::Font(typeface.Family(), size, Gdiplus::FontStyleRegular,
                                         Gdiplus::UnitPixel);
            },
            [](Gdiplus::Font* old) { delete old; });
    }

    const GdiPlusText& LaidOut(const Gdiplus::Graphics& graphics, std::string_view text, float size) {
        const TextKey key(text, size);
        return texts.Find(
            key, [&] { return LayOut(graphics, key); }, [](GdiPlusText&) {});
    }

    GdiPlusText LayOut(const Gdiplus::Graphics& graphics, const TextKey& key) {
        GdiPlusText text{WideText(key), {0.0f, typeface.Ascent() * key.size, typeface.Descent() * key.size}};
        Gdiplus::RectF box;
        const auto status = graphics.MeasureString(text.wide.text.data(), text.wide.length, &FontOf(key.size),
                                                   Gdiplus::PointF(0.0f, 0.0f), typeface.Format(), &box);
        if (status == Gdiplus::Ok) text.metrics.width = box.Width;
        return text;
    }

    const Gdiplus::ImageAttributes& AttributesOf(std::uint8_t opacity) {
        Gdiplus::ColorMatrix matrix = {{{1.0f}, {0.0f, 1.0f}, {0.0f, 0.0f, 1.0f}, {}, {}}};
        matrix.m[3][3] = static_cast<float>(opacity) / 255.0f;
        matrix.m[4][4] = 1.0f;
        imageAttributes.SetColorMatrix(&matrix);
        // What lies beyond the picture's edge is the picture again, not nothing.
        imageAttributes.SetWrapMode(Gdiplus::WrapModeTileFlipXY);
        return imageAttributes;
    }
};

DrawingGdiPlus::DrawingGdiPlus() : m_resources(std::make_unique<Resources>()) {}

DrawingGdiPlus::~DrawingGdiPlus() {
    m_resources->brushes.Clear([this](DrawingBrush brush) { ReleaseBrush(brush); });
    m_resources->pens.Clear([this](DrawingPen* pen) { ReleasePen(pen); });
    m_resources->fonts.Clear([](Gdiplus::Font* font) { delete font; });
}

DrawingBrush DrawingGdiPlus::CreateSolidBrush(ColourReference colour, std::uint8_t opacity) {
    return {new Gdiplus::SolidBrush(ColourOf({colour, opacity}))};
}

void DrawingGdiPlus::ReleaseBrush(DrawingBrush brush) {
    delete static_cast<Gdiplus::SolidBrush*>(brush.object);
}

DrawingPen* DrawingGdiPlus::CreatePen(const Stroke& stroke) {
    // GDI+ draws no line thinner than a pixel; a paler one covers as much.
    const float width = std::max(stroke.width, 1.0f);
    Ink ink = stroke.ink;
    ink.opacity = static_cast<std::uint8_t>(static_cast<float>(ink.opacity) * stroke.width / width + 0.5f);
    auto* const pen = new Gdiplus::Pen(ColourOf(ink), width);
    pen->SetLineJoin(Gdiplus::LineJoinRound);
    pen->SetLineCap(Gdiplus::LineCapRound, Gdiplus::LineCapRound, Gdiplus::DashCapRound);
    return new DrawingPen{pen};
}

void DrawingGdiPlus::ReleasePen(DrawingPen*& pen) {
    if (!pen) return;
    delete static_cast<Gdiplus::Pen*>(pen->object);
    delete pen;
    pen = nullptr;
}

DrawingGdiPlus::DrawTarget::DrawTarget(DrawingGdiPlus& drawing, Gdiplus::Graphics* graphics, float dpi)
    : Corvo::DrawTarget(dpi), m_drawing(drawing), m_graphics(graphics) {
    m_states.swap(m_drawing.m_resources->states);
    m_states.push_back(m_graphics->Save());
    m_graphics->SetPageUnit(Gdiplus::UnitPixel);
    m_graphics->SetPageScale(1.0f);
    m_graphics->SetCompositingMode(Gdiplus::CompositingModeSourceOver);
    m_graphics->SetSmoothingMode(Gdiplus::SmoothingModeAntiAlias);
    m_graphics->SetPixelOffsetMode(Gdiplus::PixelOffsetModeHalf);  // whole numbers are pixel edges
    m_graphics->SetTextRenderingHint(Gdiplus::TextRenderingHintAntiAlias);
}

DrawingGdiPlus::DrawTarget::~DrawTarget() {
    m_graphics->Restore(m_states.front());  // the clips' states with it
    m_states.clear();
    m_states.swap(m_drawing.m_resources->states);
}

const Gdiplus::SolidBrush* DrawingGdiPlus::DrawTarget::Use(Ink ink) {
    const DrawingBrush brush = m_drawing.m_resources->brushes.Find(
        {ink}, [&] { return m_drawing.CreateSolidBrush(ink.colour, ink.opacity); },
        [&](DrawingBrush old) { m_drawing.ReleaseBrush(old); });
    return static_cast<const Gdiplus::SolidBrush*>(brush.object);
}

const Gdiplus::Pen* DrawingGdiPlus::DrawTarget::Use(const Stroke& stroke) {
    const DrawingPen* const pen = m_drawing.m_resources->pens.Find(
        {{stroke.ink}, stroke.width}, [&] { return m_drawing.CreatePen(stroke); },
        [&](DrawingPen* old) { m_drawing.ReleasePen(old); });
    return static_cast<const Gdiplus::Pen*>(pen->object);
}

void DrawingGdiPlus::DrawTarget::Clear(ColourReference colour) { m_graphics->Clear(ColourOf({colour})); }

void DrawingGdiPlus::DrawTarget::Line(PointF from, PointF to, const Stroke& stroke) {
    const PointF points[] = {from, to};
    if (from.x != to.x && from.y != to.y) return Polyline(points, 2, stroke);
    // Along an axis it is filled: GDI+ neither thins its hairlines nor sets them between pixels everywhere.
    if (!IsUsable(from) || !IsUsable(to) || !IsUsableSize(stroke.width)) return;
    const float radius = stroke.width / 2.0f, left = std::min(from.x, to.x), top = std::min(from.y, to.y);
    const float right = std::max(from.x, to.x), bottom = std::max(from.y, to.y);
    FillRoundedRectangle(
        {left - radius, top - radius, right - left + stroke.width, bottom - top + stroke.width}, radius,
        stroke.ink);
}

void DrawingGdiPlus::DrawTarget::Polyline(const PointF* points, int count, const Stroke& stroke) {
    const auto& usable = m_drawing.m_resources->points.Of(points, count);
    if (usable.size() < 2 || !IsUsableSize(stroke.width)) return;
    m_graphics->DrawLines(Use(stroke), usable.data(), static_cast<int>(usable.size()));
}

void DrawingGdiPlus::DrawTarget::FillPolygon(const PointF* points, int count, Ink ink) {
    const auto& usable = m_drawing.m_resources->points.Of(points, count);
    if (usable.size() < 2) return;
    m_graphics->FillPolygon(Use(ink), usable.data(), static_cast<int>(usable.size()),
                            Gdiplus::FillModeAlternate);
}

void DrawingGdiPlus::DrawTarget::FillRectangle(const RectF& r, Ink ink) {
    if (IsUsable(r)) m_graphics->FillRectangle(Use(ink), Convert(r));
}

void DrawingGdiPlus::DrawTarget::OutlineRectangle(const RectF& r, const Stroke& stroke) {
    if (!IsUsable(r) || !IsUsableSize(stroke.width)) return;
    const float width = std::min({stroke.width, r.width / 2.0f, r.height / 2.0f});
    Gdiplus::RectF inner = Convert(r);
    inner.Inflate(-width, -width);
    Gdiplus::GraphicsPath& path = m_drawing.m_resources->path;
    path.Reset();
    path.AddRectangle(Convert(r));
    path.AddRectangle(inner);
    m_graphics->FillPath(Use(stroke.ink), &path);
}

void DrawingGdiPlus::DrawTarget::FillRoundedRectangle(const RectF& r, float radius, Ink ink) {
    if (!IsUsable(r)) return;
    if (!(radius > 0.0f)) return FillRectangle(r, ink);
    const float corner = std::min({2.0f * radius, r.width, r.height});  // the circle's diameter
    const float right = r.x + r.width - corner, bottom = r.y + r.height - corner;
    Gdiplus::GraphicsPath& path = m_drawing.m_resources->path;
    path.Reset();
    path.AddArc(r.x, r.y, corner, corner, 180.0f, 90.0f);
    path.AddArc(right, r.y, corner, corner, 270.0f, 90.0f);
    path.AddArc(right, bottom, corner, corner, 0.0f, 90.0f);
    path.AddArc(r.x, bottom, corner, corner, 90.0f, 90.0f);
    path.CloseFigure();
    m_graphics->FillPath(Use(ink), &path);
}

TextMetrics DrawingGdiPlus::DrawTarget::MeasureText(std::string_view text, float size) {
    if (!IsUsableSize(size)) return {0.0f, 0.0f, 0.0f};
    return m_drawing.m_resources->LaidOut(*m_graphics, text, size).metrics;
}

void DrawingGdiPlus::DrawTarget::Text(std::string_view text, PointF baseline, TextAlign align, float size,
                                      Ink ink) {
    if (!IsUsableSize(size) || !IsUsable(baseline)) return;
    const auto& [wide, metrics] = m_drawing.m_resources->LaidOut(*m_graphics, text, size);
    const TypefaceGdiPlus& typeface = m_drawing.m_resources->typeface;
    const Gdiplus::PointF corner(baseline.x - metrics.width * ShareBefore(align),
                                 baseline.y - typeface.Baseline() * size);
    m_graphics->DrawString(wide.text.data(), wide.length, &m_drawing.m_resources->FontOf(size), corner,
                           typeface.Format(), Use(ink));
}

void DrawingGdiPlus::DrawTarget::Bitmap(const DrawingBitmap& bitmap, const RectF& r, std::uint8_t opacity) {
    if (!IsUsable(bitmap) || !IsUsable(r)) return;
    // Only read from, whatever the signature says.
    auto* const pixels = const_cast<BYTE*>(reinterpret_cast<const BYTE*>(bitmap.pixels.data()));
    Gdiplus::Bitmap image(bitmap.width, bitmap.height, bitmap.width * static_cast<int>(sizeof(std::uint32_t)),
                          bitmap.opaque ? PixelFormat32bppRGB : PixelFormat32bppPARGB, pixels);
    const auto width = static_cast<float>(bitmap.width), height = static_cast<float>(bitmap.height);
    const bool ownSize = r.width == width && r.height == height;
    m_graphics->SetInterpolationMode(ownSize ? Gdiplus::InterpolationModeNearestNeighbor
                                             : Gdiplus::InterpolationModeHighQualityBilinear);
    m_graphics->DrawImage(&image, Convert(r), 0.0f, 0.0f, width, height, Gdiplus::UnitPixel,
                          &m_drawing.m_resources->AttributesOf(opacity));
}

void DrawingGdiPlus::DrawTarget::PushClip(const RectF& r) {
    m_states.push_back(m_graphics->Save());
    m_graphics->SetClip(IsUsable(r) ? Convert(r) : Gdiplus::RectF(), Gdiplus::CombineModeIntersect);
}

void DrawingGdiPlus::DrawTarget::PopClip() {
    if (m_states.size() < 2) return;
    m_graphics->Restore(m_states.back());
    m_states.pop_back();
}

}  // namespace Corvo
