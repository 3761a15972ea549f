#pragma once

#include <xsimd/xsimd.hpp>

#include "DSP/Effects/Tube/TubeKernel.h"

// The shaping functions of the tube distortion, on whole registers. Private to each source file that includes
// it: those files are compiled for different processors and must not share code.
namespace Corvo::DSP::TubeShapers {
namespace {

template <typename Lanes>
Lanes Clamped(const Lanes& x) {
    return xsimd::max(xsimd::min(x, Lanes(1)), Lanes(-1));
}

// What a side's shaping needs, lane by lane.
template <typename Lanes>
struct Settings {
    Lanes boost, drive, shapeFactor;
};

struct Bypass {
    template <typename Lanes>
    static Lanes Apply(const Lanes& x, const Settings<Lanes>&) {
        return x;
    }
};

struct Martens {
    template <typename Lanes>
    static Lanes Apply(const Lanes& sample, const Settings<Lanes>& s) {
        const Lanes x = Clamped(sample);
        return (s.shapeFactor + Lanes(1)) * x / (s.shapeFactor * xsimd::abs(x) + Lanes(1));
    }
};

struct DoidicS {
    template <typename Lanes>
    static Lanes Apply(const Lanes& sample, const Settings<Lanes>& s) {
        const Lanes x = Clamped((Lanes(5) * s.drive + Lanes(1)) * sample);
        const Lanes size = xsimd::abs(x);
        return xsimd::copysign(Lanes(2) * size - x * x, x);
    }
};

// A triode's asymmetry: a steep negative side, a short positive one that saturates early.
struct DoidicA {
    template <typename Lanes>
    static Lanes Apply(const Lanes& sample, const Settings<Lanes>&) {
        using Value = typename Lanes::value_type;
        const auto number = [](double value) { return Lanes(static_cast<Value>(value)); };
        const Lanes x = Clamped(Lanes(6) * sample);
        const Lanes t = -x - number(0.032847);
        const Lanes left = Lanes(1) - t, left2 = left * left, left4 = left2 * left2;
        const Lanes negative =
            number(-0.75) * (Lanes(1) - left4 * left4 * left4 + t / Lanes(3)) + number(0.01);
        const Lanes middle = number(3.9375) * x - number(6.153) * x * x;
        const Lanes upper = xsimd::select(x > number(0.320018), number(0.630035), middle);
        return xsimd::select(x <= number(-0.08905), negative, upper);
    }
};

struct ArayaS {
    template <typename Lanes>
    static Lanes Apply(const Lanes& sample, const Settings<Lanes>& s) {
        Lanes y = Clamped(sample);
        for (const double from : {0.25, 0.5, 0.75}) {
            const auto more = s.drive >= Lanes(static_cast<typename Lanes::value_type>(from));
            if (xsimd::none(more)) break;
            y = xsimd::select(
                more,
                y * (Lanes(typename Lanes::value_type(1.5)) - Lanes(typename Lanes::value_type(0.5)) * y * y),
                y);
        }
        return y;
    }
};

// Calls `call` with the shaper of a function.
template <typename Call>
void WithShaper(int function, Call&& call) {
    switch (function) {
        case 0:
            return call(Martens{});
        case 1:
            return call(DoidicS{});
        case 2:
            return call(DoidicA{});
        case 3:
            return call(ArayaS{});
        default:
            return call(Bypass{});
    }
}

// The left value in the even lanes, the right one in the odd ones.
template <typename Lanes>
Lanes Alternating(float left, float right) {
    using Value = typename Lanes::value_type;
    alignas(Lanes) Value lanes[Lanes::size];
    for (std::size_t i = 0; i < Lanes::size; ++i) lanes[i] = static_cast<Value>(i % 2 == 0 ? left : right);
    return Lanes::load_aligned(lanes);
}

// Replaces every register of interleaved samples, in place; what is left at the end goes through a copy.
template <typename Lanes, typename Change>
void ForEachRegister(typename Lanes::value_type* samples, std::size_t count, const Change& change) {
    std::size_t i = 0;
    for (; i + Lanes::size <= count; i += Lanes::size)
        change(Lanes::load_unaligned(samples + i)).store_unaligned(samples + i);
    if (i == count) return;
    alignas(Lanes) typename Lanes::value_type rest[Lanes::size] = {};
    for (std::size_t j = i; j < count; ++j) rest[j - i] = samples[j];
    change(Lanes::load_aligned(rest)).store_aligned(rest);
    for (std::size_t j = i; j < count; ++j) samples[j] = rest[j - i];
}

template <typename Sample, typename Arch>
void Shape(Sample* samples, std::size_t count, const TubeShaping& shaping) {
    using Lanes = xsimd::batch<Sample, Arch>;
    const auto& left = shaping.sides[0];
    const auto& right = shaping.sides[1];
    // By value everywhere: behind a reference the compiler would read them again after every store.
    const Settings<Lanes> settings{Alternating<Lanes>(left.boost, right.boost),
                                   Alternating<Lanes>(left.drive, right.drive),
                                   Alternating<Lanes>(left.shapeFactor, right.shapeFactor)};
    if (left.function == right.function)
        return WithShaper(left.function, [=]<typename Shaper>(Shaper) {
            ForEachRegister<Lanes>(samples, count, [settings](const Lanes& x) {
                return Shaper::Apply(x * settings.boost, settings);
            });
        });
    // Sides that differ go one after the other, each with the other's lanes left alone.
    for (const bool ofLeft : {true, false}) {
        const auto side = Alternating<Lanes>(ofLeft, !ofLeft) != Lanes(Sample(0));
        WithShaper((ofLeft ? left : right).function, [=]<typename Shaper>(Shaper) {
            ForEachRegister<Lanes>(samples, count, [settings, side](const Lanes& x) {
                return xsimd::select(side, Shaper::Apply(x * settings.boost, settings), x);
            });
        });
    }
}

}  // namespace
}  // namespace Corvo::DSP::TubeShapers
