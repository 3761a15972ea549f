#pragma once

#include <gtest/gtest.h>

#include <cstddef>

#include "Spectrum/Sonogram/Sonogram.h"
#include "Spectrum/Tuner/Tuner.h"
#include "Spectrum/kivspectrum.h"
#include "Support/Signals.h"

// Everything that all analysers share starts every test at its defaults.
class ViewTest : public testing::Test {
protected:
    ViewTest() { Reset(); }
    ~ViewTest() override { Reset(); }

private:
    static void Reset() {
        kivspectrum::settings = {};
        Corvo::Sonogram::SetSpeedIndex(3);
        Corvo::Sonogram::SetColourScheme(0);
        Tuner::SetTemperament(0);
        Tuner::SetNoteNaming(0);
        TunerCalibrateReset();
    }
};

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
