#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <type_traits>
#include <xsimd/xsimd.hpp>

#include "DSP/Effects/Phaser/PhaserImpl.h"

namespace Corvo::DSP::PhaserKernel {

// Both channels side by side: a chain with feedback is one long dependence, which leaves room for the other
// channel's.
using Pair = xsimd::make_sized_batch_t<double, 2>;

// Brings pairs to the precision of a sample.
template <typename Sample>
struct RoundedByConversion {
    Pair operator()(const Pair& value) const {
        using Doubles [[gnu::vector_size(16)]] = double;
        using Samples [[gnu::vector_size(2 * sizeof(Sample))]] = Sample;
        const auto rounded = __builtin_convertvector(static_cast<Doubles>(value.data), Samples);
        return Pair(__builtin_convertvector(rounded, Doubles));
    }
    static constexpr bool WereAllSure() { return true; }
};

// Brings pairs to the precision of a float by adding half a unit to their bits, in a third of a conversion's
// time. Not sure of numbers half way between two floats, of zeros and outside of a float's normal range.
class RoundedBySum {
public:
    Pair operator()(const Pair& value) {
        const Words sum = xsimd::bitwise_cast<Words>(value) + m_half;
        const Halves halves = xsimd::bitwise_cast<Halves>(sum);
        m_inRange = m_inRange & ((halves & m_magnitude) + m_bias > m_least);
        m_halfWay = m_halfWay | ((halves << 3) == Halves(0));
        return xsimd::bitwise_cast<Pair>(sum & m_kept);
    }
    bool WereAllSure() const { return xsimd::all(m_inRange) && !xsimd::any(m_halfWay); }

private:
    using Words = xsimd::make_sized_batch_t<std::int64_t, 2>;
    using Halves = xsimd::make_sized_batch_t<std::int32_t, 4>;
    // The upper half of a double holds its sign and exponent. With the bias, magnitudes from 2^-125 to 2^128
    // lie above a bound, and larger ones become negative. The lower half may be anything.
    static constexpr std::int32_t kBias = 0x7FFFFFFF - 0x47EFFFFF, kLeast = 0x381FFFFF + kBias;
    static constexpr std::int32_t kAny = std::numeric_limits<std::int32_t>::min();

    const Words m_half = Words(0x10000000), m_kept = Words(~std::int64_t{0x1FFFFFFF});
    const Halves m_magnitude{-1, 0x7FFFFFFF, -1, 0x7FFFFFFF}, m_bias{0, kBias, 0, kBias},
        m_least{kAny, kLeast, kAny, kLeast};
    Halves::batch_bool_type m_inRange = Halves(0) == Halves(0), m_halfWay = Halves(0) != Halves(0);
};

constexpr std::size_t kPiece = SineOscillator::kPiece;
using Piece = std::array<Pair, kPiece>;

struct Chain {
    Pair feedback;
    std::size_t stages;
    Pair last;
    std::array<Pair, PhaserImpl::kMaxStages> memories;

    // Runs `count` frames. False where the rounding was not sure of its results.
    template <typename Rounded>
    bool Run(const Piece& coefficients, const Piece& in, Piece& out, std::size_t count) {
        Rounded rounded;
        Pair u = last;
        for (std::size_t i = 0; i < count; ++i) {
            const Pair a = coefficients[i];
            u = in[i] + feedback * u;
            for (std::size_t stage = 0; stage < stages; ++stage) {
                const Pair y = memories[stage] - a * u;
                memories[stage] = a * y + u;
                u = rounded(y);
            }
            out[i] = u;
        }
        last = u;
        return rounded.WereAllSure();
    }
};

// Where a piece was in doubt, as in silence, the next ones are likely to be so as well.
constexpr int kPiecesAfterDoubt = 15;

template <typename Sample>
void RunPiece(Chain& chain, int& uncertain, const Piece& coefficients, const Piece& in, Piece& out,
              std::size_t count) {
    if constexpr (std::is_same_v<Sample, float>) {
        if (uncertain == 0) {
            const Chain before = chain;
            if (chain.Run<RoundedBySum>(coefficients, in, out, count)) return;
            chain = before;
            uncertain = kPiecesAfterDoubt;
        } else {
            --uncertain;
        }
    }
    chain.Run<RoundedByConversion<Sample>>(coefficients, in, out, count);
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

    std::array<std::array<double, kPiece>, 2> coefficients;
    Piece a, x, u;
    for (std::size_t taken; frames > 0; frames -= static_cast<int>(taken)) {
        taken = std::min(static_cast<std::size_t>(frames), kPiece);
        for (std::size_t c = 0; c < channels; ++c)
            engines[c]->TakeCoefficients(coefficients[c].data(), static_cast<int>(taken));
        for (std::size_t i = 0; i < taken; ++i) {
            const auto at = static_cast<std::ptrdiff_t>(i) * stride;
            a[i] = Pair{coefficients[0][i], coefficients[second][i]};
            x[i] = Pair{static_cast<double>(samples[0][at]), static_cast<double>(samples[second][at])};
        }
        RunPiece<Sample>(chain, engines[0]->uncertain, a, x, u, taken);
        for (std::size_t i = 0; i < taken; ++i) {
            alignas(Pair) double out[2];
            (u[i] * wet + x[i] * dry).store_aligned(out);
            for (std::size_t c = 0; c < channels; ++c) {
                *samples[c] = static_cast<Sample>(out[c]);
                samples[c] += stride;
            }
        }
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
