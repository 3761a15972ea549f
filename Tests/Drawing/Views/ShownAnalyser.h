#pragma once

#include "Spectrum/AnalyserFixture.h"

using ViewTest = AnalyserFixture;

// An analyser that heard `seconds` of a signal, refreshed 30 times a second.
class ShownAnalyser {
public:
    static constexpr int kRate = 48000;

    ShownAnalyser() {
        analyser.set_parameters(kRate);
        analyser.SetOn(true);
    }
    void Hear(double hz, double amplitude, double seconds = 0.5) {
        const auto frames = static_cast<std::size_t>(seconds * kRate);
        const auto sine = TestSupport::Sine<float>(frames, hz, kRate, amplitude);
        constexpr std::size_t kRefresh = kRate / 30;
        for (std::size_t i = 0; i + kRefresh <= frames; i += kRefresh) {
            analyser.Feed(sine.data() + i, static_cast<int>(kRefresh), 1, 1);
            analyser.Refresh();
        }
    }

    kivspectrum analyser;
};
