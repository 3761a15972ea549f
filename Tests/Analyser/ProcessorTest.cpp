#include "Processor.h"

#include <chrono>
#include <cstring>
#include <thread>
#include <vector>

#include "Analyser/ViewFixture.h"
#include "Spectrum/Tuner/Tuner.h"
#include "Support/Signals.h"
#include "Support/TwoThreads.h"

namespace {

using namespace analyser;
using Hold = Processor::Hold;

class ProcessorTest : public ViewTest {
protected:
    static constexpr double kRate = 48000.0;
    void Process(const std::vector<float>& left, const std::vector<float>& right) {
        const float* const inputs[2] = {left.data(), right.data()};
        float* const outputs[2] = {m_left.data(), m_right.data()};
        m_processor.Process(inputs, outputs, 2, static_cast<int>(left.size()), m_bypassed);
    }
    Processor m_processor;
    bool m_bypassed = false;
    std::vector<float> m_left = std::vector<float>(1600), m_right = m_left;
};

// Catches a bit that changes on the way, and a tone that sounds by itself or stays when the window has gone.
TEST_F(ProcessorTest, PassesTheSoundThroughUnlessToneIsAskedFor) {
    auto left = TestSupport::Noise<float>(1000), right = TestSupport::Noise<float>(1000);
    right[9] = -0.0f;
    const int windows[2] = {};
    const auto same = [&] {
        Process(left, right);
        return std::memcmp(left.data(), m_left.data(), 4000) == 0 &&
               std::memcmp(right.data(), m_right.data(), 4000) == 0;
    };
    std::string copied;
    for (const int* window = windows; window != windows + 2; ++window)
        m_processor.AddWindow(window, [&copied](const std::string& text) {
            copied = text;
            return true;
        });
    m_processor.RemoveWindow(windows + 1);
    Hold(m_processor)->Do(kCopyReading);
    EXPECT_FALSE(copied.empty()) << "the other window is still there";
    EXPECT_TRUE(same());
    Hold(m_processor)->Do(kTone);
    EXPECT_FALSE(same());
    for (const bool bypassed : {true, false}) {
        m_bypassed = bypassed;
        if (!bypassed) m_processor.RemoveWindow(windows);
        for (int i = 0; i < 3; ++i) same();  // fades out
        EXPECT_TRUE(same());
    }
}

// Catches outputs that need a window, and a note that is another's.
TEST_F(ProcessorTest, PublishesTheNoteWithoutAWindow) {
    m_processor.SetRate(kRate);
    const auto sine = TestSupport::Sine<float>(1600, 330.0, static_cast<int>(kRate), 0.25);
    const Tuner& tuner = m_processor.GetTuner();
    for (int i = 0; i < 150 && !tuner.IsTuned(); ++i) {
        Process(sine, sine);
        std::this_thread::sleep_for(std::chrono::milliseconds(20));
    }
    EXPECT_EQ(tuner.GetTunedNote(), (TunedNote{7, 4}));  // E4
    EXPECT_NEAR(tuner.GetFrequency(), 330.0, 1.0);
    EXPECT_NEAR(m_processor.GetLevel(), -12.0, 1.0);
}

// One thread feeds, one draws, one chooses and points, and the processor's own refreshes. Caught by the
// sanitizers and by the test never ending.
TEST_F(ProcessorTest, FeedsDrawsAndChoosesAtOnce) {
    const auto noise = TestSupport::Noise<float>(512);
    AnalyserTest::Canvas canvas;
    int drawn = 0;
    const auto choose = [&](int round) {
        const int command = 1200 + round % 203;
        // The longest lengths only take time.
        if (!((command >= 1209 && command <= 1213) || (command >= 1228 && command <= 1232)))
            Hold(m_processor)->Do(command);
        Hold(m_processor)->Do(kShowSpectrum + round % 5);
        Hold(m_processor)->Wheel(static_cast<float>(round % 960), 300.0f, 1.0f, round % 7 == 0);
        Hold(m_processor)->PointTo(static_cast<float>(round % 960), 400.0f);
    };
    const auto feed = [&](int) { Process(noise, noise); };
    const auto draw = [&] {
        const auto end = std::chrono::steady_clock::now() + std::chrono::milliseconds(500);
        for (; std::chrono::steady_clock::now() < end; ++drawn) {
            Hold hold(m_processor);
            canvas.Draw(*hold.operator->());
        }
    };
    TestSupport::WhileAnotherThread(feed, [&] { TestSupport::WhileAnotherThread(choose, draw); });
    EXPECT_GT(drawn, 0);
}

}  // namespace
