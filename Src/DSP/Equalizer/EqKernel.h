#pragma once

#include <iterator>
#include <type_traits>
#include <utility>

#include "DSP/Equalizer/EqCascade.h"
#include "DSP/Equalizer/EqLanes.h"

// The cascade in SIMD lanes. Lane s * Channels + c holds band s of channel c, and works on frame t - s while
// band 0 works on frame t: all bands advance together, each fed by what the lanes below made one step
// earlier. Each band sees the same numbers in the same order as if it ran alone, so the bits are the same.
//
// Included by one source file per instruction set; everything is private to that file.
namespace Corvo::DSP {
namespace {

template <typename Sample, typename Arch, int Channels>
class EqRun {
    using Lanes = EqLanes<Arch>;
    using V = typename Lanes::V;
    using Mask = typename V::batch_bool_type;
    static constexpr int kLanes = static_cast<int>(V::size);
    static constexpr int kBandsPerRegister = kLanes / Channels;
    static constexpr int kMostRegisters =
        (builtin_effects_data::kMaxBands + kBandsPerRegister - 1) / kBandsPerRegister;
    // As many as the register file holds with their state.
    static constexpr int kMostSettled = 4;

    // One number per band and channel, idle lanes included.
    template <int Registers>
    struct alignas(64) Slots {
        double at[Registers * kLanes];
        V Get(int r) const { return V::load_aligned(at + r * kLanes); }
        void Set(int r, V v) { v.store_aligned(at + r * kLanes); }
    };

    // call(0), call(1) ..., each number a constant.
    template <int Count, typename Call>
    [[gnu::always_inline]] static void Unrolled(Call&& call) {
        [&]<int... i>(std::integer_sequence<int, i...>) { (call(std::integral_constant<int, i>()), ...); }
        (std::make_integer_sequence<int, Count>());
    }

    // Calls with each band of the run and its slot.
    template <typename Call>
    static void ForEachBand(const EqCascade<Sample>& cascade, int first, int count, Call&& call) {
        for (int s = 0; s < count; ++s)
            for (int c = 0; c < Channels; ++c)
                call(*cascade.bands[static_cast<std::size_t>(c)][static_cast<std::size_t>(first + s)],
                     s * Channels + c);
    }

    // Which lanes work on a frame of the block when band 0 is at frame t.
    struct Validity {
        double at[kMostRegisters * kLanes];
        double frames;
        Validity(int blockFrames, int skew) : frames(blockFrames) {
            for (int i = 0; i < kMostRegisters * kLanes; ++i) at[i] = i / Channels * skew;
        }
        Mask operator()(int r, int t) const {
            const V frame = V(static_cast<double>(t)) - V::load_unaligned(at + r * kLanes);
            return (frame >= V(0.0)) & (frame < V(frames));
        }
    };

    // A settled cascade in registers. `Skew` frames lie between neighbouring bands: what a band makes is
    // needed that many steps later, so its latency does not hold the next step up.
    template <int Registers, int Skew>
    struct Cascade {
        Slots<Registers> a1{}, a2{}, b0{}, b1{}, b2{};
        V last1[Registers], last2[Registers];
        V made[Skew][Registers];

        // One step of every band on the next frame; `out` is the row of `made` whose turn it is.
        template <bool Whole, typename Working>
        [[gnu::always_inline]] void Step(V (&out)[Registers], V frame, const Sample* type,
                                         const Working& working) {
            V before = frame;
            Unrolled<Registers>([&](auto index) {
                constexpr int r = index;
                const V x = Lanes::template MovedUp<Channels>(before, out[r]);
                before = out[r];
                const V w = x - a1.Get(r) * last1[r] - a2.Get(r) * last2[r];
                out[r] = Lanes::Rounded(b0.Get(r) * w + b1.Get(r) * last1[r] + b2.Get(r) * last2[r], type);
                if constexpr (Whole) {
                    last2[r] = last1[r];
                    last1[r] = w;
                } else {
                    const Mask mask = working(r);
                    last2[r] = select(mask, last1[r], last2[r]);
                    last1[r] = select(mask, w, last1[r]);
                }
            });
        }
    };

