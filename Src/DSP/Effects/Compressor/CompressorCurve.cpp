#include "DSP/Effects/Compressor/CompressorCurve.h"

#include <algorithm>
#include <cmath>

namespace Corvo::DSP::CompressorPrivate {
namespace {

constexpr float kLowestLevel = 1e-6f, kHighestLevel = 10.0f;  // -120 and +20 dB
constexpr double kUnityTolerance = 1e-5;
// Straight segments from the knee to full scale: at most 2.5 dB each, 0.03 dB off the power law.
constexpr int kSegmentsAbove = 32;
// Slopes read back from the points are put on this grid, which holds every ratio step, so that editing a
// curve again and again does not make it drift.
constexpr double kSlopeGrid = 1000.0 * kRatioSteps;

std::int32_t TruncatedTenths(double level) {
    // Below -200 dB nothing is shown; the cast of minus infinity would be undefined.
    return static_cast<std::int32_t>(std::max(std::log10(level) * 200.0, -4000.0));
}

bool IsUnity(const CurvePoint& point) {
    return std::abs(static_cast<double>(point.y) - point.x) <= kUnityTolerance * point.x;
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

double TransferCurve::SlopeAboveThreshold() const {
    const auto* knee = Threshold();
    if (knee == end() || knee == end() - 1) return 1.0;
    const auto* from = knee;
    // A soft knee bends on above the threshold: the upper quarter of the decibels is straight.
    if (!IsUnity(*knee)) {
        const double level = std::pow(static_cast<double>(knee->x), 0.25);
        while (from < end() - 2 && from->x < level) ++from;
    }
    return DbSlope(*from, end()[-1]);
}

void TransferCurve::MoveThreshold(std::int32_t tenths) {
    Redraw(LevelFromTenths(tenths), std::round(SlopeAboveThreshold() * kSlopeGrid) / kSlopeGrid);
}

void TransferCurve::SetRatioStep(std::int32_t step) {
    const auto* knee = Threshold();
    const float highest = LevelFromTenths(kHighestThreshold);
    Redraw(knee == end() ? highest : std::min(knee->x, highest), SlopeOfStep(step));
}

void TransferCurve::Redraw(float knee, double slope) {
    const auto* oldKnee = Threshold();
    std::ptrdiff_t below = 0;  // points under the old knee
    while (below < count && points[static_cast<std::size_t>(below)].x < oldKnee->x) ++below;

    const auto at = [this](std::ptrdiff_t i) -> CurvePoint& { return points[static_cast<std::size_t>(i)]; };
    // A soft knee is the stretch right below the old one where the curve sinks under unity.
    std::ptrdiff_t unity = below - 1;
    while (unity > 0 && !IsUnity(at(unity)) && at(unity).y < at(unity).x) --unity;
    double pivot = knee;
    if (unity > 0 ? IsUnity(at(unity)) : below <= 1) {
        // Unity from here up to the new knee, on top of a gate if there is one.
        while (unity > 0 && IsUnity(at(unity - 1))) --unity;
        below = std::max<std::ptrdiff_t>(unity, 0) + 1;
        if (unity > 0 && at(unity).x > knee) {
            const double push = static_cast<double>(knee) / at(unity).x;
            for (std::ptrdiff_t i = 1; i < unity; ++i) {
                at(i).x = static_cast<float>(at(i).x * push);
                at(i).y = static_cast<float>(at(i).y * push);
            }
            at(unity).x = at(unity).y = knee;
        }
    } else {
        // Some other shape: it is kept as far as it reaches, and goes on in parallel to unity.
        while (below > 1 && at(below - 1).x >= knee) --below;
        const auto& last = at(below - 1);
        if (last.x > 0.0f)
            pivot = last.y + (knee <= oldKnee->x ? (knee - last.x) * static_cast<double>(last.slope)
                                                 : (knee - last.x) * static_cast<double>(last.y) / last.x);
        pivot = std::clamp(pivot, 0.0, static_cast<double>(kHighestLevel));
    }

    constexpr auto kRoomBelow = static_cast<std::int32_t>(kMaxPoints) - kSegmentsAbove - 2;
    count = std::min(static_cast<std::int32_t>(below), kRoomBelow);
    Add(knee, pivot);
    const double range = std::log(1.0 / static_cast<double>(knee));
    for (int i = 0; i <= kSegmentsAbove; ++i) {
        const double up = range * i / kSegmentsAbove;
        const double x = i == 0 ? knee : i == kSegmentsAbove ? 1.0 : knee * std::exp(up);
        // From 0 no slope leads anywhere; a steep one would make it 0 times infinity.
        Add(x,
            pivot > 0.0 ? std::min(pivot * std::exp(up * slope), static_cast<double>(kHighestLevel)) : 0.0);
    }
    std::fill(points.begin() + count, points.end(), CurvePoint{});
    UpdateSlopes();
}

}  // namespace Corvo::DSP::CompressorPrivate
