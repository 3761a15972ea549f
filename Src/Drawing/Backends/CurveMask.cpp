#include "Drawing/Backends/CurveMask.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <limits>

namespace Corvo {
namespace {

constexpr int kCuts = 8;  // of a pixel's width
constexpr int kShares[kCuts] = {32, 32, 32, 32, 32, 32, 32, 31};
constexpr float kNone = std::numeric_limits<float>::max();

struct Range {
    int first, end;
};

// The cuts within `radius` of a stretch of the x axis.
Range CutsWithin(float from, float to, float radius, int left, std::size_t cuts) {
    const auto cut = [&](float x) { return (x - static_cast<float>(left)) * kCuts - 0.5f; };
    const float most = static_cast<float>(cuts);
    return {static_cast<int>(std::clamp(std::ceil(cut(from - radius)), 0.0f, most)),
            static_cast<int>(std::clamp(std::floor(cut(to + radius)) + 1.0f, 0.0f, most))};
}

}  // namespace

bool CurveMask::IsCurve(const PointF* points, int count) {
    for (int i = 1; i < count; ++i)
        if (!(points[i].x >= points[i - 1].x)) return false;
    return count >= 2;
}

void CurveMask::AddDisc(PointF centre, float radius) {
    const Range cuts = CutsWithin(centre.x, centre.x, radius, m_left, m_stretches.size());
    for (int i = cuts.first; i < cuts.end; ++i) {
        const float away = static_cast<float>(m_left) + (static_cast<float>(i) + 0.5f) / kCuts - centre.x;
        const float half = std::sqrt(std::max(radius * radius - away * away, 0.0f));
        Stretch& stretch = m_stretches[static_cast<std::size_t>(i)];
        stretch.top = std::min(stretch.top, centre.y - half);
        stretch.bottom = std::max(stretch.bottom, centre.y + half);
    }
}

// A disc's edge touches the lines parallel to the segment beside its middle: there its two sides are, as far
// as the segment reaches.
void CurveMask::AddSegment(PointF from, PointF to, float radius) {
    const float run = to.x - from.x;
    if (run <= 0.0f) return;
    const float slope = (to.y - from.y) / run, root = std::sqrt(1.0f + slope * slope);
    const float shift = radius * slope / root, half = radius * root;
    const Range cuts = CutsWithin(from.x, to.x, std::abs(shift), m_left, m_stretches.size());
    for (int i = cuts.first; i < cuts.end; ++i) {
        const float x = static_cast<float>(m_left) + (static_cast<float>(i) + 0.5f) / kCuts;
        const float y = from.y + slope * (x - from.x);
        Stretch& stretch = m_stretches[static_cast<std::size_t>(i)];
        if (x + shift >= from.x && x + shift <= to.x) stretch.bottom = std::max(stretch.bottom, y + half);
        if (x - shift >= from.x && x - shift <= to.x) stretch.top = std::min(stretch.top, y - half);
    }
}

void CurveMask::FillColumn(int column) {
    for (int cut = 0; cut < kCuts; ++cut) {
        const Stretch& stretch = m_stretches[static_cast<std::size_t>(column * kCuts + cut)];
        const float first = std::max(stretch.top - static_cast<float>(m_top), 0.0f);
        const float end = std::min(stretch.bottom - static_cast<float>(m_top), static_cast<float>(m_height));
        if (!(first < end)) continue;
        const auto add = [&](int row, float part) {
            std::uint8_t& pixel = m_pixels[static_cast<std::size_t>(row * m_stride + column)];
            pixel = static_cast<std::uint8_t>(
                pixel + static_cast<int>(part * static_cast<float>(kShares[cut]) + 0.5f));
        };
        const int top = static_cast<int>(first), bottom = std::min(static_cast<int>(end), m_height - 1);
        if (top == bottom) {
            add(top, end - first);
            continue;
        }
        add(top, static_cast<float>(top + 1) - first);
        std::uint8_t* pixel = m_pixels.data() + static_cast<std::ptrdiff_t>((top + 1) * m_stride + column);
        for (int row = top + 1; row < bottom; ++row, pixel += m_stride)
            *pixel = static_cast<std::uint8_t>(*pixel + kShares[cut]);
        add(bottom, end - static_cast<float>(bottom));
    }
}

bool CurveMask::Draw(const PointF* points, int count, float width, const RectF& within) {
    const float radius = width / 2.0f;
    float lowest = -kNone, highest = kNone;
    for (int i = 0; i < count; ++i) {
        highest = std::min(highest, points[i].y);
        lowest = std::max(lowest, points[i].y);
    }
    m_left = static_cast<int>(std::max(std::floor(points[0].x - radius), within.x));
    m_top = static_cast<int>(std::max(std::floor(highest - radius), within.y));
    m_width =
        static_cast<int>(std::min(std::ceil(points[count - 1].x + radius), within.x + within.width)) - m_left;
    m_height = static_cast<int>(std::min(std::ceil(lowest + radius), within.y + within.height)) - m_top;
    if (m_width < 1 || m_height < 1) return false;
    m_stride = (m_width + 3) / 4 * 4;
    m_stretches.assign(static_cast<std::size_t>(m_width * kCuts), {kNone, -kNone});
    m_pixels.assign(static_cast<std::size_t>(m_stride) * static_cast<std::size_t>(m_height), 0);
    for (int i = 0; i < count; ++i) {
        AddDisc(points[i], radius);
        if (i > 0) AddSegment(points[i - 1], points[i], radius);
    }
    for (int column = 0; column < m_width; ++column) FillColumn(column);
    return true;
}

}  // namespace Corvo
