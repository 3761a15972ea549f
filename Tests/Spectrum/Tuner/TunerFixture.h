#pragma once

#include <cstddef>
#include <vector>

#include "Spectrum/AnalyserFixture.h"
#include "Spectrum/Tuner/TunerSounds.h"

class TunerTest : public AnalyserFixture {};

constexpr int kTunerRate = 44100;
inline std::vector<float> TunerSine(double hz, double amplitude = 0.5, std::size_t frames = 8192) {
    return TestSupport::Sine<float>(frames, hz, kTunerRate, amplitude);
}

// What each sensitivity is defined to be.
struct TunerSensitivityRow {
    double lowest, highest, partial, onset, range;
    int release, hold, confirm, harmonics, reported;
};
// clang-format off
constexpr TunerSensitivityRow kSensitivityRows[] = {
    { 30, 17000,  5, 15, 25, 60, 40, 3, 3, 2},
    { 70, 10000, 25, 40, 20, 40, 25, 6, 3, 1},
    { 30, 17000,  4, 11, 25, 60, 40, 2, 2, 2},
    { 70, 15000,  8, 18, 13, 40, 30, 8, 3, 3},
    { 40, 12000, 25, 35, 15, 50, 30, 4, 7, 4},
    {100, 19000, 15, 35, 15, 50, 30, 4, 2, 5},
};
// clang-format on

// A tuner of its own behind an analyser's spectra.
class TunerProbe {
public:
    explicit TunerProbe(int rate = kTunerRate, int length = 8192) : m_rate(rate), m_length(length) {
        kivspectrum::settings = {};
        kivspectrum::settings.window_length = length;
        kivspectrum::settings.hop_length = 1;
        m_analyser.init();
        m_analyser.SetOn(true);
    }

    const std::vector<float>& Transform(const float* samples) {
        m_analyser.Feed(samples, m_length, 1, 1);
        m_analyser.PrepareFFTForDrawing(m_rate, true, false, false, false);
        return m_analyser.GetPower();
    }
    // Hop 1: every analysis counts as one refresh.
    void Tune(const std::vector<float>& power) {
        tuner.Tune(power, {}, m_length, 1, m_length, m_rate, true, false);
    }
    void Tune(const float* samples) { Tune(Transform(samples)); }
    // A first note needs two analyses.
    void Show(const float* samples) {
        for (int i = 0; i < 2; ++i) Tune(samples);
    }
    // What analyses of one sound hear, whatever came before.
    double Hear(const float* samples) { return Hear(Transform(samples)); }
    double Hear(const std::vector<float>& power) {
        tuner.Forget();
        for (int i = 0; i < 2; ++i) Tune(power);
        return tuner.GetHeardFrequency();
    }

    Tuner tuner;

private:
    int m_rate, m_length;
    kivspectrum m_analyser;
};
