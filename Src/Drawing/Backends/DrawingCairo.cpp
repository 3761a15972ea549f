#include "Drawing/Backends/DrawingCairo.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <mutex>
#include <numbers>
#include <string>
#include <utility>
#include <vector>

#include <fontconfig/fontconfig.h>
#include <pango/pangocairo.h>

#include "Drawing/Backends/CairoBitmaps.h"
#include "Drawing/Backends/CurveMask.h"
#include "Drawing/Backends/ResourceKeys.h"
#include "Drawing/Backends/SlotCache.h"
#include "Drawing/DrawingFont.h"
#include "Drawing/PrimitiveArguments.h"
#include "Platform/CriticalSection.h"

namespace Corvo {
namespace {

struct LaidOutText {
    PangoLayout* layout = nullptr;
    TextMetrics metrics{};
};

// What a pen's handle stands for.
struct CairoPen {
    cairo_pattern_t* pattern;
    float width;
};

// The file joins those that the program knows; once for each file, or every back-end made would add it again.
void AddFontFile() {
    static CriticalSection lock;
    static std::vector<std::string> added;
    const std::string file = DrawingFont::GetFile();
    const std::lock_guard guard(lock);
    if (file.empty() || std::ranges::find(added, file) != added.end()) return;
    if (FcConfigAppFontAddFile(nullptr, reinterpret_cast<const FcChar8*>(file.c_str())))
        added.push_back(file);
}

PangoContext* MakeTextContext() {
    AddFontFile();
    PangoFontMap* const fonts = pango_cairo_font_map_new();
    PangoContext* const context = pango_font_map_create_context(fonts);
    g_object_unref(fonts);
    // Letters keep their shapes and distances at every resolution.
    cairo_font_options_t* const options = cairo_font_options_create();
    cairo_font_options_set_antialias(options, CAIRO_ANTIALIAS_GRAY);
    cairo_font_options_set_hint_style(options, CAIRO_HINT_STYLE_NONE);
    cairo_font_options_set_hint_metrics(options, CAIRO_HINT_METRICS_OFF);
    pango_cairo_context_set_font_options(context, options);
    cairo_font_options_destroy(options);
    pango_context_set_round_glyph_positions(context, FALSE);
    return context;
}

// Appends the points to the path; false without a line to draw.
bool AddPath(cairo_t* context, const PointF* points, int count) {
    int added = 0;
    for (int i = 0; i < count; ++i) {
        if (!IsUsable(points[i])) continue;
        cairo_line_to(context, points[i].x, points[i].y);
        ++added;
    }
    if (added < 2) cairo_new_path(context);
    return added >= 2;
}

// Whether they are a curve with about a point in every pixel, all of which can be drawn.
bool HasManyPoints(const PointF* points, int count) {
    constexpr int kFewPoints = 64;
    constexpr float kSparse = 3.0f;  // pixels between points
    if (count < kFewPoints || !IsUsable(points[0]) || !IsUsable(points[count - 1]) ||
        points[count - 1].x - points[0].x > kSparse * static_cast<float>(count))
        return false;
    for (int i = 0; i < count; ++i)
        if (!IsUsable(points[i])) return false;
    return CurveMask::IsCurve(points, count);
}

// The part of a surface of pixels that drawing can reach, in the context's coordinates; nothing where these
// are no pixels, or the surface has none.
bool ReachablePixels(cairo_t* context, RectF& reach) {
    cairo_surface_t* const surface = cairo_get_group_target(context);
    if (cairo_surface_get_type(surface) != CAIRO_SURFACE_TYPE_IMAGE) return false;
    double xScale = 1.0, yScale = 1.0, xOffset = 0.0, yOffset = 0.0;
    cairo_surface_get_device_scale(surface, &xScale, &yScale);
    cairo_surface_get_device_offset(surface, &xOffset, &yOffset);
    cairo_matrix_t matrix;
    cairo_get_matrix(context, &matrix);
    const auto whole = [](double value) { return value == std::floor(value); };
    if (xScale != 1.0 || yScale != 1.0 || matrix.xx != 1.0 || matrix.yy != 1.0 || matrix.xy != 0.0 ||
        matrix.yx != 0.0 || !whole(matrix.x0 + xOffset) || !whole(matrix.y0 + yOffset))
        return false;
    double left = 0.0, top = 0.0, right = 0.0, bottom = 0.0;
    cairo_clip_extents(context, &left, &top, &right, &bottom);
    reach = {static_cast<float>(std::floor(left)), static_cast<float>(std::floor(top)),
             static_cast<float>(std::ceil(right) - std::floor(left)),
             static_cast<float>(std::ceil(bottom) - std::floor(top))};
    return true;
}

}  // namespace

struct DrawingCairo::Resources {
    SlotCache<InkKey, DrawingBrush, kKeptInks> brushes;
    SlotCache<StrokeKey, DrawingPen*, kKeptStrokes> pens;
    SlotCache<TextKey, LaidOutText, kKeptTexts> texts;
    CairoBitmaps bitmaps;
    CurveMask curve;
    PangoContext* textContext = MakeTextContext();
    PangoFontDescription* font = pango_font_description_from_string("Montserrat, Sans");

