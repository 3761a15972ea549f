#include "Drawing/Backends/CurveMask.h"

#include <algorithm>
#include <cmath>
#include <limits>

namespace Corvo {
namespace {

constexpr int kCuts = 8;  // of a pixel's width
constexpr int kShares[kCuts] = {32, 32, 32, 32, 32, 32, 32, 31};
constexpr int kStrip = 64;  // columns; the pixels of a strip stay in the first cache
constexpr float kNone = std::numeric_limits<float>::max();

float MiddleOf(int cut) { return (static_cast<float>(cut) + 0.5f) / kCuts; }

struct Extremes {
    float least = kNone, most = -kNone;
};
Extremes ExtremesOf(const float* values, int count) {
    Extremes extremes;
    for (int i = 0; i < count; ++i) {
        extremes.least = std::min(extremes.least, values[i]);
        extremes.most = std::max(extremes.most, values[i]);
    }
    return extremes;
}

}  // namespace

bool CurveMask::IsCurve(const PointF* points, int count) {
    for (int i = 1; i < count; ++i)
        if (!(points[i].x >= points[i - 1].x)) return false;
    return count >= 2;
}

// Those whose middles lie there.
inline CurveMask::Range CurveMask::CutsBetween(float from, float to) const {
    const int cuts = m_width * kCuts;
    const float most = static_cast<float>(cuts);
    const auto cut = [&](float x) { return (x - static_cast<float>(m_left)) * kCuts - 0.5f; };
    const float first = std::clamp(cut(from), 0.0f, most), last = std::clamp(cut(to), -1.0f, most);
    const int whole = static_cast<int>(first);
    return {whole + (static_cast<float>(whole) < first ? 1 : 0),
            std::min(static_cast<int>(last + 1.0f), cuts)};
}

void CurveMask::AddDisc(PointF centre, float radius) {
    const Range cuts = CutsBetween(centre.x - radius, centre.x + radius);
    if (cuts.first >= cuts.end) return;
    const int count = cuts.end - cuts.first;
    const float x = centre.x - static_cast<float>(m_left);
    const float from = MiddleOf(cuts.first) - x;
    // Points in the middles of pixels, as most are, have the same disc.
    if (static_cast<int>(m_halves.size()) < count || from != m_halvesFrom) {
        m_halvesFrom = from;
        m_halves.clear();
        for (int cut = cuts.first; cut < cuts.end; ++cut) {
            const float away = MiddleOf(cut) - x;
            m_halves.push_back(std::sqrt(std::max(radius * radius - away * away, 0.0f)));
        }
    }
    float* const tops = m_tops.data() + cuts.first;
    float* const bottoms = m_bottoms.data() + cuts.first;
    const float* const halves = m_halves.data();
    for (int i = 0; i < count; ++i) tops[i] = std::min(tops[i], centre.y - halves[i]);
    for (int i = 0; i < count; ++i) bottoms[i] = std::max(bottoms[i], centre.y + halves[i]);
}

// A disc's edge touches the lines parallel to the segment beside its middle: there its two sides are, as far
// as the segment reaches.
void CurveMask::AddSegment(PointF from, PointF to, float radius) {
    const float run = to.x - from.x;
    if (run <= 0.0f) return;
    const float slope = (to.y - from.y) / run, root = std::sqrt(1.0f + slope * slope);
    if (!std::isfinite(root)) return;  // too steep to have a width
    const float shift = radius * slope / root, half = radius * root;
    const float x = from.x - static_cast<float>(m_left);
    const auto heightAt = [&](int cut) { return from.y + slope * (MiddleOf(cut) - x); };
    float* const tops = m_tops.data();
    float* const bottoms = m_bottoms.data();
    const Range lower = CutsBetween(from.x - shift, to.x - shift);
    for (int i = lower.first; i < lower.end; ++i) bottoms[i] = std::max(bottoms[i], heightAt(i) + half);
    const Range upper = CutsBetween(from.x + shift, to.x + shift);
    for (int i = upper.first; i < upper.end; ++i) tops[i] = std::min(tops[i], heightAt(i) - half);
}

bool CurveMask::Reach(float left, float right, const RectF& within) {
    m_left = static_cast<int>(std::max(std::floor(left), within.x));
    m_top = static_cast<int>(within.y);
    m_width = static_cast<int>(std::min(std::ceil(right), within.x + within.width)) - m_left;
    m_height = static_cast<int>(within.height);
    m_next = 0;
    if (m_width < 1 || m_height < 1) m_width = 0;
    m_tops.assign(static_cast<std::size_t>(m_width * kCuts), kNone);
    m_bottoms.assign(m_tops.size(), -kNone);
    return m_width > 0;
}

void CurveMask::Line(const PointF* points, int count, float width, const RectF& within) {
    const float radius = width / 2.0f;
    if (!Reach(points[0].x - radius, points[count - 1].x + radius, within)) return;
    m_halves.clear();
    for (int i = 0; i < count; ++i) {
        AddDisc(points[i], radius);
        if (i > 0) AddSegment(points[i - 1], points[i], radius);
    }
}

void CurveMask::Area(const PointF* points, int count, float ground, const RectF& within) {
    if (!Reach(points[0].x, points[count - 1].x, within)) return;
    for (int i = 1; i < count; ++i) AddSegment(points[i - 1], points[i], 0.0f);
    for (std::size_t cut = 0; cut < m_tops.size(); ++cut)
        if (m_tops[cut] < ground) m_bottoms[cut] = ground;
}

// Adds what a column's pixels have more than those above them, so that few are touched however steep the line
// is.
void CurveMask::AddColumn(int column, int top, int height, std::uint8_t* pixel) const {
    const auto limit = static_cast<float>(height), above = static_cast<float>(top);
    const auto add = [pixel](int row, int level) {
        std::uint8_t& changed = pixel[row * kStrip];
        changed = static_cast<std::uint8_t>(changed + level);
    };
    const float* const tops = m_tops.data() + column * kCuts;
    const float* const bottoms = m_bottoms.data() + column * kCuts;
    for (int cut = 0; cut < kCuts; ++cut) {
        const float first = std::max(tops[cut] - above, 0.0f);
        const float end = std::min(bottoms[cut] - above, limit);
        if (!(first < end)) continue;
        const int share = kShares[cut];
        const auto part = [share](float covered) {
            return static_cast<int>(covered * static_cast<float>(share) + 0.5f);
        };
        const int firstRow = static_cast<int>(first), lastRow = std::min(static_cast<int>(end), height - 1);
        const bool within = firstRow == lastRow;
        const int begins = part((within ? end : static_cast<float>(firstRow + 1)) - first);
        const int ends = within ? begins : part(end - static_cast<float>(lastRow));
        const int full = within ? begins : share;
        add(firstRow, begins);
        add(firstRow + 1, full - begins);
        add(lastRow, ends - full);
        add(lastRow + 1, -ends);
    }
}

bool CurveMask::Next(Strip& strip) {
    while (m_next < m_width) {
        const int left = m_next, width = std::min(m_width - left, kStrip);
        m_next += width;
        const Extremes tops = ExtremesOf(m_tops.data() + left * kCuts, width * kCuts);
        const Extremes bottoms = ExtremesOf(m_bottoms.data() + left * kCuts, width * kCuts);
        const auto edge = [this](float y) {
            return static_cast<int>(
                std::clamp(y, static_cast<float>(m_top), static_cast<float>(m_top + m_height)));
        };
        const int top = edge(std::floor(tops.least)), bottom = edge(std::ceil(bottoms.most));
        if (bottom <= top) continue;
        const bool level = edge(bottoms.least) == bottom;
        const int solidFrom = level ? std::min(edge(std::ceil(tops.most)), bottom) : bottom;
        const int height = solidFrom - top;
        constexpr auto kStride = static_cast<std::size_t>(kStrip);
        m_pixels.assign(kStride * (static_cast<std::size_t>(height) + 1), 0);
        for (int column = 0; column < width; ++column)
            AddColumn(left + column, top, height, m_pixels.data() + column);
        std::uint8_t* row = m_pixels.data();
        for (int y = 1; y < height; ++y, row += kStride)
            for (std::size_t x = 0; x < kStride; ++x)
                row[kStride + x] = static_cast<std::uint8_t>(row[kStride + x] + row[x]);
        strip = {m_left + left, top, width, height, kStrip, bottom - solidFrom, m_pixels.data()};
        return true;
    }
    return false;
}

}  // namespace Corvo
