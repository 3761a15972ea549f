#pragma once

#include <array>
#include <memory>
#include <new>
#include <xsimd/xsimd.hpp>

#include "DSP/Effects/Reverb/ReverbDesign.h"
#include "DSP/Equalizer/BiquadSection.h"
#include "DSP/Parts/PieceRing.h"
#include "Platform/FiniteSamples.h"

namespace Corvo::DSP {

// Transposes 4 by 4: from one register per comb to one per frame, and back.
inline void Transpose(std::array<xsimd::batch<float, xsimd::sse2>, 4>& v) {
    const auto a = xsimd::zip_lo(v[0], v[2]), b = xsimd::zip_hi(v[0], v[2]);
    const auto c = xsimd::zip_lo(v[1], v[3]), d = xsimd::zip_hi(v[1], v[3]);
    v = {xsimd::zip_lo(a, c), xsimd::zip_hi(a, c), xsimd::zip_lo(b, d), xsimd::zip_hi(b, d)};
}
inline void Transpose(std::array<xsimd::batch<double, xsimd::sse2>, 2>& v) {
    v = {xsimd::zip_lo(v[0], v[1]), xsimd::zip_hi(v[0], v[1])};
}

// One channel: its delay lines and memories, and the gains of the moment.
template <typename T>
struct ReverbData {
    double w1 = 0.0, w2 = 0.0;  // of the input filter
    PieceRing<T> early, allPass, align;
    std::array<PieceRing<T>, ReverbDesign::kCombs> combs;
    std::array<T, ReverbDesign::kCombs> memory{};  // of the combs' damping

    std::array<int, ReverbDesign::kTaps> taps{};  // samples, at least 1
    std::array<T, ReverbDesign::kCombs> feedback{};
    int offset = 0;
    T reflections{}, tail{}, wet{}, dry{};
};

// The reverb's processing in one precision, in pieces no longer than the shortest loop, so that no sample
// of a piece depends on another one of it, except for the recursions of the filters.
template <typename T>
class ReverbEngine {
public:
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
        int cells = 0;
        const auto add = [&](int length) { cells += PieceRing<T>::Cells(length); };
        add(largest.longestTap + kPiece);
        add(align + kPiece);
        add(largest.allPass);
        for (const int comb : c.combs) add(comb);
        m_channels = 0;
        m_memory.reset(new (std::nothrow) T[static_cast<std::size_t>(cells * channels)]);
        if (!m_memory) return false;
        m_channels = channels;

        T* next = m_memory.get();
        const auto use = [&](PieceRing<T>& ring, int length) {
            ring.Use(next);
            next += PieceRing<T>::Cells(length);
        };
        for (int i = 0; i < channels; ++i) {
            auto& data = m_data[static_cast<std::size_t>(i)];
            data = {};
            use(data.early, largest.longestTap + kPiece);
            use(data.align, align + kPiece);
            use(data.allPass, largest.allPass);
            for (std::size_t k = 0; k < c.combs.size(); ++k) use(data.combs[k], c.combs[k]);
        }
        // Touches all of it, so that no later edit waits for pages.
        std::fill(m_memory.get(), next, T(0));
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
        std::ranges::copy(design.damping, m_damping.begin());
        for (int i = 0; i < m_channels; ++i) Cook(m_data[static_cast<std::size_t>(i)], design, i);
    }

    void Clear() {
        m_allPassOverflowed = false;
        for (int i = 0; i < m_channels; ++i) {
            auto& data = m_data[static_cast<std::size_t>(i)];
            data.w1 = data.w2 = 0.0;
            data.memory = {};
            data.early.Clear();
            data.allPass.Clear();
            data.align.Clear();
            for (auto& comb : data.combs) comb.Clear();
        }
    }

    // `channels` are the first samples of as many channels as were prepared. What overflows in the loops is
    // cleared at the end.
    void Run(const std::array<T*, 2>& channels, std::ptrdiff_t stride, int frames) {
        for (int done = 0; done < frames;) {
            const int count = std::min(frames - done, m_shortest);
            const std::array<T*, 2> at{channels[0] + done * stride,
                                       channels[1] ? channels[1] + done * stride : nullptr};
            m_channels == 2 ? RunPiece<2>(at, stride, count) : RunPiece<1>(at, stride, count);
            done += count;
        }
        if (!IsFinite()) Clear();
    }

private:
    static constexpr int kPiece = PieceRing<T>::kPiece;
    static constexpr std::size_t kCombs = ReverbDesign::kCombs;
    static constexpr double kFilterHz = 10.0, kFilterQ = 50.0;
    using Lanes = xsimd::batch<T, xsimd::sse2>;
    using Piece = std::array<T, kPiece>;
    using Pieces = std::array<Piece, 2>;  // one per channel