    bool FillUnderCurve(cairo_t* context, const PointF* points, int count);
    void Compose(cairo_t* context);

    const LaidOutText& LaidOut(std::string_view text, float size) {
        const TextKey key(text, size);
        return texts.Find(
            key, [&] { return LayOut(key.text.data(), size); },
            [](LaidOutText& old) { g_object_unref(old.layout); });
    }

    LaidOutText LayOut(const char* text, float size) {
        PangoLayout* const layout = pango_layout_new(textContext);
        pango_font_description_set_absolute_size(font, static_cast<double>(size) * PANGO_SCALE);
        pango_layout_set_font_description(layout, font);
        pango_layout_set_single_paragraph_mode(layout, TRUE);
        pango_layout_set_text(layout, text, -1);
        PangoRectangle logical;
        pango_layout_get_extents(layout, nullptr, &logical);
        const int ascent = pango_layout_get_baseline(layout);
        const auto pixels = [](int units) { return static_cast<float>(units) / PANGO_SCALE; };
        return {layout, {pixels(logical.width), pixels(ascent), pixels(logical.height - ascent)}};
    }
};

DrawingCairo::DrawingCairo() : m_resources(std::make_unique<Resources>()) {}

DrawingCairo::~DrawingCairo() {
    m_resources->brushes.Clear([this](DrawingBrush brush) { ReleaseBrush(brush); });
    m_resources->pens.Clear([this](DrawingPen* pen) { ReleasePen(pen); });
    m_resources->texts.Clear([](LaidOutText& text) { g_object_unref(text.layout); });
    pango_font_description_free(m_resources->font);
    g_object_unref(m_resources->textContext);
}

DrawingBrush DrawingCairo::CreateSolidBrush(ColourReference colour, std::uint8_t opacity) {
    const auto share = [](std::uint8_t part) { return part / 255.0; };
    return {cairo_pattern_create_rgba(share(RedOf(colour)), share(GreenOf(colour)), share(BlueOf(colour)),
                                      share(opacity))};
}

void DrawingCairo::ReleaseBrush(DrawingBrush brush) {
    if (brush.object) cairo_pattern_destroy(static_cast<cairo_pattern_t*>(brush.object));
}

DrawingPen* DrawingCairo::CreatePen(const Stroke& stroke) {
    const DrawingBrush brush = CreateSolidBrush(stroke.ink.colour, stroke.ink.opacity);
    return new DrawingPen{new CairoPen{static_cast<cairo_pattern_t*>(brush.object), stroke.width}};
}

void DrawingCairo::ReleasePen(DrawingPen*& pen) {
    if (!pen) return;
    auto* const object = static_cast<CairoPen*>(pen->object);
    ReleaseBrush({object->pattern});
    delete object;
    delete pen;
    pen = nullptr;
}

DrawingCairo::DrawTarget::DrawTarget(DrawingCairo& drawing, cairo_t* context, float dpi)
    : Corvo::DrawTarget(dpi), m_drawing(drawing), m_context(cairo_reference(context)) {
    cairo_save(m_context);
    cairo_new_path(m_context);
    cairo_set_line_join(m_context, CAIRO_LINE_JOIN_ROUND);
    cairo_set_line_cap(m_context, CAIRO_LINE_CAP_ROUND);
    cairo_set_fill_rule(m_context, CAIRO_FILL_RULE_EVEN_ODD);
}

DrawingCairo::DrawTarget::~DrawTarget() {
    while (m_clips > 0) PopClip();
    cairo_restore(m_context);
    cairo_destroy(m_context);
}

void DrawingCairo::DrawTarget::Use(Ink ink) {
    const DrawingBrush brush = m_drawing.m_resources->brushes.Find(
        {ink}, [&] { return m_drawing.CreateSolidBrush(ink.colour, ink.opacity); },
        [&](DrawingBrush old) { m_drawing.ReleaseBrush(old); });
    cairo_set_source(m_context, static_cast<cairo_pattern_t*>(brush.object));
}

// False for a line of no width.
bool DrawingCairo::DrawTarget::Use(const Stroke& stroke) {
    if (!IsUsableSize(stroke.width)) return false;
    const DrawingPen* const pen = m_drawing.m_resources->pens.Find(
        {{stroke.ink}, stroke.width}, [&] { return m_drawing.CreatePen(stroke); },
        [&](DrawingPen* old) { m_drawing.ReleasePen(old); });
    const auto& object = *static_cast<const CairoPen*>(pen->object);
    cairo_set_source(m_context, object.pattern);
    cairo_set_line_width(m_context, object.width);
    return true;
}

void DrawingCairo::DrawTarget::Clear(ColourReference colour) {
    Use(Ink{colour});
    cairo_paint(m_context);
}

void DrawingCairo::DrawTarget::Polyline(const PointF* points, int count, const Stroke& stroke) {
    if (!Use(stroke)) return;
    if (DrawCurve(points, count, stroke.width)) return;
    if (AddPath(m_context, points, count)) cairo_stroke(m_context);
}

// A curve with many points, on pixels; false for everything else.
bool DrawingCairo::DrawTarget::DrawCurve(const PointF* points, int count, float width) {
    RectF reach;
    if (!HasManyPoints(points, count) || !ReachablePixels(m_context, reach)) return false;
    m_drawing.m_resources->curve.Line(points, count, width, reach);
    m_drawing.m_resources->Compose(m_context);
    return true;
}

// What such a curve and a level line below it enclose.
inline bool DrawingCairo::Resources::FillUnderCurve(cairo_t* context, const PointF* points, int count) {
    RectF reach;
    const int last = count - 3;
    if (!HasManyPoints(points, last + 1)) return false;
    const PointF right = points[count - 2], left = points[count - 1];
    if (right.x != points[last].x || left.x != points[0].x || left.y != right.y || !IsUsable(left))
        return false;
    for (int i = 0; i <= last; ++i)
        if (points[i].y > left.y) return false;
    if (!ReachablePixels(context, reach)) return false;
    curve.Area(points, last + 1, left.y, reach);
    Compose(context);
    return true;
}

// What the mask holds, in the present colour.
inline void DrawingCairo::Resources::Compose(cairo_t* context) {
    for (CurveMask::Strip strip; curve.Next(strip);) {
        if (strip.solid > 0)
            cairo_rectangle(context, strip.left, strip.top + strip.height, strip.width, strip.solid);
        if (strip.height < 1) continue;
        cairo_surface_t* const mask = cairo_image_surface_create_for_data(
            strip.pixels, CAIRO_FORMAT_A8, strip.width, strip.height, strip.stride);
        cairo_mask_surface(context, mask, strip.left, strip.top);
        cairo_surface_destroy(mask);
    }
    cairo_fill(context);
}

void DrawingCairo::DrawTarget::FillPolygon(const PointF* points, int count, Ink ink) {
    Use(ink);
    if (m_drawing.m_resources->FillUnderCurve(m_context, points, count) || !AddPath(m_context, points, count))
        return;
    cairo_close_path(m_context);
    cairo_fill(m_context);
}

void DrawingCairo::DrawTarget::FillRectangle(const RectF& r, Ink ink) {
    if (!IsUsable(r)) return;
    Use(ink);
    cairo_rectangle(m_context, r.x, r.y, r.width, r.height);
    cairo_fill(m_context);
}

void DrawingCairo::DrawTarget::OutlineRectangle(const RectF& r, const Stroke& stroke) {
    if (!IsUsable(r) || !IsUsableSize(stroke.width)) return;
    const float width = std::min({stroke.width, r.width / 2.0f, r.height / 2.0f});
    Use(Stroke{stroke.ink, width});
    cairo_set_line_join(m_context, CAIRO_LINE_JOIN_MITER);
    cairo_rectangle(m_context, r.x + width / 2.0f, r.y + width / 2.0f, r.width - width, r.height - width);
    cairo_stroke(m_context);
    cairo_set_line_join(m_context, CAIRO_LINE_JOIN_ROUND);
}

void DrawingCairo::DrawTarget::FillRoundedRectangle(const RectF& r, float radius, Ink ink) {
    if (!IsUsable(r)) return;
    Use(ink);
    constexpr double kQuarter = std::numbers::pi / 2.0;
    const double corner = std::clamp(radius > 0.0f ? radius : 0.0f, 0.0f, std::min(r.width, r.height) / 2.0f);
    const double left = r.x + corner, top = r.y + corner;
    const double right = r.x + r.width - corner, bottom = r.y + r.height - corner;
    cairo_arc(m_context, left, top, corner, 2.0 * kQuarter, 3.0 * kQuarter);
    cairo_arc(m_context, right, top, corner, 3.0 * kQuarter, 4.0 * kQuarter);
    cairo_arc(m_context, right, bottom, corner, 0.0, kQuarter);
    cairo_arc(m_context, left, bottom, corner, kQuarter, 2.0 * kQuarter);
    cairo_close_path(m_context);
    cairo_fill(m_context);
}

TextMetrics DrawingCairo::DrawTarget::MeasureText(std::string_view text, float size) {
    if (!IsUsableSize(size)) return {0.0f, 0.0f, 0.0f};
    return m_drawing.m_resources->LaidOut(text, size).metrics;
}

void DrawingCairo::DrawTarget::Text(std::string_view text, PointF baseline, TextAlign align, float size,
                                    Ink ink) {
    if (!IsUsableSize(size) || !IsUsable(baseline)) return;
    const LaidOutText& laidOut = m_drawing.m_resources->LaidOut(text, size);
    Use(ink);
    cairo_move_to(m_context, baseline.x - laidOut.metrics.width * ShareBefore(align), baseline.y);
    pango_cairo_show_layout_line(m_context, pango_layout_get_line_readonly(laidOut.layout, 0));
    cairo_new_path(m_context);
}

void DrawingCairo::DrawTarget::Bitmap(const DrawingBitmap& bitmap, const RectF& r, std::uint8_t opacity) {
    if (!IsUsable(bitmap) || !IsUsable(r)) return;
    RectF reach;
    m_drawing.m_resources->bitmaps.Draw(m_context, bitmap, r, opacity, ReachablePixels(m_context, reach));
}

void DrawingCairo::DrawTarget::PushClip(const RectF& r) {
    cairo_save(m_context);
    ++m_clips;
    if (IsUsable(r))
        cairo_rectangle(m_context, r.x, r.y, r.width, r.height);
    else
        cairo_rectangle(m_context, 0.0, 0.0, 0.0, 0.0);
    cairo_clip(m_context);
}

void DrawingCairo::DrawTarget::PopClip() {
    if (m_clips == 0) return;
    --m_clips;
    cairo_restore(m_context);
}

}  // namespace Corvo
