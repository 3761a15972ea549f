#include <algorithm>
#include <array>
#include <numeric>
#include <vector>

#include "DSP/Equalizer/ParEQ.h"
#include "Spectrum/AnalyserFixture.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"

namespace {

using Values = std::vector<float>;

Values Ramp(std::size_t count) {
    Values ramp(count);
    std::iota(ramp.begin(), ramp.end(), 1.0f);
    return ramp;
}

using Capture = AnalyserFixture;

// Oldest first, however the stream is cut and however often the staging ring goes round; zeros behind the
// window where the transform is longer.
TEST_F(Capture, KeepsTheNewestSamplesInOrder) {
    const auto ramp = Ramp(100000);
    for (const int window : {128, 32768})
        for (const int block : {7, 5000, 70000}) {
            Settings() = {};
            Settings().window_length = window;
            Settings().fft_length = 2 * window;
            Settings().fft_length_auto = 0;
            kivspectrum analyser;
            for (int done = 0; done < 100000; done += block)
                analyser.Feed(ramp.data() + done, std::min(block, 100000 - done), 1, 1);
            Values expected(ramp.end() - window, ramp.end());
            expected.resize(2 * static_cast<std::size_t>(window));
            ASSERT_EQ(analyser.GetBufferInputPoints(), expected) << window << ", " << block;
        }
}

TEST_F(Capture, TakesTheMeanOfTheChannels) {
    Settings().window_length = 4;
    kivspectrum analyser;
    const double stereo[] = {1, 3, 9, -1, 1, 9, 0, 4, 9, 5, 5, 9};
    analyser.Feed(stereo, 4, 3, 2);
    analyser.Feed(stereo, -4, 3, 2);
    EXPECT_EQ(analyser.GetBufferInputPoints(), (Values{2, 0, 2, 5}));
}

TEST_F(Capture, AnnouncesEveryHop) {
    Settings().window_length = 128;
    Settings().hop_length = 50;
    kivspectrum analyser;
    analyser.SetOn(true);
    for (int fed = 20; fed <= 200; fed += 20) {
        Feed(analyser, Ramp(20));
        EXPECT_EQ(Prepare(analyser), fed == 60 || fed == 100 || fed == 160 || fed == 200) << fed;
    }
}

TEST_F(Capture, KeepsTheNewestSamplesThroughARebuild) {
    kivspectrum analyser;
    for (const int length : {8, 4}) {
        Settings().window_length = length;
        analyser.init();
        if (length == 8) Feed(analyser, Ramp(10));
    }
    EXPECT_EQ(analyser.GetBufferInputPoints(), (Values{7, 8, 9, 10}));
}

// Catches an equaliser whose spectrum stands still for as long as a knob is moved: edits come more often than
// windows end.
TEST_F(Capture, GoesOnWhileTheEqualiserIsEdited) {
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
TEST_F(Capture, AveragesAsManySpectraAsChosenAtOnce) {
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
