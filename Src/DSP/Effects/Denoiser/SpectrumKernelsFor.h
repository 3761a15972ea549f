#pragma once

#include <algorithm>
#include <bit>
#include <cstdint>
#include <limits>
#include <xsimd/xsimd.hpp>

#include "DSP/Effects/Denoiser/SpectrumKernels.h"

// The kernels for registers of one instruction set. Included by one source file per set, which is compiled
// for it; everything is local to that file, so that no copy is shared between instruction sets.
namespace Corvo::DSP::Denoising {

namespace {

template <typename Arch>
struct KernelsFor {
    using V = xsimd::batch<float, Arch>;
    static constexpr std::size_t kWidth = V::size, kSums = 8 / kWidth;

    static V Load(const float* from) { return V::load_unaligned(from); }
    static V Limited(V x, float low, float high) { return xsimd::min(xsimd::max(x, V(low)), V(high)); }

    static V Mean(const Frames& frames, std::size_t i) {
        V sum = Load(frames.frame[0] + i) * V(frames.weights[0]);
        for (int j = 1; j < frames.count; ++j) sum += Load(frames.frame[j] + i) * V(frames.weights[j]);
        return sum;
    }

    static void Multiply(float* out, const float* in, const float* window, std::size_t count) {
        for (std::size_t i = 0; i < count; i += kWidth)
            (Load(in + i) * Load(window + i)).store_unaligned(out + i);
    }
    static void MultiplyAdd(float* out, const float* in, const float* window, std::size_t count) {
        for (std::size_t i = 0; i < count; i += kWidth)
            (Load(out + i) + Load(in + i) * Load(window + i)).store_unaligned(out + i);
    }

    static void Power(const float* re, const float* im, float* power, std::size_t half) {
        for (std::size_t i = 0; i < half; i += kWidth) {
            const V x = Load(re + i), y = Load(im + i);
            (x * x + y * y + V(kLeastPower)).store_unaligned(power + i);
        }
        power[0] = re[0] * re[0] + kLeastPower;
        power[half] = im[0] * im[0] + kLeastPower;
    }
    static void ApplyGain(float* re, float* im, const float* gain, std::size_t half) {
        const float last = im[0] * gain[half];
        for (std::size_t i = 0; i < half; i += kWidth) {
            const V g = Load(gain + i);
            (Load(re + i) * g).store_unaligned(re + i);
            (Load(im + i) * g).store_unaligned(im + i);
        }
        im[0] = last;
    }

    static void Ratio(const SpectrumKernels::Ratio& job, std::size_t from, std::size_t to) {
        const V share(job.share), weight(job.weight), most(kMostRatio);
        for (std::size_t i = from; i < to; i += kWidth) {
            const V before = Load(job.before + i);
            const V noise = before + (Load(job.after + i) - before) * share;
            V ratio = Load(job.power + i) / (noise * Load(job.curve + i)) * weight;
            V mean = noise * weight;
            if (!job.first) {
                ratio += Load(job.ratio + i);
                mean += Load(job.meanNoise + i);
            }
            (job.last ? xsimd::min(ratio, most) : ratio).store_unaligned(job.ratio + i);
            mean.store_unaligned(job.meanNoise + i);
        }
    }

    static void Evidence(const SpectrumKernels::Evidence& job, std::size_t from, std::size_t to) {
        const V slope(job.slope), offset(job.offset), odds((1.0f - job.prior) / job.prior), one(1.0f);
        for (std::size_t i = from; i < to; i += kWidth) {
            const V evidence = Mean(job.ratios, i);
            const V unlikely = xsimd::exp(Limited(offset - slope * evidence, -50.0f, 50.0f));
            evidence.store_unaligned(job.evidence + i);
            unlikely.store_unaligned(job.unlikely + i);
            (one / (one + odds * unlikely)).store_unaligned(job.presence + i);
        }
    }

    static void SmoothBins(const float* in, float* out, const float* weights, int half, std::size_t from,
                           std::size_t to) {
        for (std::size_t i = from; i < to; i += kWidth) {
            const float* const x = in + i;
            V sum = Load(x) * V(weights[0]);
            for (int j = 1; j <= half; ++j) sum += (Load(x - j) + Load(x + j)) * V(weights[j]);
            sum.store_unaligned(out + i);
        }
    }

    static void Presence(const SpectrumKernels::Presence& job, std::size_t from, std::size_t to) {
        const V low(job.low), span(job.span), one(1.0f);
        for (std::size_t i = from; i < to; i += kWidth) {
            const V prior = low + span * Mean(job.smoothed, i);
            (prior / (prior + (one - prior) * Load(job.unlikely + i))).store_unaligned(job.presence + i);
        }
    }

