#pragma once

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <vector>

#include "DSP/Equalizer/BiquadDesign.h"
#include "DSP/Equalizer/BuiltinEffectsData.h"

namespace Plain {

using Corvo::DSP::builtin_effects_data;

// The glide written with the library's exponential.
struct ExponentialProgress {
    static bool Step(double& value, double start, double target) {
        const double tiny = 1e-14f;
        if (std::abs(target) < tiny && std::abs(value) < tiny) return value = 0.0, false;
        const double rel = std::abs(value - target) / std::max(std::abs(start - target), tiny);
        const double k = rel >= 1.0 ? 0.0009 : 9e-5 * std::exp(5.0 * (1.0 - rel));
        value = (1.0 - k) * value + k * target;
        if (!(rel < 0.01)) return true;
        return value = target, false;
    }
};

// The equaliser written the obvious way: channel by channel, band by band, sample by sample.
template <typename Progress = Corvo::DSP::AudioParameterProgressAlternate>
class ParEQ {
public:
    explicit ParEQ(int channels) : m_channels(static_cast<std::size_t>(channels)) {
        for (auto& channel : m_channels)
            for (auto& band : channel.bands)
                for (auto* c : band.InGlideOrder()) c->counter = &counter;
    }
    ParEQ(const ParEQ&) = delete;

    void Cook(bool smooth, bool bypassAll, const builtin_effects_data& data, int rate) {
        for (auto& channel : m_channels)
            for (int i = 0; i < std::min(data.numBands, 20); ++i) {
                const auto& settings = data.bands[static_cast<std::size_t>(i)];
                auto& band = channel.bands[static_cast<std::size_t>(i)];
                const int type = settings.type & 0xFF;
                const bool flat = settings.boost == 0 && type != 0 && type != 4;
                const bool was = band.active;
                band.active = !bypassAll && !settings.bypass() && !data.bands[0].bypass_track() && !flat;
                if (!band.active) continue;
                const int freq = type == 2 ? settings.freq : std::min(settings.freq, (rate - 1) / 2);
                Corvo::DSP::coeff<Corvo::DSP::SmoothCoefficient> designed;
                CalcolaCoefficientiBiquad(settings.filter_type(), std::pow(10.0, settings.boost * 0.005),
                                          std::max(freq, 1), settings.Q, &designed, rate, true);
                const double targets[] = {designed.a1.value, designed.a2.value, designed.b0.value,
                                          designed.b1.value, designed.b2.value};
                const double* target = targets;
                for (auto* c : band.InGlideOrder()) {
                    c->SetTarget(*target++);
                    if (!smooth || !was) c->Jump();
                }
                if (!smooth || !was) band.w1 = band.w2 = 0.0;
            }
    }

    template <typename Sample>
    void ProcessSingle(Sample* buf, int frames, int stride, int channel,
                       const builtin_effects_data* records) {
        const int offset = stride < 2 ? 0 : channel, end = frames * stride;
        if (records[channel].phaseShift)
            for (int i = offset; i < end; i += stride) buf[i] = -buf[i];
        const bool gliding = counter != 0;
        for (int b = 0; b < records[0].numBands; ++b) {
            auto& band = m_channels[static_cast<std::size_t>(channel)].bands[static_cast<std::size_t>(b)];
            if (!band.active) continue;
            for (int i = offset; i < end; i += stride) {
                if (gliding)
                    for (auto* c : band.InGlideOrder()) c->Advance();
                const auto& [b0, b1, b2, a1, a2] = band.coefficients;
                const double w = buf[i] - a1.value * band.w1 - a2.value * band.w2;
                buf[i] = static_cast<Sample>(b0.value * w + b1.value * band.w1 + b2.value * band.w2);
                band.w2 = band.w1;
                band.w1 = w;
            }
        }
    }

    template <typename Sample>
    void Process(Sample* buf, int frames, int channels, const builtin_effects_data* records) {
        for (int c = 0; c < channels; ++c) ProcessSingle(buf, frames, channels, c, records);
    }

    std::int32_t counter = 0;

private:
    using Coefficient = Corvo::DSP::AudioParameterManaged<double, Progress>;
    struct Band {
        bool active = false;
        Corvo::DSP::coeff<Coefficient> coefficients{};
        double w1 = 0.0, w2 = 0.0;
        std::array<Coefficient*, 5> InGlideOrder() {
            auto& c = coefficients;
            return {&c.a1, &c.a2, &c.b0, &c.b1, &c.b2};
        }
    };
    struct Channel {
        std::array<Band, 20> bands;
    };
    std::vector<Channel> m_channels;
};

}  // namespace Plain
