#pragma once

#include <algorithm>
#include <array>
#include <cmath>
#include <memory>
#include <new>
#include <type_traits>
#include <xsimd/xsimd.hpp>

#include "DSP/Effects/Reverb/ReverbDesign.h"
#include "DSP/Effects/Reverb/ReverbKernel.h"
#include "DSP/Equalizer/BiquadSection.h"
#include "DSP/Parts/PieceRing.h"
#include "Platform/FiniteSamples.h"
#include "Platform/Prefetch.h"
#include "Platform/Processor.h"

namespace Corvo::DSP {

// One channel: its delay lines and memories, and what it is set to at the moment.
template <typename T>
struct ReverbData {
    double w1 = 0.0, w2 = 0.0;  // of the input filter
    PieceRing<T, kReverbStretch> early;
    PieceRing<T> allPass, align;
    std::array<PieceRing<T>, ReverbDesign::kCombs> combs;

    std::array<int, ReverbDesign::kTaps> taps{};  // samples, at least 1
    int offset = 0;
    ReverbLevels<T> levels;
};

// The reverb's processing in one precision. What has no loop runs in long stretches; the loops in pieces no
// longer than the shortest of them, so that no sample of a piece depends on another one of it, except for the
// recursions of the filters.
template <typename T>
class ReverbEngine {
public:
    using Pointers = std::array<T*, 2>;  // one per channel

    // Makes the memory of every setting for up to two channels; what it held is lost. False, with no
    // memory, when there is none.
    bool Prepare(double rate, int channels) {
        if (m_memory && rate == m_rate && channels == m_channels) {
            Clear();
            return true;
        }
        m_rate = rate;
        const ReverbDesign largest = ReverbDesign::Largest(rate);
        const auto& c = largest.channels[0];
        const int align = std::max(largest.longestTap, c.combs[0]);
        int cells = Early::Cells(largest.longestTap + kReverbStretch);
        const auto add = [&](int length) { cells += PieceRing<T>::Cells(length); };
        add(align + kPiece);
        add(largest.allPass);
        for (const int comb : c.combs) add(comb);
        m_channels = 0;
        m_memory.reset(new (std::nothrow) T[static_cast<std::size_t>(cells * channels)]);
        if (!m_memory) return false;
        m_channels = channels;

        T* next = m_memory.get();
        const auto use = [&](auto& ring, int length) {
            ring.Use(next);
            next += ring.Cells(length);
        };
        for (int i = 0; i < channels; ++i) {
            auto& data = m_data[static_cast<std::size_t>(i)];
            data = {};
            use(data.early, largest.longestTap + kReverbStretch);
            use(data.align, align + kPiece);
            use(data.allPass, largest.allPass);
            for (std::size_t k = 0; k < c.combs.size(); ++k) use(data.combs[k], c.combs[k]);
        }
        m_combs = {};
        return true;
    }
    void Free() {
        m_memory.reset();
        m_channels = 0;
    }
    bool IsReady() const { return m_memory != nullptr; }

    void Cook(const ReverbDesign& design, double rate) {
        const auto section = DesignBiquad(EQ_HIGHPASS, 1.0, kFilterHz, kFilterQ, rate);
        m_filters = design.filtersInput && section.IsUsable();
        m_section = section;
        m_reflects = design.longestTap > 0;
        m_shortest = std::min(design.allPass, kPiece);
        for (int i = 0; i < m_channels; ++i) Cook(m_data[static_cast<std::size_t>(i)], design, i);
    }

    void Clear() {
        m_allPassOverflowed = false;
        m_combs.memory = {};
        for (int i = 0; i < m_channels; ++i) {
            auto& data = m_data[static_cast<std::size_t>(i)];
            data.w1 = data.w2 = 0.0;
            data.early.Clear();
            data.allPass.Clear();
            data.align.Clear();
            for (auto& comb : data.combs) comb.Clear();
        }
    }

    // `channels` are the first samples of as many channels as were prepared. What overflows in the loops is
    // cleared at the end.
    void Run(const Pointers& channels, std::ptrdiff_t stride, int frames) {
        for (int done = 0, count; done < frames; done += count) {
            count = std::min(frames - done, kReverbStretch);
            const Pointers at{channels[0] + done * stride,
                              channels[1] ? channels[1] + done * stride : nullptr};
            m_channels == 2 ? RunStretch<2>(at, stride, count) : RunStretch<1>(at, stride, count);
        }
        if (!IsFinite()) Clear();
    }

private:
    static constexpr int kPiece = PieceRing<T>::kPiece;
    static constexpr std::size_t kCombs = ReverbDesign::kCombs;
    static constexpr int kFetches = 4;  // parts of a piece, each with memory to ask for
    static constexpr double kFilterHz = 10.0, kFilterQ = 50.0;
    using Early = PieceRing<T, kReverbStretch>;

