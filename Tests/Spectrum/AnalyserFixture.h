#pragma once

#include <gtest/gtest.h>

#include <vector>

#include "Spectrum/kivspectrum.h"
#include "Support/Signals.h"

// Class-wide settings start every test at their defaults.
class AnalyserTest : public testing::Test {
protected:
    AnalyserTest() { kivspectrum::settings = {}; }
    ~AnalyserTest() override { kivspectrum::settings = {}; }

    static kivspectrum::spectrum_settings& Settings() { return kivspectrum::settings; }

    static void Feed(kivspectrum& analyser, const std::vector<float>& samples) {
        analyser.Feed(samples.data(), static_cast<int>(samples.size()), 1, 1);
    }
    static bool Prepare(kivspectrum& analyser, int rate = 48000) {
        return analyser.PrepareFFTForDrawing(rate, true, false, false, false);
    }
};
