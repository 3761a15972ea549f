#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <span>

#include "DSP/Effects/Compressor/CompressorCurve.h"

namespace Corvo::DSP::CompressorPrivate {

// A curve on the audio thread: where its points are going, and how far each was from there when it set out.
// All glide alike, so one factor that shrinks every frame tells where they are: target + factor * offset.
// On the way there may be points that the target does not have: corners of what was heard before.
//
// Only the points counted are ever written: most curves need a hundredth of the room, and the rest of the
// memory is not touched.
struct GlidingCurve {
    struct Point {
        double x, y, offsetX, offsetY;
        double place;  // on the target: the number of its point, and how far on to the next one
        double slope;  // of the segment that begins here, once the points stand
    };
    // Room for the points of what is heard and of a new target.
    static constexpr std::size_t kRoom = 2 * TransferCurve::kMaxPoints;
    int count = 0;  // in front, near the first points
    std::array<Point, kRoom> points;

    double X(int i, double factor) const {
        const Point& point = points[static_cast<std::size_t>(i)];
        return point.x + factor * point.offsetX;
    }
    double Y(int i, double factor) const {
        const Point& point = points[static_cast<std::size_t>(i)];
        return point.y + factor * point.offsetY;
    }
    // The segment that holds an input level, the points being where `factor` says.
    int SegmentAt(double level, double factor) const;
};

// Both channels' curves where they are kept: what there is to say about them, then the points in use, the
// left curve's and the right one's. The memory behind them is never touched, so that few pages are.
struct KeptCurves {
    KeptCurves() {}  // leaves the points as they are in memory
    KeptCurves(const KeptCurves&) = delete;
    KeptCurves& operator=(const KeptCurves& from);
    KeptCurves& operator=(const CompMapStereo& from);
    CompMapStereo Map() const;
    std::span<const CurvePoint> Curve(std::size_t channel) const {
        const auto left = static_cast<std::size_t>(count[0]);
        return std::span(points).subspan(channel * left, static_cast<std::size_t>(count[channel]));
    }
    // Whether all points in use are the same.
    bool HasPointsOf(const KeptCurves& other) const;

    std::array<std::int32_t, 2> count{}, reserved{};
    std::int32_t last_threshold = 0, last_ratio_step = 0;
    std::array<CurvePoint, 2 * TransferCurve::kMaxPoints> points;
};

// A curve as it is heard at one moment.
struct HeardCurve {
    std::size_t count = 0;
    std::array<double, GlidingCurve::kRoom> x, y;

    void Add(double level, double output);
    // The output level for an input level that is at the point `next`, or between it and the one before.
    double LevelAt(double level, std::size_t next) const;
    // Drops points that lie almost on the line between those that stay, until at most `most` are left: with
    // the smallest error that does it, up to 0.1 dB. A curve that would need more is a saw of hundreds of
    // teeth; it loses every second point.
    void Thin(std::size_t most);

private:
    void DropWithin(double tolerance);
    void Move(std::size_t from, std::size_t to);
};

// Frames until a one-pole glide with `factor` of its way to go has 1e-14 to go: far below anything audible.
int GlideFrames(double factor, double smoothing);

// Both channels' curves. A glide ends after a fixed number of frames; the points then stand on their
// targets exactly.
struct GlidingMap {
    double factor = 0.0;
    int framesLeft = 0;
    std::array<GlidingCurve, 2> m_comp_map;

    // Sets out for new curves from wherever the points are; nothing changes when these are the targets
    // already. What is heard stays the same until the factor shrinks. Where the last target's points have
    // only been moved, each goes its own way. To any other curve what is heard bends over, on the places of
    // both; then the result is true, and the segments must be found afresh.
    bool SetOutFor(const KeptCurves& target, double smoothing);
    // Stands on the targets at once, with their points only; the segments must be found afresh.
    void Arrive();
    // The same for new ones.
    void ArriveAt(const KeptCurves& target) {
        m_target = target;
        Arrive();
    }
    // The segment that holds `level`.
    int SegmentAt(std::size_t channel, double level) const {
        return m_comp_map[channel].SegmentAt(level, factor);
    }

private:
    void MoveTargets(GlidingCurve& curve, const TransferCurve& target);
    void MergePoints(GlidingCurve& curve, const TransferCurve& target);

    KeptCurves m_target;
    HeardCurve m_heard;  // while a curve sets out
};

}  // namespace Corvo::DSP::CompressorPrivate
