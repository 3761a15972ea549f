#pragma once

#include <algorithm>
#include <utility>
#include <xsimd/xsimd.hpp>

#include "DSP/Effects/Reverb/ReverbKernel.h"

// The reverb's arithmetic. Included by one source file per instruction set; everything is private to that
// file.
namespace Corvo::DSP {
namespace {

// Transposes 4 by 4: from one register per comb to one per frame, and back.
inline void Transpose(std::array<xsimd::batch<float, xsimd::sse2>, 4>& v) {
    const auto a = xsimd::zip_lo(v[0], v[2]), b = xsimd::zip_hi(v[0], v[2]);
    const auto c = xsimd::zip_lo(v[1], v[3]), d = xsimd::zip_hi(v[1], v[3]);
    v = {xsimd::zip_lo(a, c), xsimd::zip_hi(a, c), xsimd::zip_lo(b, d), xsimd::zip_hi(b, d)};
}
inline void Transpose(std::array<xsimd::batch<double, xsimd::sse2>, 2>& v) {
    v = {xsimd::zip_lo(v[0], v[1]), xsimd::zip_hi(v[0], v[1])};
}

// call(0), call(1) ..., each number a constant.
template <std::size_t Count, typename Call>
[[gnu::always_inline]] inline void Unrolled(Call&& call) {
    [&]<std::size_t... i>(std::index_sequence<i...>) {
        (call(std::integral_constant<std::size_t, i>()), ...);
    }
    (std::make_index_sequence<Count>());
}

template <typename T, typename Arch>
struct ReverbKernelsFor {
    using Wide = xsimd::batch<T, Arch>;
    using Lanes = xsimd::batch<T, xsimd::sse2>;  // what Transpose turns over
    static constexpr std::size_t kTaps = ReverbDesign::kTaps, kCombs = ReverbDesign::kCombs;

    // `call` with a value's type and the index where it begins: registers, then single samples.
    template <typename Call>
    [[gnu::always_inline]] static void ForAll(int count, Call&& call) {
        int i = 0;
        for (; i + static_cast<int>(Wide::size) <= count; i += static_cast<int>(Wide::size)) call(Wide(), i);
        for (; i < count; ++i) call(T(), i);
    }
    static Wide Load(Wide, const T* at) { return Wide::load_unaligned(at); }
    static T Load(T, const T* at) { return *at; }
    static void Store(Wide value, T* at) { value.store_unaligned(at); }
    static void Store(T value, T* at) { *at = value; }

    // Half of the reflections at a time over all samples: fewer streams for the processor to follow than all.
    template <std::size_t First, std::size_t Count>
    static void Add(const std::array<const T*, kTaps>& from, T* early, int count) {
        ForAll(count, [&](auto kind, int i) {
            using Value = decltype(kind);
            Value total = First == 0 ? Value(T(0)) : Load(kind, early + i);
            Unrolled<Count>([&](auto k) {
                const Value gain(static_cast<T>(ReverbDesign::kReflections[First + k].gain));
                total = total + gain * Load(kind, from[First + k] + i);
            });
            Store(total, early + i);
        });
    }
    static void Reflect(const std::array<const T*, kTaps>& from, T* early, int count) {
        constexpr std::size_t kAtATime = 10, kRounds = (kTaps + kAtATime - 1) / kAtATime;
        Unrolled<kRounds>([&](auto round) {
            constexpr std::size_t kFirst = round * kAtATime;
            Add<kFirst, std::min(kAtATime, kTaps - kFirst)>(from, early, count);
        });
    }

