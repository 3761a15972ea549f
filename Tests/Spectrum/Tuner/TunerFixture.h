#pragma once

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <numbers>
#include <span>
#include <vector>

#include "Spectrum/Fft/CorvoFFT.h"
#include "Spectrum/Tuner/Tuner.h"

// Class-wide choices start every test at their defaults.
class TunerTest : public testing::Test {
protected:
    TunerTest() { Reset(); }
    ~TunerTest() override { Reset(); }

private:
    static void Reset() {
        Tuner::SetDetectionMethod(0);
        Tuner::SetShowDenoisedSpectrum(false);
        Tuner::SetTunedQuantumPreset(3);
        Tuner::SetNoteNaming(0);
        Tuner::SetTemperament(0);
        TunerCalibrateReset();
    }
};

// A tuner behind windows and a transform of its own.
class TunerProbe {
public:
    explicit TunerProbe(int rate, int length = 8192, int window = 0, int type = 4)
        : m_rate(rate), m_windowLength(window > 0 ? window : length) {
        m_fft.AllocateReal(length, 0);
        m_transform.resize(static_cast<std::size_t>(length));
        m_power.resize(m_transform.size() / 2);
        m_window.resize(static_cast<std::size_t>(m_windowLength));
        constexpr double kSums[5][3] = {{1, 0, 0}, {}, {0.5, 0.5, 0}, {0.54, 0.46, 0}, {0.42, 0.5, 0.08}};
        for (std::size_t n = 0; n < m_window.size(); ++n) {
            const double x = static_cast<double>(n) / m_windowLength, turn = 2.0 * std::numbers::pi * x;
            const auto& a = kSums[type];
            m_window[n] =
                static_cast<float>(type == 1 ? 1.0 - std::abs(2.0 * x - 1.0)
                                             : a[0] - a[1] * std::cos(turn) + a[2] * std::cos(2.0 * turn));
        }
        tuner.SetWindowType(type);
    }

    const std::vector<float>& Transform(const float* samples) {
        std::fill(m_transform.begin(), m_transform.end(), 0.0f);
        for (std::size_t n = 0; n < m_window.size(); ++n) m_transform[n] = samples[n] * m_window[n];
        m_fft.DoFFTReal(m_transform.data(), 0, 0);
        for (std::size_t k = 0; k < m_power.size(); ++k)
            m_power[k] =
                m_transform[2 * k] * m_transform[2 * k] + m_transform[2 * k + 1] * m_transform[2 * k + 1];
        return m_power;
    }
    // Hop 1: every analysis counts as one refresh.
    void Tune(const float* samples, bool denoise = false) { Tune(Transform(samples), denoise); }
    // A first note needs two analyses.
    void Show(const float* samples, bool denoise = false) {
        Tune(samples, denoise);
        Tune(samples, denoise);
    }
    // What one analysis hears, whatever came before.
    double Hear(const float* samples) { return Hear(Transform(samples)); }
    double Hear(const std::vector<float>& power) {
        tuner.Forget();
        Tune(power);
        return tuner.GetHeardFrequency();
    }
    void Tune(const std::vector<float>& power, bool denoise = false) {
        tuner.Tune(power, m_transform, static_cast<int>(m_transform.size()), 1, m_windowLength, m_rate, true,
                   denoise);
    }

    Tuner tuner;

private:
    int m_rate, m_windowLength;
    CorvoFFT m_fft;
    std::vector<float> m_transform, m_window, m_power;
};
