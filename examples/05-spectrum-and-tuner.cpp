// Spectrum and tuner: what is in a sound, and which note it is. The same analyser answers both.
#include <cmath>
#include <cstdio>
#include <cstring>
#include <numbers>
#include <vector>

#include "Spectrum/Drawer/SpectrumDrawer.h"
#include "Spectrum/Tuner/Tuner.h"
#include "Spectrum/kivspectrum.h"

int main() {
    constexpr int rate = 48000, refresh = rate / 30;
    // A plucked string, 12 cents above A2: its second partial is louder than the note itself.
    const double pitch = 110.0 * std::exp2(12.0 / 1200.0);
    constexpr double partials[] = {0.1, 0.3, 0.1, 0.05, 0.03};

    kivspectrum analyser;
    analyser.set_parameters(rate);
    analyser.SetTunerOn(true);
    analyser.SetOn(true);

    std::vector<float> block(refresh);
    double seconds = 0.0;
    for (int i = 0; i < 30; ++i) {
        for (float& sample : block) {
            double sum = 0.0;
            for (int k = 0; k < 5; ++k)
                sum += partials[k] * std::sin(2.0 * std::numbers::pi * pitch * (k + 1) * seconds);
            sample = static_cast<float>(sum);
            seconds += 1.0 / rate;
        }
        analyser.Feed(block.data(), refresh, 1, 1);  // the audio thread: never waits
        analyser.Refresh();                          // the display thread, 30 times a second
    }

    const auto loudest = analyser.GetSpectrumDrawer()->HighestPeak();
    const Tuner& tuner = *analyser.GetTuner();
    std::printf("loudest: %.1f Hz at %.1f dB\n", loudest.frequency, loudest.level);
    std::printf("note: %s%d, %.2f Hz, %s\n", tuner.GetTunedNoteName(), tuner.GetOctave(),
                tuner.GetFrequency(), tuner.GetTuningErrorStr().c_str());
    return std::abs(loudest.frequency - 2.0 * pitch) < 1.0 &&
                   std::abs(loudest.level - 20 * std::log10(0.3)) < 1.0 &&
                   std::strcmp(tuner.GetTunedNoteName(), "A") == 0 &&
                   std::abs(tuner.GetErrorCents() - 12.0f) < 2.0f
               ? 0
               : 1;
}
