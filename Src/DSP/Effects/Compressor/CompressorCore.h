#pragma once

#include <array>
#include <cmath>
#include <cstddef>
#include <limits>
#include <xsimd/xsimd.hpp>

#include "DSP/Effects/Compressor/CompressorGlide.h"

namespace Corvo::DSP::CompressorPrivate {

// Left and right, or one channel twice: two doubles in the register that both targets have.
using Lanes = xsimd::batch<double, xsimd::sse2>;

struct CoreCoefficients {
    std::array<double, 2> attack{}, release{}, outGain{};
    double parameterSmoothing = 1.0, gainSmoothing = 1.0;  // kp and kg
    bool meter = false;
};

// What is carried from block to block.
struct CoreState {
    std::array<double, 2> envelope{}, appliedGain{}, displayGain{1.0, 1.0};
    std::array<int, 2> segment{};
};

// The channel of each lane, and the segment it is in.
struct LaneSegments {
    std::array<std::size_t, 2> channel;
    std::array<int, 2> segment;

    template <typename Pick>
    Lanes Gather(const GlidingMap& map, Pick&& pick) const {
        return {pick(map.m_comp_map[channel[0]], segment[0]), pick(map.m_comp_map[channel[1]], segment[1])};
    }
    Lanes Gather(const GlidingMap& map, double GlidingCurve::Point::*value, int next) const {
        return Gather(map, [&](const GlidingCurve& curve, int i) {
            return curve.points[static_cast<std::size_t>(i + next)].*value;
        });
    }
    // Nothing in the last segment, infinity elsewhere: the upper end to which an envelope stays inside.
    Lanes OpenEnd(const GlidingMap& map) const {
        return Gather(map, [](const GlidingCurve& curve, int i) {
            return i < curve.count - 2 ? 0.0 : std::numeric_limits<double>::infinity();
        });
    }
};

// The curve as it stands. A Segment is what of it is in use, one lane each.
class ParameterGetter {
public:
    struct Segment {
        Lanes x, y, slope, end;
    };
    explicit ParameterGetter(const GlidingMap& map) : m_map(&map) {}

    Segment Enter(const LaneSegments& at) const {
        return {at.Gather(*m_map, &GlidingCurve::Point::x, 0), at.Gather(*m_map, &GlidingCurve::Point::y, 0),
                at.Gather(*m_map, &GlidingCurve::Point::slope, 0),
                xsimd::max(at.Gather(*m_map, &GlidingCurve::Point::x, 1), at.OpenEnd(*m_map))};
    }
    void Advance() {}
    double X(std::size_t channel, int i) const { return m_map->m_comp_map[channel].X(i, 0.0); }
    Lanes Start(const Segment& s) const { return s.x; }
    Lanes End(const Segment& s) const { return s.end; }
    Lanes Level(const Segment& s, const Lanes& e) const { return (e - s.x) * s.slope + s.y; }

private:
    const GlidingMap* m_map;
};

// The curve on its way, one step per frame. Only the points in use are worked out.
class ParameterSmoother {
public:
    struct Moving {
        Lanes target, offset;
    };
    struct Segment {
        Moving x, y, nextX, nextY;
        Lanes openEnd;
    };
    ParameterSmoother(const GlidingMap& map, double smoothing)
        : m_map(&map), m_factor(map.factor), m_keep(1.0 - smoothing) {}

    Segment Enter(const LaneSegments& at) const {
        const auto x = [&](int next) {
            return Moving{at.Gather(*m_map, &GlidingCurve::Point::x, next),
                          at.Gather(*m_map, &GlidingCurve::Point::offsetX, next)};
        };
        const auto y = [&](int next) {
            return Moving{at.Gather(*m_map, &GlidingCurve::Point::y, next),
                          at.Gather(*m_map, &GlidingCurve::Point::offsetY, next)};
        };
        return {x(0), y(0), x(1), y(1), at.OpenEnd(*m_map)};
    }
    void Advance() { m_factor *= m_keep; }
    double X(std::size_t channel, int i) const { return m_map->m_comp_map[channel].X(i, m_factor); }
    Lanes Start(const Segment& s) const { return Now(s.x); }
    Lanes End(const Segment& s) const { return xsimd::max(Now(s.nextX), s.openEnd); }
    Lanes Level(const Segment& s, const Lanes& e) const {
        const Lanes x = Now(s.x), y = Now(s.y), width = Now(s.nextX) - x;
        const Lanes slope = (Now(s.nextY) - y) / width;
        return (e - x) * xsimd::select(width > Lanes(0.0), slope, Lanes(1.0)) + y;
    }
    double Factor() const { return m_factor; }

private:
    Lanes Now(const Moving& value) const { return value.target + Lanes(m_factor) * value.offset; }

