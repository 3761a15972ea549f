#include "DSP/Effects/Compressor/CompressorCurve.h"

#include <algorithm>
#include <cmath>

namespace Corvo::DSP::CompressorPrivate {
namespace {

constexpr float kLowestLevel = 1e-6f, kHighestLevel = 10.0f;  // -120 and +20 dB
constexpr double kUnityTolerance = 1e-5;
// Straight segments from the knee to full scale: at most 2.5 dB each, 0.03 dB off the power law.
constexpr int kSegmentsAbove = 32;
// And from the start of a soft knee to the threshold, and from there to its end.
constexpr int kHalfKneeSegments = 8;
// Points that an edit keeps at most: it adds the knee with its marks, and the line.
constexpr auto kRoomBelow =
    static_cast<std::int32_t>(TransferCurve::kMaxPoints) - 3 - 2 * kHalfKneeSegments - kSegmentsAbove;
// Slopes read back from the points are put on this grid, which holds every ratio step, so that editing a
// curve again and again does not make it drift.
constexpr double kSlopeGrid = 1000.0 * kRatioSteps;
constexpr double kWidthGrid = 8192.0;  // and the widths of knees, in nepers, on this one: 0.001 dB
constexpr double kNarrowest = 0.01;    // nepers; half a soft knee
constexpr double kSameShape = 0.001;   // nepers by which a soft knee may miss the parabola

std::int32_t TruncatedTenths(double level) {
    // Below -200 dB nothing is shown; the cast of minus infinity would be undefined.
    return static_cast<std::int32_t>(std::max(std::log10(level) * 200.0, -4000.0));
}

bool IsUnity(const CurvePoint& point) {
    return std::abs(static_cast<double>(point.y) - point.x) <= kUnityTolerance * point.x;
}

bool StandsTwice(const CurvePoint* point) {
    return point->x > 0.0f && point->x == point[-1].x && point->y == point[-1].y;
}

// Where the upper quarter of the decibels from a point up to the last one begins; the last but one at most.
const CurvePoint* UpperQuarter(const CurvePoint* point, const CurvePoint* top) {
    const double level = std::pow(static_cast<double>(point->x), 0.25);
    while (point < top - 1 && point->x < level) ++point;
    return point;
}

double DbSlope(const CurvePoint& a, const CurvePoint& b) {
    if (!(a.x > 0.0f && b.x > a.x)) return 1.0;
    if (!(a.y > 0.0f && b.y > 0.0f)) return 0.0;
    return std::log(static_cast<double>(b.y) / a.y) / std::log(static_cast<double>(b.x) / a.x);
}

}  // namespace

float LevelFromTenths(std::int32_t tenths) {
    const auto above = [tenths](float level) {
        return std::log10(static_cast<double>(level)) * 200.0 > static_cast<double>(tenths);
    };
    auto level = static_cast<float>(std::pow(10.0, tenths * 0.005));
    while (above(level)) level = std::nextafter(level, 0.0f);
    for (float next; !above(next = std::nextafter(level, 2.0f));) level = next;
    return level;
}

const CurvePoint* TransferCurve::begin() const { return points.data(); }
const CurvePoint* TransferCurve::end() const { return points.data() + count; }

bool TransferCurve::operator==(const TransferCurve& other) const {
    return std::equal(begin(), end(), other.begin(), other.end(),
                      [](const CurvePoint& a, const CurvePoint& b) { return a.x == b.x && a.y == b.y; });
}

void TransferCurve::Add(double x, double y) {
    if (static_cast<std::size_t>(count) == kMaxPoints) return;
    points[static_cast<std::size_t>(count++)] = {static_cast<float>(x), static_cast<float>(y), 1.0f};
}

void TransferCurve::UpdateSlopes() {
    const auto used = static_cast<std::size_t>(count);
    for (std::size_t i = 0; i < used; ++i) {
        auto& point = points[i];
        point.slope = 1.0f;
        if (i + 1 < used && points[i + 1].x > point.x)
            point.slope = (points[i + 1].y - point.y) / (points[i + 1].x - point.x);
    }
}

void TransferCurve::Repair() {
    const auto given = static_cast<std::size_t>(std::clamp<std::int32_t>(count, 0, kMaxPoints));
    TransferCurve good;
    good.Add(0.0, 0.0);
    for (std::size_t i = 0; i < given; ++i) {
        const auto& point = points[i];
        const bool usable = std::isfinite(point.x) && std::isfinite(point.y) && point.x >= kLowestLevel &&
                            point.x <= 1.0f && point.x >= good.end()[-1].x;
        if (usable) good.Add(point.x, std::clamp(point.y, 0.0f, kHighestLevel));
    }
    if (good.end()[-1].x != 1.0f) {
        if (static_cast<std::size_t>(good.count) == kMaxPoints) --good.count;
        good.Add(1.0, 1.0);
    }
    good.UpdateSlopes();
    *this = good;
}

const CurvePoint* TransferCurve::Threshold() const {
    if (count == 0) return end();
    for (const auto* point = end() - 1; point > begin(); --point)
        if (point->x == point[-1].x && point->x > 0.0f) return point;
    constexpr double kStraight = 0.01;
    const auto* top = end() - 1;
    if (top == begin()) return top;
    const double slope = DbSlope(top[-1], *top);
    if (std::abs(slope - 1.0) < kStraight) return top;
    const auto* point = top - 1;
    while (point > begin() && point[-1].x > 0.0f && std::abs(DbSlope(point[-1], *point) - slope) < kStraight)
        --point;
    return point->x > 0.0f ? point : top;
}

std::int32_t TransferCurve::ThresholdTenths() const {
    const auto* threshold = Threshold();
    return threshold == end() ? 0 : TruncatedTenths(threshold->x);
}

double KneeRamp(double distance, double width) {
    if (distance <= -width / 2.0) return 0.0;
    if (distance >= width / 2.0) return distance;
    const double into = distance + width / 2.0;
    return into * into / (2.0 * width);
}

// How the curve bends at its threshold. Indices of points.
struct TransferCurve::Knee {
    enum class Shape {
        Hard,
        Soft,     // the parabola
        Drawn,    // another way from unity down to the threshold
        Detached  // no unity below it
    };
    Shape shape = Shape::Hard;
    std::size_t threshold = 0;              // the first point there
    std::size_t unityBegin = 0, start = 0;  // the stretch of unity under the knee, which starts at its end
    double halfWidth = 0.0;                 // of a soft knee, in nepers
    double slope = 1.0;                     // above it

