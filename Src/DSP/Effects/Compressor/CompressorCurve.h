#pragma once

#include <array>
#include <cstddef>
#include <cstdint>

#include "Platform/Export.h"

namespace Corvo::DSP::CompressorPrivate {

// "No threshold (or ratio) has been set since the last preset."
constexpr std::int32_t kNotSet = -9999;

constexpr std::int32_t kLowestThreshold = -800, kHighestThreshold = -10;  // tenths of a decibel
// From no compression to a limiter.
constexpr std::int32_t kRatioSteps = 251;

// Output level y that belongs to input level x, both linear amplitudes, and the slope of the straight
// segment to the next point.
struct CurvePoint {
    float x, y, slope;  // x and y in 0..1
};

// One channel's transfer curve: points in ascending x from (0, 0) to x = 1, joined by straight segments.
//
// The threshold is the knee above which the curve is a straight line in decibels,
//   output = threshold + slope * (input - threshold),   slope = 1 - step / 251,
// and is marked by its point standing twice. A curve without the mark (drawn by hand) has its threshold
// where its topmost straight line begins, and at x = 1 when that line is unity.
//
// A knee is hard, or soft: a parabola in decibels centred on the threshold, from unity to the line. An edit
// doubles the point where a soft knee begins, so that its width is known when the ratio is 1 as well.
//
// Operations allocate nothing and run on either thread, on that thread's own curve.
struct DSP_API TransferCurve {
    static constexpr std::size_t kMaxPoints = 666;  // of a curve

    std::array<CurvePoint, kMaxPoints> points{};  // of which the first `count` are in use
    std::int32_t count = 0;                       // 0..kMaxPoints

    // The points in use.
    const CurvePoint* begin() const;
    const CurvePoint* end() const;

    // Appends a point; ignored when the curve is full.
    void Add(double x, double y);
    // Fills in the slopes, after the last Add.
    void UpdateSlopes();
    // Makes a curve of whatever came from outside: drops points that are no numbers or descend, limits
    // levels, adds the ends, clears what is beyond the count.
    void Repair();

    const CurvePoint* Threshold() const;  // end() for an empty curve only
    // Its level in tenths of a decibel, truncated.
    std::int32_t ThresholdTenths() const;
    // Decibels out per decibel in, above the threshold; the ratio is its reciprocal.
    double SlopeAboveThreshold() const;

    // Moves the knee and keeps its width, the slope above it and what lies below: a gate stays where it is,
    // or is pushed down whole by a knee that meets it. A bend of another shape moves along as it is.
    void MoveThreshold(std::int32_t tenths);
    // Turns the part above the knee. A curve without a threshold gets one at its highest setting.
    void SetRatioStep(std::int32_t step);

    // Whether all points in use are the same.
    bool operator==(const TransferCurve& other) const;

private:
    struct Knee;
    Knee FindKnee() const;
    void Redraw(const Knee& knee, float threshold, double slope);
    void KeepBelow(std::size_t unityBegin, double highest);
    double KeepDetached(const Knee& knee, float threshold);
};

// How far above the start of a knee of this width, whose middle is at 0: a parabola, then straight.
double KneeRamp(double distance, double width);

// The curves of both channels and the edits last made to them.
struct CompMapStereo {
    std::array<TransferCurve, 2> m_comp_map;  // left, right
    std::array<std::int32_t, 2> reserved{};   // kept for whoever wrote them
    std::int32_t last_threshold = kNotSet;    // tenths of a decibel
    std::int32_t last_ratio_step = kNotSet;   // 0..kRatioSteps
};

// The largest level that reads as `tenths` of a decibel when its decibels are truncated.
DSP_API float LevelFromTenths(std::int32_t tenths);

// Decibels out per decibel in, above the threshold, at a step from 0 to kRatioSteps.
constexpr double SlopeOfStep(std::int32_t step) {
    return 1.0 - static_cast<double>(step) / static_cast<double>(kRatioSteps);
}

}  // namespace Corvo::DSP::CompressorPrivate
