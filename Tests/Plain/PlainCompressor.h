#pragma once

#include <array>
#include <cmath>
#include <cstddef>
#include <vector>

namespace Plain {

// The compressor's core, one frame after the other, as its definition reads: every point glides every frame.
struct Compressor {
    struct Point {
        double x, y, slope = 0.0, targetX = x, targetY = y;
    };
    using Sides = std::array<double, 2>;

    std::array<std::vector<Point>, 2> curve;
    Sides attack{}, release{}, outGain{}, appliedGain{}, envelope{}, display{1.0, 1.0};
    std::array<std::size_t, 2> segment{};
    double kp = 0.0, kg = 0.0;
    bool smoothParameters = false, smoothGain = false;

    template <typename Sample>
    void Linked(Sample* samples, int frames) {
        for (; frames > 0; --frames, samples += 2) {
            Smooth(0);
            Smooth(1);
            const Sample level = (std::abs(samples[0]) + std::abs(samples[1])) * Sample(0.5);
            const double before = Follow(0, level);
            for (std::size_t channel = 0; channel < 2; ++channel)
                samples[channel] = Scale(samples[channel], channel, before, level, envelope[0]);
        }
    }

    template <typename Sample>
    void Channel(Sample* samples, std::size_t channel, int stride, int frames) {
        for (; frames > 0; --frames, samples += stride) {
            Smooth(channel);
            const Sample level = std::abs(*samples);
            const double before = Follow(channel, level);
            *samples = Scale(*samples, channel, before, level, envelope[channel]);
        }
    }

private:
    void Smooth(std::size_t channel) {
        if (smoothParameters)
            for (auto& p : curve[channel]) {
                p.x += (p.targetX - p.x) * kp;
                p.y += (p.targetY - p.y) * kp;
            }
        if (smoothGain) appliedGain[channel] += (outGain[channel] - appliedGain[channel]) * kp;
    }

    double Follow(std::size_t channel, double level) {
        const double before = envelope[channel];
        double& e = envelope[channel];
        e = level > e ? (level - e) * attack[channel] + e : (level - e) * release[channel] + e;
        return before;
    }

    template <typename Sample>
    Sample Scale(Sample sample, std::size_t channel, double before, double level, double e) {
        auto& points = curve[channel];
        auto& s = segment[channel];
        if (level > before)
            while (s + 2 < points.size() && e > points[s + 1].x) ++s;
        else
            while (s >= 1 && points[s].x > e) --s;
        const double width = points[s + 1].x - points[s].x;
        points[s].slope = width > 0.0 ? (points[s + 1].y - points[s].y) / width : 1.0;
        const double gain = e == 0.0 ? 1.0 : ((e - points[s].x) * points[s].slope + points[s].y) / e;
        display[channel] = (gain - display[channel]) * kg + display[channel];
        return static_cast<Sample>(sample * gain * (smoothGain ? appliedGain[channel] : outGain[channel]));
    }
};

}  // namespace Plain