    static void FirstEstimate(const float* presence, const float* evidence, const float* ratio,
                              float* estimate, std::size_t from, std::size_t to) {
        const V one(1.0f), zero(0.0f);
        for (std::size_t i = from; i < to; i += kWidth) {
            const V signal = xsimd::max(Load(evidence + i) - one, zero);
            const V gain = Load(presence + i) * signal / (one + signal);
            (gain * gain * Load(ratio + i)).store_unaligned(estimate + i);
        }
    }

    static void Gain(const SpectrumKernels::Gain& job, std::size_t from, std::size_t to) {
        const V one(1.0f), least(0.0031622776f);
        for (std::size_t i = from; i < to; i += kWidth) {
            const V estimate = xsimd::max(Mean(job.estimates, i), least);
            const V presence = Load(job.presence + i);
            const V gain = xsimd::exp(presence * xsimd::log(estimate / (one + estimate)) +
                                      (one - presence) * Load(job.logFloor + i));
            xsimd::min(xsimd::max(gain, Load(job.floor + i)), one).store_unaligned(job.gain + i);
        }
    }

    static void Risk(const float* ratio, const float* gain, float* risk, std::size_t from, std::size_t to) {
        const V one(1.0f), two(2.0f), most(1e4f);
        for (std::size_t i = from; i < to; i += kWidth) {
            const V g = Load(gain + i), lost = one - g;
            (lost * lost * xsimd::min(Load(ratio + i), most) + two * g - one).store_unaligned(risk + i);
        }
    }

    static float Dot(const float* a, const float* b, std::size_t count) {
        V sums[kSums];
        for (auto& sum : sums) sum = V(0.0f);
        std::size_t i = 0;
        for (; i + 8 <= count; i += 8)
            for (std::size_t j = 0; j < kSums; ++j)
                sums[j] += Load(a + i + j * kWidth) * Load(b + i + j * kWidth);
        float sum = Total(sums);
        for (; i < count; ++i) sum += a[i] * b[i];
        return sum;
    }

    static float Total(const V (&sums)[kSums]) {
        float each[8], total = 0.0f;
        for (std::size_t j = 0; j < kSums; ++j) sums[j].store_unaligned(each + j * kWidth);
        for (const float part : each) total += part;
        return total;
    }

    static float CountUpTo(const float* values, std::size_t count, float most) {
        V sums[kSums];
        for (auto& sum : sums) sum = V(0.0f);
        for (std::size_t i = 0; i < count; i += 8)
            for (std::size_t j = 0; j < kSums; ++j)
                sums[j] += xsimd::select(Load(values + i + j * kWidth) <= V(most), V(1.0f), V(0.0f));
        return Total(sums);
    }

    static SpectrumKernels::Quiet Quiet(float* values, const float* logs, std::size_t count,
                                        std::size_t rank) {
        std::fill_n(values + count, 7, std::numeric_limits<float>::max());
        const auto wanted = static_cast<float>(rank);
        // Positive floats are in the order of their bits, which are found one by one from the top, until just
        // as many values as wanted lie below.
        std::uint32_t bits = 0;
        for (std::uint32_t bit = 1u << 30; bit != 0; bit >>= 1) {
            const std::uint32_t tried = bits + bit - 1;
            const float found = CountUpTo(values, count, std::bit_cast<float>(tried));
            if (found < wanted) bits += bit;
            if (found != wanted) continue;
            bits = tried;
            break;
        }
        const V most(std::bit_cast<float>(bits));
        V counts[kSums], sums[kSums], logSums[kSums];
        for (std::size_t j = 0; j < kSums; ++j) counts[j] = sums[j] = logSums[j] = V(0.0f);
        for (std::size_t i = 0; i < count; i += 8)
            for (std::size_t j = 0; j < kSums; ++j) {
                const V value = Load(values + i + j * kWidth);
                const auto quiet = value <= most;
                counts[j] += xsimd::select(quiet, V(1.0f), V(0.0f));
                sums[j] += xsimd::select(quiet, value, V(0.0f));
                logSums[j] += xsimd::select(quiet, Load(logs + i + j * kWidth), V(0.0f));
            }
        return {Total(counts), Total(sums), Total(logSums)};
    }

    static void Logarithm(const float* in, float* out, std::size_t count) {
        for (std::size_t i = 0; i < count; i += kWidth) xsimd::log(Load(in + i)).store_unaligned(out + i);
    }
    static void Exponential(const float* in, float* out, std::size_t count) {
        for (std::size_t i = 0; i < count; i += kWidth) xsimd::exp(Load(in + i)).store_unaligned(out + i);
    }

    static constexpr SpectrumKernels kTable{Multiply, MultiplyAdd, Power,    ApplyGain,     Ratio,
                                            Evidence, SmoothBins,  Presence, FirstEstimate, Gain,
                                            Risk,     Dot,         Quiet,    Logarithm,     Exponential};
};

}  // namespace
}  // namespace Corvo::DSP::Denoising
