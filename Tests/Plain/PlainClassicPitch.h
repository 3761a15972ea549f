#pragma once

#include <cmath>
#include <numbers>
#include <vector>

namespace Plain {

// The "Classic" shifter for one channel, step by step as it is defined: with the imaginary part that is
// always zero, and a library call for every magnitude, angle and cosine.
class ClassicPitch {
public:
    ClassicPitch(int size, int oversampling, int rate)
        : m_size(size),
          m_oversampling(oversampling),
          m_step(size / oversampling),
          m_latency(size - m_step),
          m_rover(m_latency),
          m_expected(m_step * 2.0 * kPi / size),
          m_binWidth(static_cast<double>(rate) / size) {
        for (int k = 0; k < size; ++k) m_window.push_back(0.5 - 0.5 * std::cos(2.0 * kPi * k / size));
        const auto n = m_window.size();
        for (auto* array : {&m_input, &m_output}) array->resize(n);
        for (auto* array : {&m_lastPhase, &m_phaseSum}) array->resize(n);
        m_accumulator.resize(2 * n);
    }

    void Run(float* samples, int frames, int stride, float factor) {
        m_pitch = static_cast<float>(0.6 * factor + 0.4 * m_pitch);
        for (; frames > 0; --frames, samples += stride) {
            m_input[static_cast<std::size_t>(m_rover)] = *samples;
            *samples = m_output[static_cast<std::size_t>(m_rover - m_latency)];
            if (++m_rover < m_size) continue;
            m_rover = m_latency;
            Frame();
        }
    }

private:
    static constexpr double kPi = std::numbers::pi;

    void Frame() {
        const auto bins = static_cast<std::size_t>(m_size / 2) + 1, step = static_cast<std::size_t>(m_step);
        std::vector<float> magnitudes(bins), frequencies(bins);
        for (std::size_t k = 0; k < bins; ++k) {
            const auto bin = static_cast<double>(k);
            const double re = static_cast<float>(m_input[k] * m_window[k]), im = 0.0;
            const double phase = std::atan2(im, re);
            double d = phase - m_lastPhase[k] - bin * m_expected;
            m_lastPhase[k] = phase;
            int q = static_cast<int>(d / kPi);
            q += q >= 0 ? q & 1 : -(q & 1);
            d = m_oversampling * (d - kPi * q) / (2.0 * kPi);
            const auto j = static_cast<std::size_t>(static_cast<float>(k) * m_pitch);
            if (j >= bins) continue;
            magnitudes[j] += static_cast<float>(2.0 * std::sqrt(re * re + im * im));
            frequencies[j] = static_cast<float>(bin * m_binWidth + d * m_binWidth) * m_pitch;
        }
        for (std::size_t k = 0; k < bins; ++k) {
            const auto bin = static_cast<double>(k);
            const double off = (frequencies[k] - bin * m_binWidth) / m_binWidth;
            m_phaseSum[k] += off * 2.0 * kPi / m_oversampling + bin * m_expected;
            const auto real = static_cast<float>(magnitudes[k] * std::cos(m_phaseSum[k]));
            const double scale = static_cast<double>(m_size / 2) * m_oversampling;
            m_accumulator[k] = static_cast<float>(m_accumulator[k] + 2.0 * m_window[k] * real / scale);
        }
        for (std::size_t k = 0; k < step; ++k) m_output[k] = m_accumulator[k];
        for (std::size_t k = 0; k < m_window.size(); ++k) m_accumulator[k] = m_accumulator[k + step];
        for (std::size_t k = 0; k + step < m_window.size(); ++k) m_input[k] = m_input[k + step];
    }

    int m_size, m_oversampling, m_step, m_latency, m_rover;
    double m_expected, m_binWidth;
    float m_pitch = 1.0f;
    std::vector<float> m_input, m_output, m_accumulator;
    std::vector<double> m_window, m_lastPhase, m_phaseSum;
};

}  // namespace Plain
