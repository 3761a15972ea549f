#include <atomic>
#include <chrono>
#include <thread>
#include <vector>

#include "Drawing/Views/Views.h"
#include "Spectrum/AnalyserFixture.h"
#include "Support/NoDrawing.h"

namespace {

class AnalyserThreads : public AnalyserTest {};

// One thread feeds two analysers, one prepares and draws their frames, two choose from their menus. Caught by
// the thread sanitizer: a race; by the test never ending: locks taken in two orders.
TEST_F(AnalyserThreads, FeedPrepareAndChooseAtOnce) {
    kivspectrum first, second;
    first.SetOn(true);
    second.SetOn(true);
    std::atomic<bool> stop{false};
    std::atomic<int> frames{0};
    const auto audio = [&] {
        const auto noise = TestSupport::Noise<float>(2 * 256);
        while (!stop) {
            first.Feed(noise.data(), 256, 2, 2);
            second.Feed(noise.data(), 256, 2, 1);
        }
    };
    const auto display = [&] {
        const std::vector<float>* spectrum = nullptr;
        TestSupport::NoDrawing::DrawTarget target;
        while (!stop) {
            frames += first.PrepareFFTForDrawingHelper(false, false);
            first.AdvanceSonogram();
            frames += second.GetFFTFor3DSonogram(48000, &spectrum, true, false);
            for (kivspectrum* const analyser : {&first, &second})
                analyser->DoDraw<TestSupport::NoDrawing>(target, {0.0f, 0.0f, 160.0f, 120.0f});
        }
    };
    // The longest lengths only take time.
    const auto menu = [&](kivspectrum& mine, kivspectrum& other, int step) {
        for (int command = 1200; !stop; command = 1200 + (command - 1200 + step) % 203) {
            if ((command >= 1209 && command <= 1213) || (command >= 1228 && command <= 1232)) continue;
            mine.popupmenu_process(command);
            if (command == 1258) {
                other.SetOn(true);
                mine.SetOn(true);
            }
            if (command == 1300) other.ToggleTuner();
            mine.ShowSonogram(true);
            Corvo::Sonogram::SetSpeedIndex(command % 9);
            Corvo::Sonogram::SetColourScheme(command % 7);
        }
    };
    std::vector<std::thread> threads;
    threads.emplace_back(audio);
    threads.emplace_back(display);
    threads.emplace_back([&] { menu(first, second, 1); });
    threads.emplace_back([&] { menu(second, first, 5); });
    std::this_thread::sleep_for(std::chrono::milliseconds(1000));
    stop = true;
    for (auto& thread : threads) thread.join();
    EXPECT_GT(frames, 0);
}

}  // namespace
