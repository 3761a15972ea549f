#include <array>
#include <vector>

#include "DSP/Equalizer/ParEQ.h"
#include "Spectrum/AnalyserFixture.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"

namespace {

class Pacing : public AnalyserFixture {};

// Catches an equaliser whose spectrum stands still for as long as a knob is moved: edits come more often than
// windows end.
TEST_F(Pacing, GoesOnWhileTheEqualiserIsEdited) {
    constexpr int kRate = 48000, kBlock = 800, kSeconds = 10;
    const auto frames = [&](int blocksPerEdit) {
        Corvo::DSP::ParEQ eq;
        Corvo::DSP::builtin_effects_data record;
        kivspectrum& analyser = *eq.GetSpectrum(0);
        analyser.SetOn(true);
        std::vector<float> block(kBlock, 0.5f);
        int count = 0;
        for (int i = 0; i < kSeconds * kRate / kBlock; ++i) {
            if (i % blocksPerEdit == 0) eq.Cook(true, false, &record, kRate, 1);
            eq.Process(block.data(), kBlock, 1, true, &record);
            count += Prepare(analyser, kRate) ? 1 : 0;
        }
        return count;
    };
    EXPECT_EQ(frames(1 << 20), kSeconds * kRate / 4096);
    for (const int blocksPerEdit : {1, 4}) EXPECT_EQ(frames(blocksPerEdit), frames(1 << 20)) << blocksPerEdit;
}

// Catches a moving average that keeps its length, in any analyser. The weights of three spectra are used up
// by the third, those of five are not.
TEST_F(Pacing, AveragesAsManySpectraAsChosenAtOnce) {
    Settings().smoothing_type = 1;
    std::array<kivspectrum, 2> analysers;
    kivspectrum::lock_init = true;
    EXPECT_TRUE(analysers[0].popupmenu_process(1398));
    for (kivspectrum& analyser : analysers) {
        analyser.SetOn(true);
        for (int spectrum = 0; spectrum < 3; ++spectrum) {
            Feed(analyser, std::vector<float>(4096, 1.0f));
            EXPECT_TRUE(Prepare(analyser));
        }
        const float power = analyser.GetPower()[0];
        EXPECT_NEAR(analyser.GetSpectrumDrawer()->GetPowerSmoothed()[0], power, 1e-6f * power);
    }
    kivspectrum::lock_init = false;
}

}  // namespace
