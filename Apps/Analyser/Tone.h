#pragma once

#include <atomic>
#include <cmath>
#include <numbers>

namespace analyser {

// A quiet sine to tune to, which fades in and out. Switched by the display thread, added by the audio thread.
class Tone {
public:
    void Set(bool on, double hz) {
        m_hz.store(hz, std::memory_order_relaxed);
        m_on.store(on, std::memory_order_relaxed);
    }
    bool IsOn() const { return m_on.load(std::memory_order_relaxed); }

    // To every channel of `frames` interleaved frames. What was there stays to the bit while the tone is off
    // or not wanted.
    void AddTo(float* samples, int frames, int channels, double rate, bool wanted = true) {
        const float target = IsOn() && wanted ? kLevel : 0.0f;
        if (m_level == target && target == 0.0f) return;
        const double step = m_hz.load(std::memory_order_relaxed) / rate;
        const auto fade = static_cast<float>(kLevel / (kFadeSeconds * rate));
        for (int i = 0; i < frames; ++i) {
            m_level =
                m_level < target ? std::fmin(m_level + fade, target) : std::fmax(m_level - fade, target);
            const float sample = m_level * static_cast<float>(std::sin(2.0 * std::numbers::pi * m_phase));
            for (int channel = 0; channel < channels; ++channel) *samples++ += sample;
            m_phase += step;
            m_phase -= std::floor(m_phase);
        }
    }

private:
    static constexpr float kLevel = 0.05f;  // -26 dB
    static constexpr double kFadeSeconds = 0.02;

    std::atomic<bool> m_on{false};
    std::atomic<double> m_hz{440.0};
    double m_phase = 0.0;
    float m_level = 0.0f;
};

}  // namespace analyser