    // Enough of a line above a soft knee to read its slope. Otherwise the depth of the knee tells it.
    static bool HasLineAbove(double halfWidth, double range) { return range > 1.25 * halfWidth; }
};

TransferCurve::Knee TransferCurve::FindKnee() const {
    Knee knee;
    if (count == 0) return knee;
    const auto *const threshold = Threshold(), *const top = end() - 1;
    const auto at = [this](std::size_t i) -> const CurvePoint& { return points[i]; };
    while (at(knee.threshold).x < threshold->x) ++knee.threshold;
    const auto& first = at(knee.threshold);

    const bool marked = knee.threshold > kHalfKneeSegments && StandsTwice(&first - kHalfKneeSegments) &&
                        IsUnity(*(&first - kHalfKneeSegments));
    knee.start = marked ? knee.threshold - kHalfKneeSegments : knee.threshold;
    for (bool under = !marked && !IsUnity(first); under && knee.start > 0;) {
        const auto& below = at(--knee.start);
        under = below.y < below.x && !IsUnity(below);
    }
    knee.unityBegin = knee.start;
    while (knee.unityBegin > 0 && IsUnity(at(knee.unityBegin - 1))) --knee.unityBegin;

    // A soft knee bends on above the threshold.
    const auto* const lineBegin = marked                ? std::min(threshold + kHalfKneeSegments, top)
                                  : IsUnity(*threshold) ? threshold
                                                        : UpperQuarter(threshold, top);
    if (threshold != top) knee.slope = DbSlope(*lineBegin, *top);
    if (knee.start == knee.threshold) return knee;

    if (!IsUnity(at(knee.start)) || (knee.start == 0 && knee.threshold > 1)) {
        knee.shape = Knee::Shape::Detached;
        return knee;
    }
    knee.shape = Knee::Shape::Drawn;
    if (knee.start == 0) return knee;
    const double width = std::log(static_cast<double>(first.x) / at(knee.start).x);
    const double depth = std::log(static_cast<double>(first.x) / first.y);
    const bool parabola = std::abs(depth - (1.0 - knee.slope) * width / 4.0) < kSameShape;
    if (width < kNarrowest || !(first.y > 0.0f) || !(marked || parabola)) return knee;
    knee.shape = Knee::Shape::Soft;
    knee.halfWidth = std::round(width * kWidthGrid) / kWidthGrid;
    if (marked && !Knee::HasLineAbove(knee.halfWidth, -std::log(static_cast<double>(first.x))))
        knee.slope = 1.0 - 4.0 * depth / knee.halfWidth;
    return knee;
}

double TransferCurve::SlopeAboveThreshold() const { return FindKnee().slope; }

void TransferCurve::MoveThreshold(std::int32_t tenths) {
    const Knee knee = FindKnee();
    Redraw(knee, LevelFromTenths(tenths), std::round(knee.slope * kSlopeGrid) / kSlopeGrid);
}

void TransferCurve::SetRatioStep(std::int32_t step) {
    const Knee knee = FindKnee();
    const float highest = LevelFromTenths(kHighestThreshold), threshold = points[knee.threshold].x;
    Redraw(knee, threshold > 0.0f ? std::min(threshold, highest) : highest, SlopeOfStep(step));
}

// What lies under the unity below the knee. It is pushed down where it reaches above `highest`.
void TransferCurve::KeepBelow(std::size_t unityBegin, double highest) {
    auto& top = points[unityBegin];
    if (unityBegin > 0 && top.x > highest) {
        const double push = highest / top.x;
        for (std::size_t i = 1; i < unityBegin; ++i) {
            points[i].x = static_cast<float>(points[i].x * push);
            points[i].y = static_cast<float>(points[i].y * push);
        }
        top.x = top.y = static_cast<float>(highest);
    }
    count = static_cast<std::int32_t>(std::min<std::size_t>(unityBegin + 1, kRoomBelow));
}

// Keeps the curve as far as it reaches under a threshold that no unity leads to. Above, it goes on in
// parallel to unity; returns its level at the threshold.
double TransferCurve::KeepDetached(const Knee& knee, float threshold) {
    const double before = points[knee.threshold].x;
    std::size_t kept = knee.threshold;
    while (kept > 1 && points[kept - 1].x >= threshold) --kept;
    const auto last = points[kept - 1];
    count = static_cast<std::int32_t>(std::min<std::size_t>(kept, kRoomBelow));
    if (!(last.x > 0.0f)) return threshold;
    const double slope =
        threshold <= before ? static_cast<double>(last.slope) : static_cast<double>(last.y) / last.x;
    return std::clamp(last.y + (threshold - last.x) * slope, 0.0, static_cast<double>(kHighestLevel));
}

void TransferCurve::Redraw(const Knee& knee, float threshold, double slope) {
    const bool soft = knee.shape == Knee::Shape::Soft;
    const auto before = count;
    double pivot = threshold;
    const auto level = [&](double up) {
        const double bent = soft ? up - (1.0 - slope) * KneeRamp(up, 2.0 * knee.halfWidth) : up * slope;
        // From 0 no slope leads anywhere; a steep one would make it 0 times infinity.
        return pivot > 0.0 ? std::min(pivot * std::exp(bent), static_cast<double>(kHighestLevel)) : 0.0;
    };
    // The points of straight segments between two distances from the threshold, in nepers; the last point
    // is left to what follows.
    const auto draw = [&](double from, double to, int segments) {
        for (int i = 0; i < segments; ++i) {
            const double up = from + (to - from) * i / segments;
            Add(threshold * std::exp(up), level(up));
        }
    };

    switch (knee.shape) {
        case Knee::Shape::Hard:
            KeepBelow(knee.unityBegin, threshold);
            break;
        case Knee::Shape::Soft: {
            const double start = threshold * std::exp(-knee.halfWidth);
            KeepBelow(knee.unityBegin, start);
            Add(start, start);
            draw(-knee.halfWidth, 0.0, kHalfKneeSegments);
            break;
        }
        case Knee::Shape::Drawn: {
            const TransferCurve old = *this;
            const double move = static_cast<double>(threshold) / old.points[knee.threshold].x;
            KeepBelow(knee.unityBegin, old.points[knee.start].x * move);
            for (std::size_t i = std::max<std::size_t>(knee.start, 1); i < knee.threshold; ++i)
                if (count < kRoomBelow) Add(old.points[i].x * move, old.points[i].y * move);
            pivot = old.points[knee.threshold].y * move;
            break;
        }
        case Knee::Shape::Detached:
            pivot = KeepDetached(knee, threshold);
            break;
    }
    Add(threshold, level(0.0));
    const double range = std::log(1.0 / static_cast<double>(threshold));
    if (soft && Knee::HasLineAbove(knee.halfWidth, range)) {
        draw(0.0, knee.halfWidth, kHalfKneeSegments);
        draw(knee.halfWidth, range, kSegmentsAbove);
    } else {
        draw(0.0, range, soft ? kHalfKneeSegments + kSegmentsAbove : kSegmentsAbove);
    }
    Add(1.0, level(range));
    std::fill(points.begin() + count, points.begin() + std::max(before, count), CurvePoint{});
    UpdateSlopes();
}

}  // namespace Corvo::DSP::CompressorPrivate
