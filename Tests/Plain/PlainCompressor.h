#pragma once

#include <array>
#include <cmath>
#include <cstddef>
#include <vector>

namespace Plain {

// The compressor's core, one frame after the other, as its definition reads: every point glides every frame.
struct Compressor {
    struct Point {
        double x, y, targetX = x, targetY = y;
    };
    std::array<std::vector<Point>, 2> curve;
    std::array<double, 2> attack{}, release{}, outGain{}, appliedGain{}, envelope{};
    std::array<std::size_t, 2> segment{};
    double smoothing = 0.0;  // 0 where nothing glides

    // Linked, both sides follow the mean of both, with the left one's times.
    template <typename Sample>
    void Run(Sample* samples, std::size_t frames, bool linked) {
        for (; frames > 0; --frames, samples += 2) {
            const std::array levels{std::abs(samples[0]), std::abs(samples[1])};
            for (std::size_t side = 0; side < 2; ++side) {
                if (side == 0 || !linked)
                    Follow(side, linked ? (levels[0] + levels[1]) * Sample(0.5) : levels[side]);
                const double gain = Gain(side, envelope[linked ? 0 : side]);
                appliedGain[side] += (outGain[side] - appliedGain[side]) * smoothing;
                samples[side] = static_cast<Sample>(samples[side] * gain * appliedGain[side]);
            }
        }
    }

private:
    void Follow(std::size_t side, double level) {
        double& e = envelope[side];
        e = (level - e) * (level > e ? attack : release)[side] + e;
    }
    double Gain(std::size_t side, double e) {
        auto& points = curve[side];
        auto& s = segment[side];
        if (smoothing > 0.0)
            for (auto& p : points) {
                p.x += (p.targetX - p.x) * smoothing;
                p.y += (p.targetY - p.y) * smoothing;
            }
        while (s + 2 < points.size() && e > points[s + 1].x) ++s;
        while (s >= 1 && points[s].x > e) --s;
        const double width = points[s + 1].x - points[s].x;
        const double slope = width > 0.0 ? (points[s + 1].y - points[s].y) / width : 1.0;
        return e == 0.0 ? 1.0 : ((e - points[s].x) * slope + points[s].y) / e;
    }
};

}  // namespace Plain