    template <int Registers>
    static void SettledPass(const EqCascade<Sample>& cascade, int first, int count) {
        // Where a band's neighbour sits in the same register, one frame would make each step wait for all of
        // the one before; few registers do not fill that time, more of them need less.
        constexpr int kSkew = kBandsPerRegister == 1 ? 1 : Registers <= 2 ? 4 : 2;
        Cascade<Registers, kSkew> state;
        Slots<Registers> w1{}, w2{};
        ForEachBand(cascade, first, count, [&](const EqBand& band, int slot) {
            const auto& c = band._eq_coeffs;
            state.a1.at[slot] = c.a1.value, state.a2.at[slot] = c.a2.value;
            state.b0.at[slot] = c.b0.value, state.b1.at[slot] = c.b1.value, state.b2.at[slot] = c.b2.value;
            w1.at[slot] = band.w1, w2.at[slot] = band.w2;
        });
        for (int r = 0; r < Registers; ++r) {
            state.last1[r] = w1.Get(r), state.last2[r] = w2.Get(r);
            for (auto& made : state.made) made[r] = V(0.0);
        }

        const Validity valid(cascade.frames, kSkew);
        const int frames = cascade.frames, lag = (count - 1) * kSkew;
        const int lane = (count - 1) % kBandsPerRegister * Channels;
        const std::ptrdiff_t stride = cascade.stride;
        Sample* const samples = cascade.samples;
        // Before all bands have a frame to work on, and when the first ones have none left.
        const auto edge = [&](int t) {
            const V frame = t < frames ? Lanes::template Load<Channels>(samples + t * stride) : V(0.0);
            const auto working = [&](int r) { return valid(r, t); };
            auto& made = state.made[t % kSkew];
            state.template Step<false>(made, frame, samples, working);
            if (t >= lag)
                Lanes::template Store<Channels>(made[Registers - 1], lane, samples + (t - lag) * stride);
        };
        int t = 0;
        while (t < lag) edge(t++);
        {
            auto local = state;  // nobody has its address, so it can live in registers
            for (; t + kSkew <= frames; t += kSkew)
                Unrolled<kSkew>([&](auto phase) {
                    Sample* const in = samples + (t + phase) * stride;
                    auto& made = local.made[phase];
                    local.template Step<true>(made, Lanes::template Load<Channels>(in), in, 0);
                    Lanes::template Store<Channels>(made[Registers - 1], lane, in - lag * stride);
                });
            state = local;
        }
        while (t < frames + lag) edge(t++);

        for (int r = 0; r < Registers; ++r) w1.Set(r, state.last1[r]), w2.Set(r, state.last2[r]);
        ForEachBand(cascade, first, count,
                    [&](EqBand& band, int slot) { band.w1 = w1.at[slot], band.w2 = w2.at[slot]; });
    }

    // One coefficient of every band.
    struct Glide {
        Slots<kMostRegisters> value{}, target{}, range, zeroBelow{};
        Mask moving[kMostRegisters];

        void Step(int r, Mask working) {
            using Progress = AudioParameterProgressAlternate;
            const V was = value.Get(r), goal = target.Get(r);
            const V rel = abs(was - goal) / range.Get(r);
            const V k = select(rel >= V(1.0), V(Progress::kFirstRate), Progress::Rate(rel));
            const Mask near = rel < V(Progress::kArrived), nothing = abs(was) < zeroBelow.Get(r);
            const V next = select(near, goal, (V(1.0) - k) * was + k * goal);
            value.Set(r, select(moving[r] & working, select(nothing, V(0.0), next), was));
            moving[r] = moving[r] & ~((near | nothing) & working);
        }
    };

public:
    static void Settled(const EqCascade<Sample>& cascade, int first, int count) {
        constexpr void (*kRuns[])(const EqCascade<Sample>&, int, int) = {SettledPass<1>, SettledPass<2>,
                                                                         SettledPass<3>, SettledPass<4>};
        static_assert(std::size(kRuns) == kMostSettled);
        int registers = (count + kBandsPerRegister - 1) / kBandsPerRegister;
        // In passes of about equal size.
        for (int passes = (registers + kMostSettled - 1) / kMostSettled; passes > 0; --passes) {
            const int share = (registers + passes - 1) / passes;
            const int bands = share * kBandsPerRegister < count ? share * kBandsPerRegister : count;
            kRuns[share - 1](cascade, first, bands);
            first += bands;
            count -= bands;
            registers -= share;
        }
    }

