#pragma once

#include <cstddef>

namespace Corvo::DSP::Denoising {

// Loops over the bins of a spectrum, as they stand in the middle of the noise reducer. Ranges are [from, to),
// multiples of kBinsAtOnce; every array reaches that far. Frames are arrays of one value per bin; `weights`
// holds one weight per frame.
struct Frames {
    const float* const* frame;
    const float* weights;
    int count;
};

struct SpectrumKernels {
    // out[i] = in[i] * window[i], and out[i] += in[i] * window[i].
    void (*multiply)(float* out, const float* in, const float* window, std::size_t count);
    void (*multiplyAdd)(float* out, const float* in, const float* window, std::size_t count);
    // |X|^2 of a split spectrum (half + 1 bins: bin 0 in re[0], bin `half` in im[0]), and the gains' product.
    void (*power)(const float* re, const float* im, float* power, std::size_t half);
    void (*applyGain)(float* re, float* im, const float* gain, std::size_t half);
    // noise = (1 - share) * before + share * after; ratio (+)= weight * power / (noise * curve), and for the
    // last channel limited to kMostRatio. meanNoise (+)= weight * noise.
    struct Ratio {
        const float *power, *before, *after, *curve;
        float share, weight;
        bool first, last;
        float *ratio, *meanNoise;
    };
    void (*ratio)(const Ratio& job, std::size_t from, std::size_t to);
    // evidence = the weighted mean of ratios; unlikely = how much less likely it is under noise with signal
    // than under noise alone; presence from both and the prior.
    struct Evidence {
        Frames ratios;
        float slope, offset;  // ln(unlikely) = -(slope * evidence - offset), limited to +-50
        float prior;
        float *evidence, *unlikely, *presence;
    };
    void (*evidence)(const Evidence& job, std::size_t from, std::size_t to);
    // The weighted sum over the bins up to `half` to either side; weights[0] is the middle one's. `in` can be
    // read that far beyond the range.
    void (*smoothBins)(const float* in, float* out, const float* weights, int half, std::size_t from,
                       std::size_t to);
    // presence with a prior per bin, low + span * (the weighted mean of the smoothed presences).
    struct Presence {
        Frames smoothed;
        const float* unlikely;
        float low, span;
        float* presence;
    };
    void (*presence)(const Presence& job, std::size_t from, std::size_t to);
    // First estimate of the signal's power over the noise's: (presence * gain of Wiener's filter)^2 * ratio.
    void (*firstEstimate)(const float* presence, const float* evidence, const float* ratio, float* estimate,
                          std::size_t from, std::size_t to);
    struct Gain {
        Frames estimates;
        const float *presence, *floor, *logFloor;
        float* gain;
    };
    void (*gain)(const Gain& job, std::size_t from, std::size_t to);
    // (1 - gain)^2 * ratio + 2 * gain - 1, the ratio limited to 1e4.
    void (*risk)(const float* ratio, const float* gain, float* risk, std::size_t from, std::size_t to);
    // The sum of the products, in eight running sums whatever the registers' width.
    float (*dot)(const float* a, const float* b, std::size_t count);
    // Of `count` positive values, those up to the rank-th smallest (from 1): how many there are (more than
    // `rank` when several are equal), their sum, and the sum of the `logs` at their places. The values are
    // followed by room for 7 more, which are overwritten. Takes as long whatever the values are.
    struct Quiet {
        float count, sum, logSum;
    };
    Quiet (*quiet)(float* values, const float* logs, std::size_t count, std::size_t rank);
    void (*logarithm)(const float* in, float* out, std::size_t count);
    void (*exponential)(const float* in, float* out, std::size_t count);
};

constexpr float kMostRatio = 1e5f;
// Added to every power, so that silence has a logarithm.
constexpr float kLeastPower = 1e-20f;

// One for every processor, and one for those with AVX2. Both give the same bits.
const SpectrumKernels& BaselineSpectrumKernels();
const SpectrumKernels& Avx2SpectrumKernels();
const SpectrumKernels& BestSpectrumKernels();

}  // namespace Corvo::DSP::Denoising
