#pragma once

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <type_traits>
#include <xsimd/xsimd.hpp>

#include "DSP/Effects/Echo/Echo.h"
#include "Platform/Prefetch.h"

namespace Corvo::DSP {

namespace EchoPrivate {

// What one side does to its samples: linear factors.
struct Side {
    double feedback, echo, wet, dry, output;
};

// The part of the ring that a side runs through. Its memory comes as it is: from `written` on the line counts
// as silent, and a page of it is touched when the sound gets there.
struct Line {
    float* ring = nullptr;
    int length = 0, position = 0, written = 0;

    // The next samples of the line, made 0 where nothing was written yet.
    float* MakeReady(int frames) {
        if (position + frames > written) Write(position + frames);
        return ring + position;
    }
    void Silence() {
        std::fill_n(ring, position, 0.0f);
        written = position;
    }
    // At least 1: a position that a shortened delay left beyond the end is used once before it wraps.
    int UntilWrap() const { return position < length ? length - position : 1; }
    void Advance(int frames) {
        position += frames;
        if (position >= length) position = 0;
    }

private:
    void Write(int end) {
        std::fill(ring + written, ring + end, 0.0f);
        written = end;
    }
};

struct Delay {
    std::array<Side, 2> sides{};
    std::array<Line, 2> lines{};
};

}  // namespace EchoPrivate

// Both run over samples between two wraps of the ring, so that none reads what another one wrote. They return
// whether any of them may be infinite or NaN: what is so in the ring shows in the output when its time comes.

template <typename Sample>
bool RunEchoSide(const EchoPrivate::Side& side, Sample* samples, std::ptrdiff_t stride, int frames,
                 float* ring) {
    const auto s = side;
    bool finite = true;
    for (int i = 0; i < frames; ++i, samples += stride) {
        const double delayed = ring[i], in = *samples, back = delayed * s.feedback;
        ring[i] = static_cast<float>(back + in);
        *samples = static_cast<Sample>(((delayed * s.echo + back) * s.wet + in * s.dry) * s.output);
        finite &= std::isfinite(ring[i]);
        finite &= std::isfinite(*samples);
    }
    return !finite;
}

// A frame of two doubles, left and right, in one register.
namespace EchoFrames {

using Frame = xsimd::batch<double, xsimd::sse2>;
using Floats = xsimd::batch<float, xsimd::sse2>;

inline Frame Low(Floats two) { return _mm_cvtps_pd(two); }
inline Frame High(Floats two) { return _mm_cvtps_pd(_mm_movehl_ps(two, two)); }
inline Floats Joined(Frame low, Frame high) { return _mm_movelh_ps(_mm_cvtpd_ps(low), _mm_cvtpd_ps(high)); }
inline Floats Lefts(Floats a, Floats b) { return _mm_shuffle_ps(a, b, _MM_SHUFFLE(2, 0, 2, 0)); }
inline Floats Rights(Floats a, Floats b) { return _mm_shuffle_ps(a, b, _MM_SHUFFLE(3, 1, 3, 1)); }

inline std::array<Frame, 4> Load(const float* samples) {
    const auto a = Floats::load_unaligned(samples), b = Floats::load_unaligned(samples + 4);
    return {Low(a), High(a), Low(b), High(b)};
}
inline std::array<Frame, 4> Load(const double* samples) {
    return {Frame::load_unaligned(samples), Frame::load_unaligned(samples + 2),
            Frame::load_unaligned(samples + 4), Frame::load_unaligned(samples + 6)};
}
inline void Store(float* samples, const std::array<Frame, 4>& frames, Floats& bits) {
    const Floats a = Joined(frames[0], frames[1]), b = Joined(frames[2], frames[3]);
    bits = bits | a | b;
    a.store_unaligned(samples);
    b.store_unaligned(samples + 4);
}
// Doubles hold whatever floats of the ring can make.
inline void Store(double* samples, const std::array<Frame, 4>& frames, Floats&) {
    for (std::size_t i = 0; i < 4; ++i) frames[i].store_unaligned(samples + 2 * i);
}

// The bits of many samples over each other may look like it when none of them is.
inline bool MayBeInfinite(Floats bits) {
    const auto exponent = _mm_set1_epi32(0x7F800000);
    const auto words = _mm_and_si128(_mm_castps_si128(bits), exponent);
    return _mm_movemask_ps(_mm_castsi128_ps(_mm_cmpeq_epi32(words, exponent))) != 0;
}
}  // namespace EchoFrames

// Interleaved stereo: both sides together, four frames at a time. The results are RunEchoSide's.
template <typename Sample>
bool RunEchoPair(const std::array<EchoPrivate::Side, 2>& sides, Sample* samples, int frames, float* left,
                 float* right) {
    using namespace EchoFrames;
    const auto both = [&](double EchoPrivate::Side::*factor) {
        return Frame{sides[0].*factor, sides[1].*factor};
    };
    using EchoPrivate::Side;
    const Frame feedback = both(&Side::feedback), echo = both(&Side::echo), wet = both(&Side::wet),
                dry = both(&Side::dry), output = both(&Side::output);
    Floats bits(0.0f);
    // The line's memory is asked for so many frames ahead: in a session of many tracks no near cache holds
    // it.
    constexpr int kAhead = 128, kStep = static_cast<int>(kCacheLine / sizeof(float));
    const auto ask = [=](int at) __attribute__((always_inline)) {
        Prefetch(left + at);
        Prefetch(right + at);
    };
    for (int at = 0; at < std::min(frames, kAhead); at += kStep) ask(at);
    if (frames > 0) ask(frames - 1);
    int i = 0;
    for (; i + 4 <= frames; i += 4, samples += 8) {
        if (i % kStep == 0 && i + kAhead < frames) ask(i + kAhead);
        const auto l = Floats::load_unaligned(left + i), r = Floats::load_unaligned(right + i);
        const auto first = xsimd::zip_lo(l, r), second = xsimd::zip_hi(l, r);
        const std::array<Frame, 4> delayed{Low(first), High(first), Low(second), High(second)};
        auto in = Load(samples);
        std::array<Frame, 4> kept;
        for (std::size_t k = 0; k < 4; ++k) {
            const Frame back = delayed[k] * feedback;
            kept[k] = back + in[k];
            in[k] = ((delayed[k] * echo + back) * wet + in[k] * dry) * output;
        }
        const Floats a = Joined(kept[0], kept[1]), b = Joined(kept[2], kept[3]);
        if constexpr (std::is_same_v<Sample, double>) bits = bits | a | b;
        Lefts(a, b).store_unaligned(left + i);
        Rights(a, b).store_unaligned(right + i);
        Store(samples, in, bits);
    }
    bool doubtful = MayBeInfinite(bits);
    doubtful |= RunEchoSide(sides[0], samples, 2, frames - i, left + i);
    doubtful |= RunEchoSide(sides[1], samples + 1, 2, frames - i, right + i);
    return doubtful;
}

}  // namespace Corvo::DSP