    void Cook(ReverbData<T>& data, const ReverbDesign& design, int index) {
        const auto& channel = design.channels[static_cast<std::size_t>(index)];
        data.w1 = data.w2 = 0.0;
        data.early.SetLength(design.longestTap + kReverbStretch);
        data.allPass.SetLength(design.allPass);
        for (std::size_t i = 0; i < kCombs; ++i) {
            data.combs[i].SetLength(channel.combs[i]);
            const std::size_t comb = static_cast<std::size_t>(index) * kCombs + i;
            m_combs.feedback[comb] = static_cast<T>(channel.feedback[i]);
            m_combs.damping[comb] = static_cast<T>(design.damping[i]);
            m_shortest = std::min(m_shortest, channel.combs[i]);
        }
        std::ranges::transform(channel.taps, data.taps.begin(), [](int tap) { return std::max(tap, 1); });
        // The other path's sound must not come out of this one.
        if ((channel.offset < 0) != (data.offset < 0)) data.align.SetLength(0);
        data.offset = channel.offset;
        data.align.SetLength(std::abs(channel.offset) + kPiece);
        data.levels = {static_cast<T>(channel.reflections), static_cast<T>(channel.tail),
                       static_cast<T>(channel.wet), static_cast<T>(channel.dry)};
    }

    // The input filter and the combs keep what is not finite, so their newest values tell. The combs' sum may
    // overflow while each of them is finite: the all-pass is watched on its own.
    bool IsFinite() const {
        return !m_allPassOverflowed && AllFinite(m_combs.memory.data(), m_combs.memory.size()) &&
               std::isfinite(m_data[0].w1) && std::isfinite(m_data[1].w1);
    }

    template <std::size_t Channels>
    void RunStretch(const Pointers& samples, std::ptrdiff_t stride, int frames) {
        // On their way: reflections, tail. The input goes straight to where it is reflected from.
        alignas(64) std::array<std::array<T, kReverbStretch>, 2> early;
        alignas(64) std::array<std::array<T, kPiece>, 2> sum;
        const Pointers reflected{early[0].data(), early[1].data()};
        Pointers from = reflected;
        for (std::size_t c = 0; m_reflects && c < Channels; ++c) from[c] = m_data[c].early.Space();
        Filter<Channels>(samples, stride, frames, from);
        for (std::size_t c = 0; m_reflects && c < Channels; ++c) Reflect(m_data[c], reflected[c], frames);
        for (int done = 0, count; done < frames; done += count) {
            count = std::min(frames - done, m_shortest);
            RunCombs<Channels>({reflected[0] + done, reflected[1] + done}, {sum[0].data(), sum[1].data()},
                               count);
            for (std::size_t c = 0; c < Channels; ++c)
                Output(m_data[c], from[c] + done, reflected[c] + done, sum[c].data(), count);
            if (Channels == 2 && stride == 2 && samples[1] == samples[0] + 1) {
                Interleave(sum[0].data(), sum[1].data(), samples[0] + done * stride, count);
                continue;
            }
            for (std::size_t c = 0; c < Channels; ++c)
                for (int i = 0; i < count; ++i)
                    samples[c][(done + i) * stride] = sum[c][static_cast<std::size_t>(i)];
        }
    }

    static void Interleave(const T* __restrict left, const T* __restrict right, T* __restrict out,
                           int count) {
        for (int i = 0; i < count; ++i) {
            out[2 * i] = left[i];
            out[2 * i + 1] = right[i];
        }
    }

    // Into `in`, while the delay lines' memory is on its way: in a session of many tracks it is in no near
    // cache.
    template <std::size_t Channels>
    void Filter(const std::array<T*, 2>& samples, std::ptrdiff_t stride, int count, const Pointers& in) {
        using Value = std::conditional_t<Channels == 2, xsimd::batch<double, xsimd::sse2>, double>;
        const auto both = [](double first, [[maybe_unused]] double second) {
            if constexpr (Channels == 2)
                return Value{first, second};
            else
                return first;
        };
        const Value b0(m_section.b0), b1(m_section.b1), b2(m_section.b2), a1(m_section.a1), a2(m_section.a2);
        Value w1 = both(m_data[0].w1, m_data[1].w1), w2 = both(m_data[0].w2, m_data[1].w2);
        for (int i = 0; i < count;) {
            const int first = i, piece = std::min(count - i, kPiece);
            for (int part = 0; part < kFetches; ++part) {
                Fetch<Channels>(part, first, piece, first + piece == count);
                const int end = first + piece * (part + 1) / kFetches;
                for (; i < end && !m_filters; ++i)
                    for (std::size_t c = 0; c < Channels; ++c) in[c][i] = samples[c][i * stride];
                for (; i < end; ++i) {
                    const Value x = both(samples[0][i * stride], samples[Channels - 1][i * stride]);
                    const Value w = x - a1 * w1 - a2 * w2, y = b0 * w + b1 * w1 + b2 * w2;
                    w2 = w1;
                    w1 = w;
                    if constexpr (Channels == 2) {
                        in[0][i] = static_cast<T>(y.get(0));
                        in[1][i] = static_cast<T>(y.get(1));
                    } else {
                        in[0][i] = static_cast<T>(y);
                    }
                }
            }
        }
        if constexpr (Channels == 2) {
            m_data[0].w1 = w1.get(0), m_data[1].w1 = w1.get(1);
            m_data[0].w2 = w2.get(0), m_data[1].w2 = w2.get(1);
        } else {
            m_data[0].w1 = w1, m_data[0].w2 = w2;
        }
    }

