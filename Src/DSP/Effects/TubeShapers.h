#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <xsimd/xsimd.hpp>

// The shaping functions of the tube distortion, on whole registers.
namespace Corvo::DSP::TubeShapers {

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

// Replaces every register of interleaved samples, in place; what is left at the end goes through a copy.
template <typename Sample, typename Change>
void ForEachRegister(Sample* samples, std::size_t count, Change change) {
    using Lanes = xsimd::batch<Sample>;
    std::size_t i = 0;
    for (; i + Lanes::size <= count; i += Lanes::size)
        change(Lanes::load_unaligned(samples + i)).store_unaligned(samples + i);
    if (i == count) return;
    std::array<Sample, Lanes::size> rest{};
    std::copy(samples + i, samples + count, rest.begin());
    change(Lanes::load_unaligned(rest.data())).store_unaligned(rest.data());
    std::copy_n(rest.begin(), count - i, samples + i);
}

}  // namespace Corvo::DSP::TubeShapers
