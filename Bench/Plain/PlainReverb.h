#pragma once

#include <cstddef>
#include <vector>

#include "DSP/Effects/Reverb/ReverbDesign.h"
#include "DSP/Equalizer/BiquadDesign.h"

namespace Plain {

// One channel of the reverb as its definition reads, sample by sample.
template <typename T>
class Reverb {
public:
    using Design = Corvo::DSP::ReverbDesign;

    Reverb(const Design& design, std::size_t channel, int rate)
        : m_design(design),
          m_channel(design.channels[channel]),
          m_early(static_cast<std::size_t>(design.longestTap)),
          m_allPass(static_cast<std::size_t>(design.allPass)),
          m_align(static_cast<std::size_t>(std::abs(m_channel.offset))) {
        Corvo::DSP::CalcolaCoefficientiBiquad(Corvo::DSP::EQ_HIGHPASS, 1.0, 10, 50, &m_filter, rate, true);
        for (std::size_t i = 0; i < Design::kCombs; ++i)
            m_combs[i].resize(static_cast<std::size_t>(m_channel.combs[i]));
    }

    void Run(T* samples, int frames, std::ptrdiff_t stride) {
        for (; frames > 0; --frames, samples += stride) *samples = Step(*samples);
    }

private:
    static void Next(std::size_t& index, std::size_t size) { index = index + 1 == size ? 0 : index + 1; }
    // Puts a sample into a delay line and takes out the oldest one.
    static T Delay(std::vector<T>& line, std::size_t& index, T sample) {
        if (line.empty()) return sample;
        std::swap(line[index], sample);
        Next(index, line.size());
        return sample;
    }

    T Step(T x) {
        if (m_design.filtersInput) {
            const double w = x - m_filter.a1.value * m_w1 - m_filter.a2.value * m_w2;
            x = static_cast<T>(m_filter.b0.value * w + m_filter.b1.value * m_w1 + m_filter.b2.value * m_w2);
            m_w2 = m_w1;
            m_w1 = w;
        }
        T e = x;
        if (!m_early.empty()) {
            e = 0;
            const std::size_t size = m_early.size();
            for (std::size_t i = 0; i < Design::kTaps; ++i) {
                const auto tap = static_cast<std::size_t>(std::max(m_channel.taps[i], 1));
                const std::size_t at = m_write < tap ? m_write + size - tap : m_write - tap;
                e += static_cast<T>(Design::kReflections[i].gain) * m_early[at];
            }
            m_early[m_write] = x;
            Next(m_write, size);
        }
        T sum = 0;
        for (std::size_t i = 0; i < Design::kCombs; ++i) {
            T& cell = m_combs[i][m_index[i]];
            const T y = cell;
            m_memory[i] = m_memory[i] * static_cast<T>(m_design.damping[i]) + y;
            cell = m_memory[i] * static_cast<T>(m_channel.feedback[i]) + e;
            Next(m_index[i], m_combs[i].size());
            sum += y;
        }
        const T gain = static_cast<T>(0.7);
        T& cell = m_allPass[m_allPassIndex];
        T a = gain * sum + cell;
        cell = sum - gain * a;
        Next(m_allPassIndex, m_allPass.size());

        (m_channel.offset > 0 ? a : e) = Delay(m_align, m_alignIndex, m_channel.offset > 0 ? a : e);
        return x * static_cast<T>(m_channel.dry) +
               (a * static_cast<T>(m_channel.tail) + e * static_cast<T>(m_channel.reflections)) *
                   static_cast<T>(m_channel.wet);
    }

    const Design m_design;
    const Design::Channel m_channel;
    Corvo::DSP::coeff<Corvo::DSP::SmoothCoefficient> m_filter{};
    double m_w1 = 0.0, m_w2 = 0.0;
    std::vector<T> m_early, m_allPass, m_align;
    std::array<std::vector<T>, Design::kCombs> m_combs;
    std::array<std::size_t, Design::kCombs> m_index{};
    std::array<T, Design::kCombs> m_memory{};
    std::size_t m_write = 0, m_allPassIndex = 0, m_alignIndex = 0;
};

}  // namespace Plain