    // Asks for a part of the memory of the piece that comes `ahead` frames after the present one.
    template <std::size_t Channels>
    [[gnu::always_inline]] void Fetch(int part, int ahead, int count, bool last) const {
        const auto& data = m_data[static_cast<std::size_t>(part) % Channels];
        if (part >= static_cast<int>(2 * Channels)) return;
        if (part >= static_cast<int>(Channels))
            FetchLoops(data, ahead, count, last);
        else if (m_reflects)
            FetchTaps(data, ahead, count, last);
    }
    // What the tap before read is there already.
    [[gnu::always_inline]] static void FetchTaps(const ReverbData<T>& data, int ahead, int count, bool last) {
        int before = 0;
        for (const int tap : data.taps) {
            if (tap - before > ahead) FetchCells(data.early.Ahead(-tap) + ahead, count, last);
            before = tap;
        }
    }
    [[gnu::always_inline]] static void FetchLoops(const ReverbData<T>& data, int ahead, int count,
                                                  bool last) {
        const auto fetch = [=](const auto& ring, int frames) {
            if (ring.Length() >= kReverbStretch) FetchCells(ring.Ahead(frames), count, last);
        };
        for (const auto& comb : data.combs) fetch(comb, ahead);
        if (data.offset == 0) return;
        fetch(data.align, ahead);
        fetch(data.align, ahead - std::abs(data.offset));
    }
    [[gnu::always_inline]] static void FetchCells(const T* cells, int count, bool last) {
        constexpr int kStep = static_cast<int>(kCacheLine / sizeof(T));
        if (count == kPiece)
            for (int i = 0; i < kPiece; i += kStep) Prefetch(cells + i);
        else
            for (int i = 0; i < count; i += kStep) Prefetch(cells + i);
        if (last) Prefetch(cells + count - 1);
    }

    // The input is in its place.
    void Reflect(ReverbData<T>& data, T* early, int count) {
        data.early.Advance(count);
        std::array<const T*, ReverbDesign::kTaps> from;
        for (std::size_t k = 0; k < from.size(); ++k)
            from[k] = data.early.Before(data.taps[k] + count, count);
        m_kernels.reflect(from, early, count);
    }

    template <std::size_t Channels>
    void RunCombs(const std::array<const T*, 2>& early, const Pointers& sum, int count) {
        std::array<T*, CombBank<T>::kMost> cells;
        for (std::size_t k = 0; k < Channels * kCombs; ++k)
            cells[k] = m_data[k / kCombs].combs[k % kCombs].MakeReady(count);
        m_kernels.combs(m_combs, cells.data(), early, sum, Channels, count);
        for (std::size_t c = 0; c < Channels; ++c)
            for (auto& comb : m_data[c].combs) comb.Advance(count);
    }

    // From the combs' sum to the finished samples, in place.
    void Output(ReverbData<T>& data, const T* in, const T* early, T* sum, int count) {
        m_allPassOverflowed |= !m_kernels.allPass(data.allPass.MakeReady(count), sum, count);
        data.allPass.Advance(count);
        const T* tail = sum;
        if (data.offset != 0) {
            const T*& waits = data.offset > 0 ? tail : early;
            data.align.Push(waits, count);
            waits = data.align.Before(std::abs(data.offset) + count, count);
        }
        m_kernels.mix(data.levels, in, early, tail, sum, count);
    }

    const ReverbKernels<T>& m_kernels = HasAvx2() ? Avx2ReverbKernels<T>() : BaselineReverbKernels<T>();
    std::unique_ptr<T[]> m_memory;
    double m_rate = 0.0;
    int m_channels = 0;
    int m_shortest = 1;  // frames that a piece may have
    std::array<ReverbData<T>, 2> m_data;
    CombBank<T> m_combs;
    BiquadSection m_section{};
    bool m_filters = false, m_reflects = false;
    bool m_allPassOverflowed = false;  // in this block
};

}  // namespace Corvo::DSP
