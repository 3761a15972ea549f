#include "DSP/Effects/Compressor/CompressorGlide.h"

#include <algorithm>
#include <cmath>
#include <limits>

namespace Corvo::DSP::CompressorPrivate {
namespace {

constexpr double kBeyond = 2.0;  // where no curve has a point

struct Spot {
    double x, y;
};

// What is at a place of a curve, see GlidingCurve::place.
Spot SpotAt(const TransferCurve& curve, double place) {
    const double whole = std::floor(place), part = place - whole;
    const auto& from = curve.points[static_cast<std::size_t>(whole)];
    if (part == 0.0) return {from.x, from.y};
    const auto& to = curve.points[static_cast<std::size_t>(whole) + 1];
    return {from.x + part * (static_cast<double>(to.x) - from.x),
            from.y + part * (static_cast<double>(to.y) - from.y)};
}

// Whether moving its points makes one curve of the other: as many, and the threshold at the same one. With
// the threshold at another point, knees and straight lines would turn into each other on the way, and be
// heard.
bool HaveSamePoints(const TransferCurve& a, const TransferCurve& b) {
    return a.count == b.count && a.Threshold() - a.begin() == b.Threshold() - b.begin();
}

// The place of an input level that is at the point `next`, or between it and the one before.
double PlaceOf(double level, const TransferCurve& curve, std::size_t next) {
    const auto count = static_cast<std::size_t>(curve.count);
    if (next == count) return static_cast<double>(count - 1);
    const double to = curve.points[next].x;
    if (level == to) return static_cast<double>(next);
    const double from = curve.points[next - 1].x;
    return static_cast<double>(next - 1) + (level - from) / (to - from);
}

}  // namespace

KeptCurves& KeptCurves::operator=(const KeptCurves& from) {
    count = from.count;
    reserved = from.reserved;
    last_threshold = from.last_threshold;
    last_ratio_step = from.last_ratio_step;
    std::copy_n(from.points.begin(), count[0] + count[1], points.begin());
    return *this;
}

KeptCurves& KeptCurves::operator=(const CompMapStereo& from) {
    auto to = points.begin();
    for (std::size_t channel = 0; channel < 2; ++channel) {
        count[channel] = from.m_comp_map[channel].count;
        to = std::copy_n(from.m_comp_map[channel].points.begin(), count[channel], to);
    }
    reserved = from.reserved;
    last_threshold = from.last_threshold;
    last_ratio_step = from.last_ratio_step;
    return *this;
}

CompMapStereo KeptCurves::Map() const {
    CompMapStereo map;
    for (std::size_t channel = 0; channel < 2; ++channel) {
        map.m_comp_map[channel].count = count[channel];
        std::ranges::copy(Curve(channel), map.m_comp_map[channel].points.begin());
    }
    map.reserved = reserved;
    map.last_threshold = last_threshold;
    map.last_ratio_step = last_ratio_step;
    return map;
}

bool KeptCurves::HasPointsOf(const KeptCurves& other) const {
    return count == other.count &&
           std::equal(points.begin(), points.begin() + count[0] + count[1], other.points.begin(),
                      [](const CurvePoint& a, const CurvePoint& b) { return a.x == b.x && a.y == b.y; });
}

int GlidingCurve::SegmentAt(double level, double factor) const {
    int i = 0;
    while (i < count - 2 && level > X(i + 1, factor)) ++i;
    return i;
}

void HeardCurve::Add(double level, double output) {
    x[count] = level;
    y[count++] = output;
}

double HeardCurve::LevelAt(double level, std::size_t next) const {
    if (next == count) return y[count - 1];
    if (level == x[next]) return y[next];
    const double from = x[next - 1];
    return y[next - 1] + (level - from) * (y[next] - y[next - 1]) / (x[next] - from);
}

void HeardCurve::Thin(std::size_t most) {
    constexpr double kFinest = 1e-6, kCoarsest = 0.011;  // of the level; the coarsest allows 0.09 dB
    for (double tolerance = kFinest; count > most && tolerance < kCoarsest; tolerance *= 10.0)
        DropWithin(tolerance);
    while (count > most) {
        const std::size_t last = count - 1;
        std::size_t kept = 0;
        for (std::size_t i = 0; i < last; i += 2) Move(i, kept++);
        Move(last, kept++);
        count = kept;
    }
}

// Keeps, after each point that stays, the farthest one whose line to it passes all between within the
// tolerance.
void HeardCurve::DropWithin(double tolerance) {
    constexpr double kAny = std::numeric_limits<double>::infinity();
    const std::size_t last = count - 1;
    std::size_t from = 0, kept = 1;
    double low = -kAny, high = kAny;
    for (std::size_t i = 1; i <= last; ++i) {
        const auto slopeTo = [&](double level) { return (level - y[kept - 1]) / (x[i] - x[kept - 1]); };
        if (x[i] > x[kept - 1] && slopeTo(y[i]) >= low && slopeTo(y[i]) <= high) {
            low = std::max(low, slopeTo(y[i] * (1.0 - tolerance)));
            high = std::min(high, slopeTo(y[i] * (1.0 + tolerance)));
            continue;
        }
        // The point before stays, or this one, if it stands over the one that stayed last.
        i = from = std::max(from + 1, i - 1);
        Move(from, kept++);
        low = -kAny;
        high = kAny;
    }
    if (from < last) Move(last, kept++);
    count = kept;
}

void HeardCurve::Move(std::size_t from, std::size_t to) {
    x[to] = x[from];
    y[to] = y[from];
}

int GlideFrames(double factor, double smoothing) {
    constexpr double kEnd = 1e-14;
    if (!(factor > kEnd)) return 0;
    if (!(smoothing < 1.0)) return 1;
    return static_cast<int>(std::min(std::ceil(std::log(kEnd / factor) / std::log1p(-smoothing)), 1e9));
}

bool GlidingMap::SetOutFor(const KeptCurves& wanted, double smoothing) {
    if (m_target.HasPointsOf(wanted)) return false;
    const CompMapStereo before = m_target.Map(), after = wanted.Map();
    m_target = wanted;
    bool otherPoints = false;
    for (std::size_t channel = 0; channel < 2; ++channel) {
        auto& curve = m_comp_map[channel];
        const auto& target = after.m_comp_map[channel];
        m_heard.count = 0;
        for (int i = 0; i < curve.count; ++i) m_heard.Add(curve.X(i, factor), curve.Y(i, factor));
        if (HaveSamePoints(before.m_comp_map[channel], target)) {
            MoveTargets(curve, target);
        } else {
            MergePoints(curve, target);
            otherPoints = true;
        }
    }
    factor = 1.0;
    framesLeft = GlideFrames(factor, smoothing);
    return otherPoints;
}

void GlidingMap::MoveTargets(GlidingCurve& curve, const TransferCurve& target) {
    for (std::size_t i = 0; i < m_heard.count; ++i) {
        const Spot spot = SpotAt(target, curve.points[i].place);
        curve.points[i].x = spot.x;
        curve.points[i].y = spot.y;
        curve.points[i].offsetX = m_heard.x[i] - spot.x;
        curve.points[i].offsetY = m_heard.y[i] - spot.y;
    }
}

void GlidingMap::MergePoints(GlidingCurve& curve, const TransferCurve& target) {
    const auto count = static_cast<std::size_t>(target.count);
    if (m_heard.count == 0)
        for (const auto& point : target) m_heard.Add(point.x, point.y);
    m_heard.Thin(GlidingCurve::kRoom - count);
    std::size_t wanted = 0, heard = 0, merged = 0;
    for (; wanted < count || heard < m_heard.count; ++merged) {
        const double nextWanted = wanted < count ? target.points[wanted].x : kBeyond;
        const double nextHeard = heard < m_heard.count ? m_heard.x[heard] : kBeyond;
        const double x = std::min(nextWanted, nextHeard);
        curve.points[merged].x = x;
        curve.points[merged].place = PlaceOf(x, target, wanted);
        curve.points[merged].y = SpotAt(target, curve.points[merged].place).y;
        curve.points[merged].offsetX = 0.0;
        curve.points[merged].offsetY = m_heard.LevelAt(x, heard) - curve.points[merged].y;
        wanted += x == nextWanted;
        heard += x == nextHeard;
    }
    curve.count = static_cast<int>(merged);
}

void GlidingMap::Arrive() {
    factor = 0.0;
    framesLeft = 0;
    for (std::size_t channel = 0; channel < 2; ++channel) {
        auto& curve = m_comp_map[channel];
        const auto target = m_target.Curve(channel);
        curve.count = static_cast<int>(target.size());
        std::size_t i = 0;
        for (const auto& point : target) {
            curve.points[i].x = point.x;
            curve.points[i].y = point.y;
            curve.points[i].offsetX = curve.points[i].offsetY = 0.0;
            curve.points[i].place = static_cast<double>(i);
            ++i;
        }
        for (std::size_t next = 1; next < i; ++next) {
            const double width = curve.points[next].x - curve.points[next - 1].x;
            curve.points[next - 1].slope =
                width > 0.0 ? (curve.points[next].y - curve.points[next - 1].y) / width : 1.0;
        }
    }
}

}  // namespace Corvo::DSP::CompressorPrivate
