#pragma once

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <type_traits>
#include <xsimd/xsimd.hpp>

#include "DSP/Effects/Phaser/PhaserImpl.h"

namespace Corvo::DSP::PhaserKernel {

// Both channels side by side: a chain with feedback is one long dependence, which leaves room for the other
// channel's.
using Pair = xsimd::make_sized_batch_t<double, 2>;
using Words = xsimd::make_sized_batch_t<std::int64_t, 2>;
using Floats = xsimd::make_sized_batch_t<float, 4>;  // the first two count

inline Floats ToFloats(Pair value) { return _mm_cvtpd_ps(value.data); }
inline Pair ToDoubles(Floats value) { return _mm_cvtps_pd(value.data); }

// Brings pairs to the precision of a sample.
template <typename Sample>
struct RoundedByConversion {
    Pair operator()(Pair value) const {
        if constexpr (std::is_same_v<Sample, float>) return ToDoubles(ToFloats(value));
        return value;
    }
};

// Brings pairs to the precision of a float by adding half a unit to their bits, in a third of a conversion's
// time. The conversion runs beside it, and nothing waits for its result. That is another one half way between
// two floats and outside of a float's normal range.
class RoundedBySum {
public:
    Pair operator()(Pair value) {
        const Words sum = (xsimd::bitwise_cast<Words>(value) + m_half) & m_kept;
        const Pair converted = RoundedByConversion<float>()(value);
        m_different = m_different | (sum ^ xsimd::bitwise_cast<Words>(converted));
        return xsimd::bitwise_cast<Pair>(sum);
    }
    bool WereAllSure() const { return xsimd::all(m_different == Words(0)); }

private:
    const Words m_half = Words(0x10000000), m_kept = Words(~std::int64_t{0x1FFFFFFF});
    Words m_different = Words(0);
};

// What both channels' sines make of the all-passes' coefficients.
class Sweep {
public:
    Sweep(const PhaserImpl& left, const PhaserImpl& right)
        : m_minimum{left.minimum, right.minimum},
          m_maximum{left.maximum, right.maximum},
          m_range(m_maximum - m_minimum) {}
    Pair Frequencies(Pair sines) const { return (sines + 1.0) * 0.5 * m_range + m_minimum; }
    // By how much an error of the sines may move these.
    Pair Doubt() const { return 1e-13 * xsimd::abs(m_range) + 1e-15 * (m_maximum + m_minimum); }
    static Pair Coefficients(Floats frequencies) {
        return ToDoubles((1.0f - frequencies) / (1.0f + frequencies));
    }

private:
    const Pair m_minimum, m_maximum, m_range;
};

// The coefficients of a piece of the oscillators: the floats that the library's sines give, to the bit. The
// sines are turned here by known angles, and it is not sure of them where an error of those would show.
class TurnedCoefficients {
public:
    TurnedCoefficients(const Sweep& sweep, const SineOscillator& left, const SineOscillator& right)
        : m_sweep(sweep),
          m_doubt(sweep.Doubt()),
          m_sines{std::sin(left.Phase()), std::sin(right.Phase())},
          m_cosines{std::cos(left.Phase()), std::cos(right.Phase())},
          m_turnedSines(left.TurnedSines()),
          m_turnedCosines(left.TurnedCosines()) {}
    Pair operator()(std::size_t i) {
        const Pair frequencies =
            m_sweep.Frequencies(m_sines * m_turnedCosines[i] + m_cosines * m_turnedSines[i]);
        const Floats low = ToFloats(frequencies - m_doubt), high = ToFloats(frequencies + m_doubt);
        m_different = m_different | (low ^ high);
        return Sweep::Coefficients(low);
    }
    bool WereAllSure() const { return xsimd::all(xsimd::bitwise_cast<Words>(m_different) == Words(0)); }

private:
    const Sweep m_sweep;
    const Pair m_doubt, m_sines, m_cosines;
    const double *m_turnedSines, *m_turnedCosines;
    Floats m_different = Floats(0.0f);
};

// The same from the library's sines, one frame after the other.
class LibraryCoefficients {
public:
    LibraryCoefficients(const Sweep& sweep, const SineOscillator& left, const SineOscillator& right)
        : m_sweep(sweep), m_phases{left.Phase(), right.Phase()}, m_increment(left.Increment()) {}
    Pair Next() {
        const Pair sines{std::sin(m_phases[0]), std::sin(m_phases[1])};
        for (double& phase : m_phases) phase += m_increment;
        return Sweep::Coefficients(ToFloats(m_sweep.Frequencies(sines)));
    }

private:
    const Sweep m_sweep;
    std::array<double, 2> m_phases;
    const double m_increment;
};

// Where a piece was in doubt, as in silence, the next ones are likely to be so as well.
constexpr int kPiecesAfterDoubt = 15;

struct Chain {
    Pair feedback;
    std::size_t stages;
    Pair last;
    std::array<Pair, PhaserImpl::kMaxStages> memories;

