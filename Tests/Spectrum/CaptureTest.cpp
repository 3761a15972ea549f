#include <algorithm>
#include <numeric>
#include <string>
#include <vector>

#include "Spectrum/AnalyserFixture.h"
#include "Support/AudioThreadRules.h"

namespace {

using Values = std::vector<float>;

class Capture : public AnalyserTest {
protected:
    static Values Ramp(std::size_t count) {
        Values ramp(count);
        std::iota(ramp.begin(), ramp.end(), 1.0f);
        return ramp;
    }
};

// Oldest first, however the stream is cut and however often the staging ring goes round; zeros behind the
// window where the transform is longer.
TEST_F(Capture, KeepsTheNewestSamplesInOrder) {
    for (const int window : {128, 4096, 32768})
        for (const int block : {1, 100, 5000, 70000}) {
            Settings() = {};
            Settings().window_length = window;
            Settings().fft_length = 2 * window;
            Settings().fft_length_auto = 0;
            kivspectrum analyser;
            const auto ramp = Ramp(100000);
            const int rest = block == 1 ? 99000 : 0;  // one at a time takes its time
            analyser.Feed(ramp.data(), rest, 1, 1);
            for (int done = rest; done < 100000; done += block)
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
    analyser.Feed(stereo, 0, 3, 2);
    analyser.Feed(stereo, 4, 3, 0);
    analyser.Feed(stereo, -4, 3, 2);
    analyser.Feed(static_cast<const float*>(nullptr), 4, 3, 2);
    EXPECT_EQ(analyser.GetBufferInputPoints(), (Values{2, 0, 2, 5}));
    EXPECT_EQ(analyser.GetBufferInputChannels(), 1);
    analyser.Feed(stereo, 2, 0, 1);
    EXPECT_EQ(analyser.GetBufferInputPoints(), (Values{2, 5, 1, 3}));
}

TEST_F(Capture, AnnouncesEveryHop) {
    Settings().window_length = 128;
    Settings().hop_length = 50;
    kivspectrum analyser;
    analyser.SetOn(true);
    std::vector<int> frames;
    for (int fed = 10; fed <= 200; fed += 10) {
        Feed(analyser, Ramp(10));
        if (Prepare(analyser)) frames.push_back(fed);
    }
    EXPECT_EQ(frames, (std::vector<int>{50, 100, 150, 200}));
    analyser.init();  // the count starts afresh
    Feed(analyser, Ramp(49));
    EXPECT_FALSE(Prepare(analyser));
}

TEST_F(Capture, KeepsTheNewestSamplesThroughARebuild) {
    Settings().window_length = 8;
    kivspectrum analyser;
    Feed(analyser, Ramp(10));
    Settings().window_length = 4;
    analyser.init();
    EXPECT_EQ(analyser.GetBufferInputPoints(), (Values{7, 8, 9, 10}));
    Settings().window_length = 8;
    analyser.init();
    EXPECT_EQ(analyser.GetBufferInputPoints(), (Values{0, 0, 0, 0, 7, 8, 9, 10}));
}

TEST_F(Capture, NeitherAllocatesNorWaits) {
    if (!TestSupport::AudioThreadRules::CanCount()) GTEST_SKIP();
    kivspectrum analyser;
    analyser.SetOn(true);
    const auto block = Ramp(512);
    Feed(analyser, Ramp(8192));
    Prepare(analyser);
    const TestSupport::AudioThreadRules rules;
    for (int i = 0; i < 100; ++i) analyser.Feed(block.data(), 512, 1, 1);
    EXPECT_EQ(rules.Broken(), "");
    Prepare(analyser);
    EXPECT_EQ(rules.Broken().find("alloc"), std::string::npos) << rules.Broken();
}

}  // namespace