    void Cook(ReverbData<T>& data, const ReverbDesign& design, int index) {
        const auto& channel = design.channels[static_cast<std::size_t>(index)];
        data.w1 = data.w2 = 0.0;
        data.early.SetLength(design.longestTap + kPiece);
        data.allPass.SetLength(design.allPass);
        for (std::size_t i = 0; i < kCombs; ++i) {
            data.combs[i].SetLength(channel.combs[i]);
            data.feedback[i] = static_cast<T>(channel.feedback[i]);
            m_shortest = std::min(m_shortest, channel.combs[i]);
        }
        std::ranges::transform(channel.taps, data.taps.begin(), [](int tap) { return std::max(tap, 1); });
        // The other path's sound must not come out of this one.
        if ((channel.offset < 0) != (data.offset < 0)) data.align.SetLength(0);
        data.offset = channel.offset;
        data.align.SetLength(std::abs(channel.offset) + kPiece);
        data.reflections = static_cast<T>(channel.reflections);
        data.tail = static_cast<T>(channel.tail);
        data.wet = static_cast<T>(channel.wet);
        data.dry = static_cast<T>(channel.dry);
    }

    // The input filter and the combs keep what is not finite, so their newest values tell. The combs' sum may
    // overflow while each of them is finite: the all-pass is watched on its own.
    bool IsFinite() const {
        return !m_allPassOverflowed && std::ranges::all_of(m_data, [](const ReverbData<T>& data) {
            return std::isfinite(data.w1) && AllFinite(data.memory.data(), kCombs);
        });
    }

    template <std::size_t Channels>
    void RunPiece(const std::array<T*, 2>& samples, std::ptrdiff_t stride, int count) {
        auto& [in, early, sum] = m_pieces;
        Filter<Channels>(samples, stride, count, in);
        for (std::size_t c = 0; c < Channels; ++c) Reflect(m_data[c], in[c], early[c], count);
        RunCombs<Channels>(early, sum, count);
        for (std::size_t c = 0; c < Channels; ++c) {
            T* const out = samples[c];
            Output(m_data[c], in[c], early[c], sum[c], count);
            for (int i = 0; i < count; ++i) out[i * stride] = sum[c][static_cast<std::size_t>(i)];
        }
    }

    template <std::size_t Channels>
    void Filter(const std::array<T*, 2>& samples, std::ptrdiff_t stride, int count, Pieces& in) {
        if (!m_filters) {
            for (std::size_t c = 0; c < Channels; ++c)
                for (int i = 0; i < count; ++i) in[c][static_cast<std::size_t>(i)] = samples[c][i * stride];
            return;
        }
        const auto s = m_section;
        std::array<double, Channels> w1, w2;
        for (std::size_t c = 0; c < Channels; ++c) w1[c] = m_data[c].w1, w2[c] = m_data[c].w2;
        for (int i = 0; i < count; ++i)
            for (std::size_t c = 0; c < Channels; ++c) {
                const double w = samples[c][i * stride] - s.a1 * w1[c] - s.a2 * w2[c];
                in[c][static_cast<std::size_t>(i)] = static_cast<T>(s.b0 * w + s.b1 * w1[c] + s.b2 * w2[c]);
                w2[c] = w1[c];
                w1[c] = w;
            }
        for (std::size_t c = 0; c < Channels; ++c) m_data[c].w1 = w1[c], m_data[c].w2 = w2[c];
    }

    void Reflect(ReverbData<T>& data, const Piece& in, Piece& early, int count) {
        if (!m_reflects) {
            std::copy_n(in.begin(), count, early.begin());
            return;
        }
        std::copy_n(in.begin(), count, data.early.Here());
        data.early.Advance(count);
        std::array<const T*, ReverbDesign::kTaps> from;
        for (std::size_t k = 0; k < from.size(); ++k) from[k] = data.early.Before(data.taps[k] + count);
        int i = 0;
        const auto sum = [&]<typename Value>(Value, auto load) {
            Value total(T(0));
            for (std::size_t k = 0; k < from.size(); ++k)
                total = total + Value(static_cast<T>(ReverbDesign::kReflections[k].gain)) * load(from[k] + i);
            return total;
        };
        for (; i + kLanes <= count; i += kLanes)
            sum(Lanes(), [](const T* at) {
                return Lanes::load_unaligned(at);
            }).store_unaligned(&early[static_cast<std::size_t>(i)]);
        for (; i < count; ++i) early[static_cast<std::size_t>(i)] = sum(T(), [](const T* at) { return *at; });
    }

