#pragma once

#include <gtest/gtest.h>

#include <functional>
#include <vector>

#include "Spectrum/MessagePoster.h"
#include "Spectrum/Sonogram/Sonogram.h"
#include "Spectrum/Tuner/Tuner.h"
#include "Spectrum/kivspectrum.h"
#include "Support/Signals.h"

struct HookedPoster : MessagePoster {
    void Post(int message, std::intptr_t, std::intptr_t detail) override { post(message, detail); }
    void Send(int, std::intptr_t, std::intptr_t) override {}
    std::function<void(int message, std::intptr_t detail)> post;
};

// What analysers, tuners and sonograms share starts every test at its defaults.
class AnalyserFixture : public testing::Test {
protected:
    AnalyserFixture() { Reset(); }
    ~AnalyserFixture() override { Reset(); }

    static kivspectrum::spectrum_settings& Settings() { return kivspectrum::settings; }

    static void Feed(kivspectrum& analyser, const std::vector<float>& samples) {
        analyser.Feed(samples.data(), static_cast<int>(samples.size()), 1, 1);
    }
    static bool Prepare(kivspectrum& analyser, int rate = 48000) {
        return analyser.PrepareFFTForDrawing(rate, true, false, false, false);
    }

private:
    static void Reset() {
        kivspectrum::settings = {};
        kivspectrum::GetStaticInfo().SetMessagePoster(nullptr);
        Tuner::SetDetectionMethod(0);
        Tuner::SetShowDenoisedSpectrum(false);
        Tuner::SetTunedQuantumPreset(3);
        Tuner::SetNoteNaming(0);
        Tuner::SetTemperament(0);
        TunerCalibrateReset();
        Corvo::Sonogram::SetSpeedIndex(3);
        Corvo::Sonogram::SetColourScheme(0);
    }
};