    const GlidingMap* m_map;
    double m_factor, m_keep;
};

// The out gain as cooked.
struct GainGetter {
    struct Running {
        Running(const LaneSegments& at, const CoreCoefficients& c, const CoreState&)
            : gain{c.outGain[at.channel[0]], c.outGain[at.channel[1]]} {}
        void Advance() {}
        void Leave(const LaneSegments&, CoreState&) const {}
        Lanes gain;
    };
};

// The applied gain, on its way to the cooked one.
struct GainSmoother {
    struct Running {
        Running(const LaneSegments& at, const CoreCoefficients& c, const CoreState& state)
            : gain{state.appliedGain[at.channel[0]], state.appliedGain[at.channel[1]]},
              target{c.outGain[at.channel[0]], c.outGain[at.channel[1]]},
              smoothing(c.parameterSmoothing) {}
        void Advance() { gain += (target - gain) * smoothing; }
        void Leave(const LaneSegments& at, CoreState& state) const {
            for (std::size_t lane = 0; lane < 2; ++lane) state.appliedGain[at.channel[lane]] = gain.get(lane);
        }
        Lanes gain, target, smoothing;
    };
};

// The envelope has left its segment. The search goes up when it rose and down when it fell; under an envelope
// that stands still the points may have moved either way.
template <typename Parameters>
int FindSegment(const Parameters& parameters, const GlidingMap& map, std::size_t channel, int segment,
                double before, double level, double envelope) {
    const bool rose = level > before;
    if (!rose)
        while (segment >= 1 && parameters.X(channel, segment) > envelope) --segment;
    if (rose || envelope == before)
        while (segment < map.m_comp_map[channel].count - 2 && envelope > parameters.X(channel, segment + 1))
            ++segment;
    return segment;
}

// The compressor's routine. `frame` reads the detector and scales the output; both lanes follow one envelope,
// that of the first lane's channel. The parameter accessor comes back as far as it got.
template <bool Meter, typename Frame, typename Parameters, typename Gains>
Parameters RunCore(const Frame& frame, int frames, const std::array<std::size_t, 2>& channel,
                   const GlidingMap& map, const CoreCoefficients& coefficients, CoreState& state,
                   Parameters parameters, Gains) {
    LaneSegments at{channel, {state.segment[channel[0]], state.segment[channel[1]]}};
    auto segment = parameters.Enter(at);
    typename Gains::Running gains(at, coefficients, state);
    const Lanes attack(coefficients.attack[channel[0]]), release(coefficients.release[channel[0]]);
    const Lanes meterSmoothing(coefficients.gainSmoothing);
    Lanes envelope(state.envelope[channel[0]]);
    Lanes display{state.displayGain[channel[0]], state.displayGain[channel[1]]};

    for (int i = 0; i < frames; ++i) {
        parameters.Advance();
        gains.Advance();
        const Lanes level = frame.Level(i), before = envelope, change = level - before;
        envelope = xsimd::select(level > before, change * attack, change * release) + before;
        if (xsimd::any((envelope > parameters.End(segment)) | (parameters.Start(segment) > envelope)))
            [[unlikely]] {
            for (std::size_t lane = 0; lane < 2; ++lane)
                at.segment[lane] = FindSegment(parameters, map, channel[lane], at.segment[lane],
                                               before.get(0), level.get(0), envelope.get(0));
            segment = parameters.Enter(at);
        }
        const Lanes gain =
            xsimd::select(envelope == Lanes(0.0), Lanes(1.0), parameters.Level(segment, envelope) / envelope);
        frame.Scale(i, gain, gains.gain);
        if constexpr (Meter) display = (gain - display) * meterSmoothing + display;
    }

    for (std::size_t lane = 0; lane < 2; ++lane) {
        state.envelope[channel[lane]] = envelope.get(0);  // so that unlinking starts from where both are
        state.segment[channel[lane]] = at.segment[lane];
        state.displayGain[channel[lane]] = display.get(lane);
    }
    gains.Leave(at, state);
    return parameters;
}

// With or without the meter, whose cost is paid only where it is on.
template <typename Frame, typename Parameters, typename Gains>
void RunCore(const Frame& frame, int frames, const std::array<std::size_t, 2>& channel, const GlidingMap& map,
             const CoreCoefficients& coefficients, CoreState& state, Parameters& parameters, Gains gains) {
    const auto run = coefficients.meter ? RunCore<true, Frame, Parameters, Gains>
                                        : RunCore<false, Frame, Parameters, Gains>;
    parameters = run(frame, frames, channel, map, coefficients, state, parameters, gains);
}

// One frame of a linked pair: the mean of two detector channels drives one or two output channels.
template <typename Sample>
struct LinkedFrame {
    Sample* output;
    const Sample *left, *right;
    std::ptrdiff_t outputChannels, detectorStride;

    Lanes Level(int i) const {
        const Sample mean =
            (std::abs(left[i * detectorStride]) + std::abs(right[i * detectorStride])) * Sample(0.5);
        return Lanes(static_cast<double>(mean));
    }
    void Scale(int i, const Lanes& gain, const Lanes& outGain) const {
        Sample* const out = output + i * outputChannels;
        const std::ptrdiff_t second = outputChannels - 1;
        const Lanes scaled =
            Lanes{static_cast<double>(out[0]), static_cast<double>(out[second])} * gain * outGain;
        alignas(16) std::array<double, 2> samples;
        scaled.store_aligned(samples.data());
        out[second] = static_cast<Sample>(samples[1]);
        out[0] = static_cast<Sample>(samples[0]);
    }
};

template <typename Sample>
struct ChannelFrame {
    Sample* output;
    const Sample* detector;
    std::ptrdiff_t outputStride, detectorStride;

    Lanes Level(int i) const { return Lanes(static_cast<double>(std::abs(detector[i * detectorStride]))); }
    void Scale(int i, const Lanes& gain, const Lanes& outGain) const {
        Sample& out = output[i * outputStride];
        const Lanes scaled = Lanes(static_cast<double>(out)) * gain * outGain;
        out = static_cast<Sample>(scaled.get(0));
    }
};

}  // namespace Corvo::DSP::CompressorPrivate