    template <typename Rounded>
    Pair Next(Pair in, Pair a, Rounded& rounded) {
        Pair u = in + feedback * last;
        for (std::size_t stage = 0; stage < stages; ++stage) {
            const Pair y = memories[stage] - a * u;
            memories[stage] = a * y + u;
            u = rounded(y);
        }
        return last = u;
    }
};

// Steps both oscillators up to `frames` times, but none over the end of its cycle. Returns how often.
inline int StepTogether(SineOscillator& left, SineOscillator& right, int frames) {
    const double before = left.Phase();
    const int taken = left.StepWithin(PhaserImpl::kCycle, frames);
    if (&left == &right) return taken;
    const int both = right.StepWithin(PhaserImpl::kCycle, taken);
    if (both < taken) {
        left.SetPhase(before);
        left.StepWithin(PhaserImpl::kCycle, both);
    }
    return both;
}

// Runs one or two channels of a block; `stride` is the distance from a channel's sample to its next. A single
// channel takes both halves of the pairs.
template <typename Sample>
void Run(std::array<PhaserImpl*, 2> engines, std::array<Sample*, 2> samples, int channelCount, int frames,
         std::ptrdiff_t stride) {
    const auto channels = static_cast<std::size_t>(channelCount), second = channels - 1;
    const auto both = [&](auto field) { return Pair{engines[0]->*field, engines[second]->*field}; };
    const Pair wet = both(&PhaserImpl::wet), dry = both(&PhaserImpl::dry);
    const auto stages = static_cast<std::size_t>(engines[0]->stages);
    Chain chain{both(&PhaserImpl::feedback), stages, both(&PhaserImpl::last), {}};
    for (std::size_t i = 0; i < stages; ++i)
        chain.memories[i] = Pair{engines[0]->memories[i], engines[second]->memories[i]};

    std::array<Pair, SineOscillator::kPiece> in;
    const auto take = [&](std::size_t i) {
        const auto at = static_cast<std::ptrdiff_t>(i) * stride;
        return in[i] = Pair{static_cast<double>(samples[0][at]), static_cast<double>(samples[second][at])};
    };
    const auto give = [&](std::size_t i, Pair out) {
        alignas(Pair) double mixed[2];
        (out * wet + in[i] * dry).store_aligned(mixed);
        for (std::size_t c = 0; c < channels; ++c)
            samples[c][static_cast<std::ptrdiff_t>(i) * stride] = static_cast<Sample>(mixed[c]);
    };
    // The next coefficient and what goes in and out do not wait for the chain, so that all run beside it.
    const auto run = [&](std::size_t count, auto& coefficients, auto& rounded) {
        Pair a = coefficients(0);
        for (std::size_t i = 0; i < count; ++i) {
            const Pair next = coefficients(i + 1);
            give(i, chain.Next(take(i), a, rounded));
            a = next;
        }
    };
    SineOscillator &left = engines[0]->oscillator, &right = engines[second]->oscillator;
    const Sweep sweep(*engines[0], *engines[second]);
    int& uncertain = engines[0]->uncertain;
    for (int taken; frames > 0; frames -= taken) {
        TurnedCoefficients turned(sweep, left, right);
        LibraryCoefficients exact(sweep, left, right);
        taken = StepTogether(left, right, std::min(frames, SineOscillator::kPiece));
        const auto count = static_cast<std::size_t>(taken);
        const Chain before = chain;
        RoundedByConversion<Sample> converted;
        RoundedBySum summed;
        if (std::is_same_v<Sample, float> && uncertain == 0) {
            run(count, turned, summed);
            if (!summed.WereAllSure()) uncertain = kPiecesAfterDoubt;
        } else {
            run(count, turned, converted);
            uncertain = std::max(uncertain - 1, 0);
        }
        if (!summed.WereAllSure() || !turned.WereAllSure()) {
            chain = before;
            for (std::size_t i = 0; i < count; ++i) give(i, chain.Next(in[i], exact.Next(), converted));
        }
        for (std::size_t c = 0; c < channels; ++c) samples[c] += taken * stride;
    }
    const auto keep = [&](Pair value, auto member) {
        alignas(Pair) double lanes[2];
        value.store_aligned(lanes);
        for (std::size_t c = 0; c < channels; ++c) member(*engines[c]) = lanes[c];
    };
    for (std::size_t i = 0; i < stages; ++i)
        keep(chain.memories[i], [i](PhaserImpl& engine) -> double& { return engine.memories[i]; });
    keep(chain.last, [](PhaserImpl& engine) -> double& { return engine.last; });
    for (std::size_t c = 0; c < channels; ++c) engines[c]->template ClearUnlessFinite<Sample>();
}

}  // namespace Corvo::DSP::PhaserKernel