    static int Gliding(const EqCascade<Sample>& cascade, int first, int count) {
        using Progress = AudioParameterProgressAlternate;
        const int registers = (count + kBandsPerRegister - 1) / kBandsPerRegister;
        Glide glides[5];  // a1, a2, b0, b1, b2
        Slots<kMostRegisters> w1{}, w2{}, out{}, moving[5]{};
        for (auto& glide : glides)
            for (double& range : glide.range.at) range = 1.0;
        ForEachBand(cascade, first, count, [&](EqBand& band, int slot) {
            auto* glide = glides;
            auto* flag = moving;
            band.ForEachCoefficient([&](const ManagedCoefficient& c) {
                const double way = c.start < c.target ? c.target - c.start : c.start - c.target;
                glide->value.at[slot] = c.value;
                glide->target.at[slot] = c.target;
                glide->range.at[slot] = way > Progress::kTiny ? way : Progress::kTiny;
                const bool towardsZero = c.target < Progress::kTiny && c.target > -Progress::kTiny;
                glide->zeroBelow.at[slot] = towardsZero ? Progress::kTiny : 0.0;
                (flag++)->at[slot] = c.moving ? 1.0 : 0.0;
                ++glide;
            });
            w1.at[slot] = band.w1, w2.at[slot] = band.w2;
        });
        for (int i = 0; i < 5; ++i)
            for (int r = 0; r < registers; ++r) glides[i].moving[r] = moving[i].Get(r) > V(0.5);

        const Validity valid(cascade.frames, 1);
        const int lag = count - 1, lane = lag % kBandsPerRegister * Channels;
        Sample* const samples = cascade.samples;
        for (int t = 0; t < cascade.frames + lag; ++t) {
            // From the last band down, so that each still finds what the one below made a step ago.
            for (int r = registers - 1; r >= 0; --r) {
                const V in = r > 0 ? out.Get(r - 1)
                             : t < cascade.frames
                                 ? Lanes::template Load<Channels>(samples + t * cascade.stride)
                                 : V(0.0);
                const V x = Lanes::template MovedUp<Channels>(in, out.Get(r));
                const Mask working = valid(r, t);
                for (auto& glide : glides) glide.Step(r, working);
                const V last1 = w1.Get(r), last2 = w2.Get(r);
                const V w = x - glides[0].value.Get(r) * last1 - glides[1].value.Get(r) * last2;
                const V y = glides[2].value.Get(r) * w + glides[3].value.Get(r) * last1 +
                            glides[4].value.Get(r) * last2;
                out.Set(r, Lanes::Rounded(y, samples));
                w2.Set(r, select(working, last1, last2));
                w1.Set(r, select(working, w, last1));
            }
            if (t >= lag)
                Lanes::template Store<Channels>(out.Get(registers - 1), lane,
                                                samples + (t - lag) * cascade.stride);
        }

        int arrived = 0;
        for (int i = 0; i < 5; ++i)
            for (int r = 0; r < registers; ++r) moving[i].Set(r, select(glides[i].moving[r], V(1.0), V(0.0)));
        ForEachBand(cascade, first, count, [&](EqBand& band, int slot) {
            auto* glide = glides;
            auto* flag = moving;
            band.ForEachCoefficient([&](ManagedCoefficient& c) {
                const bool still = (flag++)->at[slot] != 0.0;
                arrived += c.moving && !still;
                c.value = (glide++)->value.at[slot];
                c.moving = still;
            });
            band.w1 = w1.at[slot], band.w2 = w2.at[slot];
        });
        return arrived;
    }
};

template <typename Sample, typename Arch>
struct EqKernelsFor {
    // Up to so many bands in stereo run faster in a half register each.
    static constexpr int kFew = 3;

    static void Settled(const EqCascade<Sample>& cascade, int first, int count) {
        if (cascade.channels == 1)
            EqRun<Sample, Arch, 1>::Settled(cascade, first, count);
        else if (count <= kFew)
            EqRun<Sample, xsimd::sse2, 2>::Settled(cascade, first, count);
        else
            EqRun<Sample, Arch, 2>::Settled(cascade, first, count);
    }
    static int Gliding(const EqCascade<Sample>& cascade, int first, int count) {
        return (cascade.channels == 2 ? EqRun<Sample, Arch, 2>::Gliding : EqRun<Sample, Arch, 1>::Gliding)(
            cascade, first, count);
    }
    static constexpr EqKernels<Sample> kTable{Settled, Gliding};
};

}  // namespace
}  // namespace Corvo::DSP
