#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <type_traits>
#include <xsimd/xsimd.hpp>

#include "DSP/Effects/Phaser/PhaserImpl.h"

namespace Corvo::DSP::PhaserKernel {

// Both channels side by side: a chain with feedback is one long dependence, which leaves room for the other
// channel's.
using Pair = xsimd::make_sized_batch_t<double, 2>;

inline Pair Of(double left, double right) { return Pair{left, right}; }

// To the precision of a sample.
template <typename Sample>
Pair Rounded(Pair value) {
    using Doubles [[gnu::vector_size(16)]] = double;
    using Samples [[gnu::vector_size(2 * sizeof(Sample))]] = Sample;
    const auto rounded = __builtin_convertvector(static_cast<Doubles>(value.data), Samples);
    return Pair(__builtin_convertvector(rounded, Doubles));
}

// Runs one or two channels of a block; `stride` is the distance from a channel's sample to its next.
template <typename Sample>
void Run(std::array<PhaserImpl*, 2> engines, std::array<Sample*, 2> samples, int channelCount, int frames,
         std::ptrdiff_t stride) {
    constexpr int kPiece = SineOscillator::kPiece;
    const auto channels = static_cast<std::size_t>(channelCount);
    const auto both = [&](auto field) {
        return Of(engines[0]->*field, channels == 2 ? engines[1]->*field : 0.0);
    };
    const Pair feedback = both(&PhaserImpl::feedback), wet = both(&PhaserImpl::wet),
               dry = both(&PhaserImpl::dry);
    const auto stages = static_cast<std::size_t>(engines[0]->stages);
    std::array<Pair, PhaserImpl::kMaxStages> memories;
    for (std::size_t i = 0; i < stages; ++i)
        memories[i] = Of(engines[0]->memories[i], channels == 2 ? engines[1]->memories[i] : 0.0);
    Pair last = both(&PhaserImpl::last);

    std::array<std::array<double, kPiece>, 2> coefficients{};
    for (int taken; frames > 0; frames -= taken) {
        taken = std::min(frames, kPiece);
        for (std::size_t c = 0; c < channels; ++c)
            engines[c]->TakeCoefficients(coefficients[c].data(), taken);
        for (std::size_t i = 0; i < static_cast<std::size_t>(taken); ++i) {
            const Pair a = Of(coefficients[0][i], coefficients[1][i]);
            const Pair x = Of(*samples[0], channels == 2 ? *samples[1] : Sample(0));
            Pair u = x + feedback * last;
            for (std::size_t stage = 0; stage < stages; ++stage) {
                const Pair y = memories[stage] - a * u;
                memories[stage] = a * y + u;
                u = Rounded<Sample>(y);
            }
            last = u;
            alignas(Pair) double out[2];
            (u * wet + x * dry).store_aligned(out);
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
        keep(memories[i], [i](PhaserImpl& engine) -> double& { return engine.memories[i]; });
    keep(last, [](PhaserImpl& engine) -> double& { return engine.last; });
    for (std::size_t c = 0; c < channels; ++c) engines[c]->template ClearUnlessFinite<Sample>();
}

}  // namespace Corvo::DSP::PhaserKernel
