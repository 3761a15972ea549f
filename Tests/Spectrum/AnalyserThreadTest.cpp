#include <chrono>

#include "Drawing/Views/Views.h"
#include "Spectrum/AnalyserFixture.h"
#include "Support/NoDrawing.h"
#include "Support/TwoThreads.h"

namespace {

using TestSupport::WhileAnotherThread;
class AnalyserThreads : public AnalyserFixture {};

// One thread feeds two analysers, one prepares and draws their frames, two choose from their menus. Caught by
// the thread sanitizer: a race; by the test never ending: locks taken in two orders.
TEST_F(AnalyserThreads, FeedPrepareAndChooseAtOnce) {
    kivspectrum first, second;
    first.SetOn(true);
    second.SetOn(true);
    const auto noise = TestSupport::Noise<float>(2 * 256);
    const auto feed = [&](int) {
        first.Feed(noise.data(), 256, 2, 2);
        second.Feed(noise.data(), 256, 2, 1);
    };
    const auto choose = [](kivspectrum& mine, kivspectrum& other, int number) {
        const int command = 1200 + number % 203;
        // The longest lengths only take time.
        if ((command >= 1209 && command <= 1213) || (command >= 1228 && command <= 1232)) return;
        mine.popupmenu_process(command);
        mine.SetOn(true);
        if (command == 1300) other.ToggleTuner();
        mine.ShowSonogram(true);
        mine.SetFrequencySpan({1.0 * number, 2000.0});
        mine.ShowTuner(number % 2 == 0);
        Corvo::Sonogram::SetSpeedIndex(command % 9);
        Corvo::Sonogram::SetColourScheme(command % 7);
    };
    int frames = 0;
    const auto display = [&] {
        TestSupport::NoDrawing::DrawTarget target;
        const auto end = std::chrono::steady_clock::now() + std::chrono::milliseconds(500);
        while (std::chrono::steady_clock::now() < end) {
            frames += first.PrepareFFTForDrawingHelper(false, false);
            first.AdvanceSonogram();
            frames += second.GetFFTFor3DSonogram(48000, nullptr, true, false);
            for (kivspectrum* const analyser : {&first, &second})
                analyser->DoDraw<TestSupport::NoDrawing>(target, {0.0f, 0.0f, 160.0f, 120.0f});
            first.SetMarker(first.GetReading(80.0f, 60.0f));
        }
    };
    WhileAnotherThread(feed, [&] {
        WhileAnotherThread(
            [&](int round) { choose(first, second, round); },
            [&] { WhileAnotherThread([&](int round) { choose(second, first, 5 * round); }, display); });
    });
    EXPECT_GT(frames, 0);
}

}  // namespace
