#pragma once

#include <algorithm>
#include <array>
#include <cmath>
#include <memory>
#include <new>

#include "DSP/Effects/Reverb/ReverbDesign.h"
#include "DSP/Effects/Reverb/ReverbKernel.h"
#include "DSP/Equalizer/BiquadSection.h"
#include "DSP/Parts/PieceRing.h"
#include "Platform/FiniteSamples.h"
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
        // On their way: input, reflections, tail.
        alignas(64) std::array<std::array<T, kReverbStretch>, 2> in, early;
        alignas(64) std::array<std::array<T, kPiece>, 2> sum;
        const Pointers from{in[0].data(), in[1].data()}, reflected{early[0].data(), early[1].data()};
        Filter<Channels>(samples, stride, frames, from);
        for (std::size_t c = 0; c < Channels; ++c) Reflect(m_data[c], from[c], reflected[c], frames);
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

    template <std::size_t Channels>
    void Filter(const std::array<T*, 2>& samples, std::ptrdiff_t stride, int count, const Pointers& in) {
        if (!m_filters) {
            for (std::size_t c = 0; c < Channels; ++c)
                for (int i = 0; i < count; ++i) in[c][i] = samples[c][i * stride];
            return;
        }
        const auto s = m_section;
        std::array<double, Channels> w1, w2;
        for (std::size_t c = 0; c < Channels; ++c) w1[c] = m_data[c].w1, w2[c] = m_data[c].w2;
        for (int i = 0; i < count; ++i)
            for (std::size_t c = 0; c < Channels; ++c) {
                const double w = samples[c][i * stride] - s.a1 * w1[c] - s.a2 * w2[c];
                in[c][i] = static_cast<T>(s.b0 * w + s.b1 * w1[c] + s.b2 * w2[c]);
                w2[c] = w1[c];
                w1[c] = w;
            }
        for (std::size_t c = 0; c < Channels; ++c) m_data[c].w1 = w1[c], m_data[c].w2 = w2[c];
    }

    void Reflect(ReverbData<T>& data, const T* in, T* early, int count) {
        if (!m_reflects) {
            std::copy_n(in, count, early);
            return;
        }
        data.early.Push(in, count);
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
    void Output(ReverbData<T>& data, const T* in, T* early, T* sum, int count) {
        m_allPassOverflowed |= !m_kernels.allPass(data.allPass.MakeReady(count), sum, count);
        data.allPass.Advance(count);
        if (data.offset != 0) {
            T* const waits = data.offset > 0 ? sum : early;
            data.align.Push(waits, count);
            std::copy_n(data.align.Before(std::abs(data.offset) + count, count), count, waits);
        }
        m_kernels.mix(data.levels, in, early, sum, count);
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