    // Only a comb's damping depends on its last sample, so that is done for several combs in one register,
    // and all the rest for several samples.
    template <std::size_t Channels>
    static void Combs(CombBank<T>& bank, T* const* cells, const std::array<const T*, 2>& early,
                      const std::array<T*, 2>& sum, int count) {
        constexpr std::size_t kAll = kCombs * Channels, kLanes = Lanes::size;
        constexpr std::size_t kGroups = (kAll + kLanes - 1) / kLanes;
        constexpr int kStep = static_cast<int>(kLanes);
        std::array<Lanes, kGroups> memory, damping;
        Unrolled<kGroups>([&](auto group) {
            memory[group] = Lanes::load_unaligned(&bank.memory[group * kLanes]);
            damping[group] = Lanes::load_unaligned(&bank.damping[group * kLanes]);
        });
        int i = 0;
        for (; i + kStep <= count; i += kStep) {
            std::array<Lanes, Channels> total;
            Unrolled<kGroups>([&](auto group) {
                std::array<Lanes, kLanes> y;
                Unrolled<kLanes>([&](auto lane) {
                    constexpr std::size_t k = group * kLanes + lane;
                    if constexpr (k < kAll) {
                        y[lane] = Lanes::load_unaligned(cells[k] + i);
                        auto& t = total[k / kCombs];
                        t = k % kCombs == 0 ? y[lane] : t + y[lane];
                    } else {
                        y[lane] = Lanes(T(0));
                    }
                });
                Transpose(y);
                Unrolled<kLanes>([&](auto moment) {
                    y[moment] = memory[group] = memory[group] * damping[group] + y[moment];
                });
                Transpose(y);
                Unrolled<kLanes>([&](auto lane) {
                    constexpr std::size_t k = group * kLanes + lane;
                    if constexpr (k < kAll)
                        (y[lane] * Lanes(bank.feedback[k]) + Lanes::load_unaligned(early[k / kCombs] + i))
                            .store_unaligned(cells[k] + i);
                });
            });
            Unrolled<Channels>([&](auto c) { total[c].store_unaligned(sum[c] + i); });
        }
        Unrolled<kGroups>([&](auto group) { memory[group].store_unaligned(&bank.memory[group * kLanes]); });
        for (; i < count; ++i)
            for (std::size_t k = 0; k < kAll; ++k) {
                const auto at = static_cast<std::size_t>(i);
                const T y = cells[k][i];
                auto& t = sum[k / kCombs][at];
                t = k % kCombs == 0 ? y : t + y;
                bank.memory[k] = bank.memory[k] * bank.damping[k] + y;
                cells[k][i] = bank.memory[k] * bank.feedback[k] + early[k / kCombs][at];
            }
    }
    static void AllCombs(CombBank<T>& bank, T* const* cells, const std::array<const T*, 2>& early,
                         const std::array<T*, 2>& sum, int channels, int count) {
        (channels == 2 ? Combs<2> : Combs<1>)(bank, cells, early, sum, count);
    }

    static bool AllPass(T* cells, T* sum, int count) {
        constexpr T kGain = static_cast<T>(ReverbDesign::kAllPassGain);
        auto finite = Wide(T(0)) == Wide(T(0));
        bool restFinite = true;
        ForAll(count, [&](auto kind, int i) {
            using Value = decltype(kind);
            const Value x = Load(kind, sum + i), gain(kGain);
            const Value a = gain * x + Load(kind, cells + i);
            Store(x - gain * a, cells + i);
            Store(a, sum + i);
            const auto is = a - a == Value(T(0));
            if constexpr (std::is_same_v<Value, T>)
                restFinite &= is;
            else
                finite = finite & is;
        });
        return restFinite && xsimd::all(finite);
    }

    static void Mix(const ReverbLevels<T>& levels, const T* in, const T* early, const T* tail, T* out,
                    int count) {
        ForAll(count, [&](auto kind, int i) {
            using Value = decltype(kind);
            const Value x = Load(kind, in + i) * Value(levels.dry);
            const Value wet =
                Load(kind, tail + i) * Value(levels.tail) + Load(kind, early + i) * Value(levels.reflections);
            Store(x + wet * Value(levels.wet), out + i);
        });
    }

    static constexpr ReverbKernels<T> kTable{Reflect, AllCombs, AllPass, Mix};
};

}  // namespace
}  // namespace Corvo::DSP
