#include <gtest/gtest.h>

#include <cstdio>
#include <string>

#include "DSP/Effects/Gain/GainEfx.h"

// Catches a typed value that shows its neighbour, because a tenth lies on the edge of what shows it.
TEST(GainEfx, ATypedTenthShowsItself) {
    Corvo::DSP::GainEfx::GainEfx gain;
    for (int tenths = -799; tenths <= 200; ++tenths) {
        char text[16];
        std::snprintf(text, sizeof text, "%.1f dB", tenths / 10.0);
        gain.SetParam(0, gain.GetParamValueNormalizedFromText(0, text), false);
        const auto shown = gain.GetParameterFormattedText(0, 0.0);
        EXPECT_EQ(std::string(shown.begin(), shown.end()), text);
    }
}