    // All combs of all channels side by side: only a comb's damping depends on its last sample, so that is
    // done for several combs in one register, and all the rest for several samples.
    template <std::size_t Channels>
    void RunCombs(const Pieces& early, Pieces& sum, int count) {
        constexpr std::size_t kAll = kCombs * Channels, kGroups = (kAll + kLanes - 1) / kLanes;
        constexpr std::size_t kPadded = kGroups * kLanes;
        Piece spare{};
        std::array<T*, kPadded> cells;
        std::array<T, kPadded> memory{}, damping{}, feedback{};
        for (std::size_t k = 0; k < kPadded; ++k) {
            const std::size_t c = k / kCombs, comb = k % kCombs;
            cells[k] = k < kAll ? m_data[c].combs[comb].Here() : spare.data();
            if (k >= kAll) continue;
            memory[k] = m_data[c].memory[comb];
            damping[k] = m_damping[comb];
            feedback[k] = m_data[c].feedback[comb];
        }
        int i = 0;
        for (; i + kLanes <= count; i += kLanes) {
            const auto at = static_cast<std::size_t>(i);
            std::array<Lanes, Channels> total;
            for (std::size_t group = 0; group < kGroups; ++group) {
                const std::size_t first = group * kLanes;
                std::array<Lanes, kLanes> y;
                for (std::size_t k = first; k < first + kLanes; ++k) {
                    y[k - first] = Lanes::load_unaligned(cells[k] + i);
                    if (k >= kAll) continue;
                    auto& t = total[k / kCombs];
                    t = k % kCombs == 0 ? y[k - first] : t + y[k - first];
                }
                Transpose(y);
                auto s = Lanes::load_unaligned(&memory[first]);
                const auto d = Lanes::load_unaligned(&damping[first]);
                for (auto& moment : y) moment = s = s * d + moment;
                s.store_unaligned(&memory[first]);
                Transpose(y);
                for (std::size_t k = first; k < first + kLanes && k < kAll; ++k)
                    (y[k - first] * Lanes(feedback[k]) + Lanes::load_unaligned(&early[k / kCombs][at]))
                        .store_unaligned(cells[k] + i);
            }
            for (std::size_t c = 0; c < Channels; ++c) total[c].store_unaligned(&sum[c][at]);
        }
        for (; i < count; ++i) {
            const auto at = static_cast<std::size_t>(i);
            for (std::size_t k = 0; k < kAll; ++k) {
                const T y = cells[k][i];
                auto& t = sum[k / kCombs][at];
                t = k % kCombs == 0 ? y : t + y;
                memory[k] = memory[k] * damping[k] + y;
                cells[k][i] = memory[k] * feedback[k] + early[k / kCombs][at];
            }
        }
        for (std::size_t k = 0; k < kAll; ++k) {
            auto& data = m_data[k / kCombs];
            data.memory[k % kCombs] = memory[k];
            data.combs[k % kCombs].Advance(count);
        }
    }

    // From the combs' sum to the finished samples, in place.
    void Output(ReverbData<T>& data, const Piece& in, Piece& early, Piece& sum, int count) {
        constexpr T kGain = static_cast<T>(ReverbDesign::kAllPassGain);
        T* const cells = data.allPass.Here();
        for (std::size_t i = 0; i < static_cast<std::size_t>(count); ++i) {
            const T a = kGain * sum[i] + cells[i];
            cells[i] = sum[i] - kGain * a;
            sum[i] = a;
        }
        data.allPass.Advance(count);
        m_allPassOverflowed |= !AllFinite(sum.data(), static_cast<std::size_t>(count));
        if (data.offset != 0) {
            Piece& waits = data.offset > 0 ? sum : early;
            std::copy_n(waits.begin(), count, data.align.Here());
            data.align.Advance(count);
            std::copy_n(data.align.Before(std::abs(data.offset) + count), count, waits.begin());
        }
        const T reflections = data.reflections, tail = data.tail, wet = data.wet, dry = data.dry;
        for (std::size_t i = 0; i < static_cast<std::size_t>(count); ++i)
            sum[i] = in[i] * dry + (sum[i] * tail + early[i] * reflections) * wet;
    }

    static constexpr int kLanes = static_cast<int>(Lanes::size);

    std::unique_ptr<T[]> m_memory;
    double m_rate = 0.0;
    int m_channels = 0;
    int m_shortest = 1;  // frames that a piece may have
    std::array<ReverbData<T>, 2> m_data;
    std::array<Pieces, 3> m_pieces{};  // on their way: input, reflections, tail
    std::array<T, kCombs> m_damping{};
    BiquadSection m_section{};
    bool m_filters = false, m_reflects = false;
    bool m_allPassOverflowed = false;  // in this block
};

}  // namespace Corvo::DSP
