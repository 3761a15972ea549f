#include "Drawing/Backends/CairoBitmaps.h"

#include <algorithm>
#include <cmath>
#include <utility>

namespace Corvo {
namespace {

// Whether the rectangle is width x height pixels of the surface, upright, whatever the context's scale is.
bool CoversPixels(cairo_t* context, const RectF& r, int width, int height) {
    double xScale = 1.0, yScale = 1.0;
    cairo_surface_get_device_scale(cairo_get_group_target(context), &xScale, &yScale);
    const auto leads = [&](double x, double y, int right, int down) {
        constexpr double kSlack = 0.01;  // of a pixel
        cairo_user_to_device_distance(context, &x, &y);
        return std::abs(x * xScale - right) < kSlack && std::abs(y * yScale - down) < kSlack;
    };
    return leads(r.width, 0.0, width, 0) && leads(0.0, r.height, 0, height);
}

// The caller destroys it.
cairo_surface_t* SurfaceOf(const DrawingBitmap& bitmap) {
    // Only read from, whatever the signature says.
    auto* const pixels =
        const_cast<unsigned char*>(reinterpret_cast<const unsigned char*>(bitmap.pixels.data()));
    return cairo_image_surface_create_for_data(
        pixels, bitmap.opaque ? CAIRO_FORMAT_RGB24 : CAIRO_FORMAT_ARGB32, bitmap.width, bitmap.height,
        bitmap.width * static_cast<int>(sizeof(std::uint32_t)));
}

// A surface of pixels, stretched over the rectangle. False when it failed; a failed surface would spoil the
// context for good.
bool Paint(cairo_t* context, cairo_surface_t* surface, const RectF& r, cairo_filter_t filter,
           std::uint8_t opacity) {
    if (cairo_surface_status(surface) != CAIRO_STATUS_SUCCESS) return false;
    const int width = cairo_image_surface_get_width(surface);
    const int height = cairo_image_surface_get_height(surface);
    cairo_save(context);
    cairo_translate(context, r.x, r.y);
    cairo_scale(context, static_cast<double>(r.width) / width, static_cast<double>(r.height) / height);
    cairo_set_source_surface(context, surface, 0.0, 0.0);
    cairo_pattern_set_filter(cairo_get_source(context), filter);
    cairo_pattern_set_extend(cairo_get_source(context), CAIRO_EXTEND_PAD);
    cairo_rectangle(context, 0.0, 0.0, width, height);
    cairo_clip(context);
    cairo_paint_with_alpha(context, opacity / 255.0);
    cairo_restore(context);
    return cairo_status(context) == CAIRO_STATUS_SUCCESS;
}

}  // namespace

void CairoBitmaps::Draw(cairo_t* context, const DrawingBitmap& bitmap, const RectF& r, std::uint8_t opacity,
                        bool onPixels) {
    if (CoversPixels(context, r, bitmap.width, bitmap.height)) {
        cairo_surface_t* const surface = SurfaceOf(bitmap);
        Paint(context, surface, r, CAIRO_FILTER_NEAREST, opacity);
        cairo_surface_destroy(surface);
        return;
    }
    if (cairo_surface_t* const kept = onPixels ? Copy(bitmap, r) : nullptr) {
        Paint(context, kept, r, CAIRO_FILTER_NEAREST, opacity);
        return;
    }
    cairo_surface_t* const surface = SurfaceOf(bitmap);
    Paint(context, surface, r, CAIRO_FILTER_GOOD, opacity);
    cairo_surface_destroy(surface);
}

// A copy of the bitmap that has the rectangle's size, made when one state of it is drawn a second time; null
// the first time, where it would not lie on whole pixels, and when there is no memory for it.
cairo_surface_t* CairoBitmaps::Copy(const DrawingBitmap& bitmap, const RectF& r) {
    constexpr float kMostPixels = 1 << 20;
    const auto whole = [](float value) { return value == std::floor(value); };
    if (bitmap.version == 0 || !whole(r.x) || !whole(r.y) || !whole(r.width) || !whole(r.height) ||
        r.width * r.height > kMostPixels)
        return nullptr;
    Stretched wanted{bitmap.pixels.data(), bitmap.version, static_cast<int>(r.width),
                     static_cast<int>(r.height)};
    const auto known =
        std::ranges::find_if(m_stretched, [&](const Stretched& kept) { return kept.IsSame(wanted); });
    if (known == m_stretched.end()) {
        Keep(std::move(wanted));
        return nullptr;
    }
    wanted.copy = std::move(known->copy);
    m_stretched.erase(known);
    if (!wanted.copy) {
        cairo_surface_t* const surface = SurfaceOf(bitmap);
        wanted.copy.reset(
            cairo_image_surface_create(cairo_image_surface_get_format(surface), wanted.width, wanted.height));
        cairo_t* const context = cairo_create(wanted.copy.get());
        if (!Paint(context, surface, {0.0f, 0.0f, r.width, r.height}, CAIRO_FILTER_GOOD, 255))
            wanted.copy.reset();
        cairo_destroy(context);
        cairo_surface_destroy(surface);
    }
    Keep(std::move(wanted));
    return m_stretched.back().copy.get();
}

// Those used longest ago make room.
void CairoBitmaps::Keep(Stretched added) {
    constexpr std::size_t kMost = 64, kMostBytes = 16 << 20;  // a tuner has up to 18 images
    m_stretched.push_back(std::move(added));
    std::size_t bytes = 0;
    for (const Stretched& kept : m_stretched) bytes += kept.Bytes();
    while (m_stretched.size() > kMost || bytes > kMostBytes) {
        bytes -= m_stretched.front().Bytes();
        m_stretched.erase(m_stretched.begin());
    }
}

}  // namespace Corvo
