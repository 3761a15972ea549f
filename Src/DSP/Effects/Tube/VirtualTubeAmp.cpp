#include "DSP/Effects/Tube/VirtualTubeAmp.h"

#include <cmath>
#include <numbers>

#include "DSP/Effects/Tube/TubeShapers.h"
#include "Platform/FiniteSamples.h"
#include "Platform/Processor.h"

namespace Corvo::DSP {
namespace {

constexpr std::size_t kLeft = 0, kRight = 1;

template <typename Shaper>
double ShapeOne(double sample, double shape) {
    using Lanes = xsimd::batch<double>;
    return Shaper::Apply(Lanes(sample), TubeShapers::Settings<Lanes>{Lanes(1.0), Lanes(shape), Lanes(shape)})
        .get(0);
}

template <typename Sample>
TubeKernel<Sample> BestTubeKernel() {
    return HasAvx2() ? Avx2TubeKernel<Sample>() : BaselineTubeKernel<Sample>();
}

}  // namespace

VirtualTubeAmp::VirtualTubeAmp() = default;

double VirtualTubeAmp::Martens(double sample, double shape) const {
    return ShapeOne<TubeShapers::Martens>(sample, shape);
}
double VirtualTubeAmp::DoidicS(double sample, double shape) const {
    return ShapeOne<TubeShapers::DoidicS>(sample, shape);
}
double VirtualTubeAmp::DoidicA(double sample, double shape) const {
    return ShapeOne<TubeShapers::DoidicA>(sample, shape);
}
double VirtualTubeAmp::ArayaS(double sample, double shape) const {
    return ShapeOne<TubeShapers::ArayaS>(sample, shape);
}

int VirtualTubeAmp::OversamplingFactor(float normalised) {
    constexpr struct {
        float below;
        int factor;
    } kTable[] = {{0.18f, 1}, {0.36f, 2}, {0.54f, 4}, {0.72f, 8}, {0.8f, 12}};
    for (const auto& row : kTable)
        if (!(normalised >= row.below)) return row.factor;  // NaN is no factor above 1
    return 16;
}

int VirtualTubeAmp::FunctionIndex(float normalised) {
    return normalised >= 0.75f ? 3 : normalised >= 0.5f ? 2 : normalised >= 0.25f ? 1 : 0;
}

void VirtualTubeAmp::SetParameter(const Values& values, int changed) {
    if (changed == kAllParameters) {
        for (int i = 0; i < kParameters; ++i) SetParameter(values, i);
        ClearMemories();
        return;
    }
    if (changed < 0 || changed > kAllParameters) return;
    const float v = values[static_cast<std::size_t>(changed)];
    const auto side = static_cast<std::size_t>(changed % 2);
    Side& s = m_sides[side];
    switch (changed / 2) {
        case 0:
            s.boost = 10.0f * v + 1.0f;
            // Also what no control can set: chunks may hold anything.
            if (!(s.boost >= 1.0f && s.boost <= 11.0f)) s.boost = 1.0f;
            break;
        case 1: {
            s.drive = v > 0.0f ? std::min(v, 1.0f) : 0.0f;
            const double angle = (static_cast<double>(s.drive) + 0.0099) * (std::numbers::pi / 2.0);
            // Around 0.99 the sine rounds to 1, where the factor would be infinite.
            s.sine = std::min(static_cast<float>(std::sin(angle)), std::nextafter(1.0f, 0.0f));
            s.shapeFactor = 2.0f * s.sine / (1.0f - s.sine);
            break;
        }
        case 2:
            s.tone = (1.0f - v) * 0.35f + v * 3.5f;
            DesignTone(side);
            break;
        case 3:
            s.function = FunctionIndex(v);
            break;
        default:
            s.oversampling = OversamplingFactor(v);
            break;
    }
}

void VirtualTubeAmp::DesignTone(std::size_t side) {
    if (!m_sides[side].ToneOn()) {
        // Nothing old may sound when it is switched on again.
        for (auto& memory : m_filter.memory) memory[side] = 0.0;
        return;
    }
    const double k = std::tan(static_cast<double>(m_sides[side].tone) / 2.0);
    const double gain = k / (k + 1.0), a = (k - 1.0) / (k + 1.0);
    m_filter.gain[side] = gain * gain * gain * gain;
    m_filter.feedback[0][side] = 4.0 * a;
    m_filter.feedback[1][side] = 6.0 * a * a;
    m_filter.feedback[2][side] = 4.0 * a * a * a;
    m_filter.feedback[3][side] = a * a * a * a;
}

void VirtualTubeAmp::ClearMemories() { m_filter.memory = {}; }

template <typename Sample>
void VirtualTubeAmp::FilterTone(Sample* samples, int frames, int channels) {
    const bool left = m_sides[kLeft].ToneOn(), right = channels == 2 && m_sides[kRight].ToneOn();
    if (!left && !right) return;
    ReplaceNonFinite(samples, frames, channels);
    using Lanes = xsimd::batch<double>;
    static_assert(Lanes::size == kSides);
    const auto load = [](const Sides& sides) { return Lanes::load_unaligned(sides.data()); };
    const auto on = TubeShapers::Alternating<Lanes>(left, right) != Lanes(0.0);
    const Lanes gain = load(m_filter.gain), a1 = load(m_filter.feedback[0]), a2 = load(m_filter.feedback[1]),
                a3 = load(m_filter.feedback[2]), a4 = load(m_filter.feedback[3]), four(4.0), six(6.0);
    auto& memory = m_filter.memory;
    Lanes m1 = load(memory[0]), m2 = load(memory[1]), m3 = load(memory[2]), m4 = load(memory[3]);
    for (int i = 0; i < frames; ++i, samples += channels) {
        Sides frame{static_cast<double>(samples[0]), static_cast<double>(samples[channels - 1])};
        const Lanes x = load(frame), u = gain * x, y = u + m1;
        m1 = four * u - a1 * y + m2;
        m2 = six * u - a2 * y + m3;
        m3 = four * u - a3 * y + m4;
        m4 = u - a4 * y;
        xsimd::select(on, y, x).store_unaligned(frame.data());
        for (int c = 0; c < channels; ++c)
            samples[c] = static_cast<Sample>(frame[static_cast<std::size_t>(c)]);
    }
    const Lanes none(0.0);
    xsimd::select(on, m1, none).store_unaligned(memory[0].data());
    xsimd::select(on, m2, none).store_unaligned(memory[1].data());
    xsimd::select(on, m3, none).store_unaligned(memory[2].data());
    xsimd::select(on, m4, none).store_unaligned(memory[3].data());
    if (!AllFinite(memory[0].data(), kSides * memory.size())) ClearMemories();
}

template <typename Sample>
void VirtualTubeAmp::Shape(Sample* samples, int frames, int channels) const {
    const Side &left = m_sides[kLeft], &right = m_sides[channels == 2 ? kRight : kLeft];
    const auto settings = [](const Side& side) {
        const int function = side.drive == 0.0f ? TubeShaping::kNoFunction : side.function;
        return TubeShaping::Side{function, side.boost, side.drive, side.shapeFactor};
    };
    BestTubeKernel<Sample>()(samples, static_cast<std::size_t>(frames) * static_cast<std::size_t>(channels),
                             {{settings(left), settings(right)}});
}

template void VirtualTubeAmp::FilterTone(float*, int, int);
template void VirtualTubeAmp::FilterTone(double*, int, int);
template void VirtualTubeAmp::Shape(float*, int, int) const;
template void VirtualTubeAmp::Shape(double*, int, int) const;

}  // namespace Corvo::DSP
